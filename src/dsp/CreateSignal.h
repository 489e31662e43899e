// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "signalfit.h"
#include "signalsettings.h"

#include <QObject>

#include <atomic>
#include <memory>
#include <optional>

class BufferedIO;
class Resample;
class SignalGenerator;

/// The signal generator: fits a sample count and a clock to a signal's settings and writes its
/// samples into a data stream.
///
/// Order of calls: setSignalType, setMinClock, setMaxClock; one configure operation; setOutput;
/// generate; statistics. All work runs on the calling thread, with its event loop served every
/// 100 ms. Failures log their reason; a failed run leaves the stream as far as it got.
class CreateSignal : public QObject
{
    Q_OBJECT

public:
    explicit CreateSignal(QObject *parent = nullptr);
    ~CreateSignal() override;

    /// Range of the ARB clock in Hz, for the configure operations that follow.
    void setMinClock(double clock) { m_limits.minClock = clock; }
    void setMaxClock(double clock) { m_limits.maxClock = clock; }

    /// The type that generate makes; forgets the configuration.
    void setSignalType(SignalType type);

    /// The stream to write to, not owned; null leaves the old one in place.
    void setOutput(BufferedIO *stream);

    /// Random values start from this seed in every run; without one the time of day seeds them.
    void setSeed(std::optional<unsigned> seed) { m_seed = seed; }

    /// Each takes the settings and fits clock and samples. False if they don't fit.
    [[nodiscard]] bool configureFunction(const FunctionSettings &settings);
    [[nodiscard]] bool configureMultiCarrier(const MultiCarrierSettings &settings);
    [[nodiscard]] bool configurePulse(const PulseSettings &settings);
    [[nodiscard]] bool configureChirp(const ChirpSettings &settings);
    [[nodiscard]] bool configureFm(const FmSettings &settings);
    [[nodiscard]] bool configureAm(const AmSettings &settings);
    [[nodiscard]] bool configurePm(const PmSettings &settings);
    [[nodiscard]] bool configureSweep(const SweepSettings &settings);
    [[nodiscard]] bool configureNoise(const NoiseSettings &settings);

    /// Samples of one period; 0 unless configured. The stream of a periodic signal below 512
    /// samples holds it several times.
    [[nodiscard]] int sampleCount() const { return m_configured ? m_fit.samples : 0; }

    /// ARB clock in Hz; 0 unless configured.
    [[nodiscard]] double clockRate() const { return m_configured ? m_fit.clock : 0.0; }

    /// Writes the header and all samples.
    [[nodiscard]] bool generate();

    /// Samples in the stream and their linear RMS and peak vector. False, with the outputs
    /// untouched, if one of them is null or the last run failed.
    [[nodiscard]] bool statistics(int *samplesWritten, double *rms, double *peak) const;

public slots:
    /// Makes the running generate fail within 100 ms. May be called from any thread.
    void cancel();

signals:
    /// Progress of generate, not more often than every 100 ms.
    void ProgressUpdate(int iPercentage);

private:
    class Writer;

    [[nodiscard]] bool accept(const std::optional<SignalFit> &fit);
    [[nodiscard]] std::unique_ptr<SignalGenerator> makeGenerator() const;
    [[nodiscard]] bool isPeriodic() const;
    [[nodiscard]] bool writeSignal(SignalGenerator &generator);
    [[nodiscard]] bool limitBand();

    ClockLimits m_limits;
    SignalType m_type = SignalType::Function;
    bool m_configured = false;
    bool m_generated = false;
    BufferedIO *m_output = nullptr;
    std::optional<unsigned> m_seed;
    double m_peak = 0; ///< square of the peak during a run, then linear
    double m_rms = 0;  ///< sum of squares during a run, then linear
    int m_samplesWritten = 0;
    SignalFit m_fit;
    FunctionSettings m_function;
    MultiCarrierSettings m_multiCarrier;
    PulseRecord m_pulse;
    FmSettings m_fm;
    AmSettings m_am;
    PmSettings m_pm;
    SweepSettings m_sweep;
    NoiseSettings m_noise;
    std::atomic<bool> m_cancelled = false;
    const std::unique_ptr<Resample> m_bandLimit; ///< filter of the noise
};
