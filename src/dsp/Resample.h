// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "filtertable.h"

#include "streams/levels.h"

#include <QObject>
#include <QString>

#include <atomic>
#include <functional>
#include <memory>
#include <optional>
#include <span>

class BufferedIO;
class Interpolator;
class TapGeometry;

/// Levels of the two results of a polar split.
struct PolarLevels
{
    LevelSums phase;
    LevelSums amplitude;
};

/// The stream processor of the tools: passes over whole data streams ("IQF" and float I/Q records).
///
/// `run` converts a waveform to any other number of samples with a filter of choice; equal numbers
/// make it a FIR filter. The waveform is taken as a loop. The other passes scale, shift, split and
/// measure a stream.
///
/// An object serves one thread at a time and works on the calling one, which lets its event loop
/// run every 100 ms; the sums of `run` are spread over the processors. Streams belong to the caller
/// and must outlive the call. A pass that fails has logged the reason at error level and leaves its
/// output as far as it got, to be thrown away.
class Resample : public QObject
{
    Q_OBJECT

public:
    explicit Resample(QObject *parent = nullptr);

    /// Sets the whole filter. False, without a change, if its window isn't 0 to 6.
    [[nodiscard]] bool configure(const FilterSettings &settings);

    /// The sample rate of the input and the filter's edge, in the same unit. A Gauss filter takes
    /// no edge. The gain isn't corrected: an edge below half the rate raises the level.
    void setFilterFrequency(double rate, double cutoff);

    /// Length in input samples; `run` takes MinFilterLength to MaxFilterLength. The waveform is
    /// joined to its other end over at most 200 samples, so that longer filters see zeros there.
    void setFilterLength(int length);

    /// False, without a change, if the kind isn't one of FilterKind.
    [[nodiscard]] bool setFilterType(int kind, double parameter);

    /// False, without a change, if the kind isn't 0 to 6.
    [[nodiscard]] bool setWindowType(int kind);

    /// Streams of `run` with their numbers of samples, of which the low 32 bits are used.
    void setInput(BufferedIO *stream, qint64 samples);
    void setOutput(BufferedIO *stream, qint64 samples);

    /// Marker streams of `run`; markers are converted only if both are set. Each output sample gets
    /// the markers of the input sample at or before its position.
    void setMarkers(BufferedIO *input, BufferedIO *output);

    /// Converts input to output. With an even filter length the output leads the input by one input
    /// sample. Reductions by more than the filter's reach fail.
    [[nodiscard]] bool run();

    /// Level offsets of the last successful run's output in dB: 20 log10(1 / level).
    [[nodiscard]] double peakOffset() const { return m_peakOffset; }
    [[nodiscard]] double rmsOffset() const { return m_rmsOffset; }

    /// Multiplies the first `samples` samples by the factor, in place, in single precision. What
    /// was written has reached the device after the next restart of the stream.
    [[nodiscard]] bool rescale(int samples, double factor, BufferedIO *stream);

    /// Turns the first `samples` samples by `frequency` against `clock` (both in Hz), in place.
    /// Vectors on the imaginary axis are taken as lying on the positive real one, see
    /// cartesianToPolar. The stream is at its start afterwards.
    [[nodiscard]] bool frequencyShift(int samples, double frequency, double clock,
                                      BufferedIO *stream);

    /// Splits the first `samples` samples into the conjugate of their unit vectors and their
    /// magnitudes: I = (2 magnitude - 1) gain + offset, Q = 0. The levels of both results are added
    /// to `levels`, if that isn't null.
    [[nodiscard]] bool polarSplit(int samples, BufferedIO *source, BufferedIO *phase,
                                  BufferedIO *amplitude, double offset, double gain,
                                  PolarLevels *levels = nullptr);

    /// Measures the linear peak and RMS of the vectors of the first `samples` samples. Both
    /// outputs are set on success only.
    [[nodiscard]] bool statistics(int samples, BufferedIO *stream, double *peak, double *rms);

public slots:
    /// Makes the running pass fail within 100 ms. Each pass starts with the wish cleared. May be
    /// called from any thread.
    void cancel();

signals:
    /// Progress of the running pass, not more often than every 100 ms.
    void ProgressUpdate(int iPercentage);

private:
    class Conversion;
    using BlockWork = std::function<void(std::span<float>)>;

    /// Runs the work over the first `samples` samples, block by block, and writes them back.
    [[nodiscard]] bool transformInPlace(int samples, BufferedIO *stream, const BlockWork &work);

    FilterSettings m_settings;
    BufferedIO *m_input = nullptr;
    BufferedIO *m_output = nullptr;
    qint64 m_inputSamples = 0;
    qint64 m_outputSamples = 0;
    BufferedIO *m_markerInput = nullptr;
    BufferedIO *m_markerOutput = nullptr;
    double m_peakOffset = 0; ///< dB
    double m_rmsOffset = 0;  ///< dB
    FilterTable m_table;
    std::optional<FilterSettings> m_tableSettings; ///< what the table was built for
    std::atomic<bool> m_cancelled = false;
};
