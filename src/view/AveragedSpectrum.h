// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "IqSample.h"

#include <complex>
#include <span>
#include <vector>

/// The power spectrum of a stretch of any length by Welch's method: windowed frames that overlap by
/// a half, the last one at the end of the stretch, of which the mean and the maximum are kept.
class AveragedSpectrum
{
public:
    static constexpr int SmallestLength = 64;
    static constexpr int LargestLength = 65536;

    /// `total` samples will be appended. `length` is a power of two, or the largest one that fits
    /// `total` if that is less; `windowKind` is one of dsp/windows.h.
    AveragedSpectrum(qint64 total, int length, int windowKind);

    /// Takes the next samples of the stretch. The result doesn't depend on how they are cut.
    void append(std::span<const IqSample> samples);

    /// Points of the spectrum; 0 without samples.
    [[nodiscard]] int length() const { return m_length; }

    /// Mean and greatest power of the frames, zero frequency at index length() / 2. A tone of full
    /// scale has power 1.
    [[nodiscard]] std::vector<double> mean() const;
    [[nodiscard]] const std::vector<double> &maximum() const { return m_maximum; }

    /// The frames behind the result.
    [[nodiscard]] qint64 frames() const { return m_frames; }

    /// Equivalent noise bandwidth of the window in points, which is the resolution bandwidth when
    /// it is multiplied by clock / length().
    [[nodiscard]] double noiseBandwidth() const { return m_noiseBandwidth; }

private:
    void transform(std::span<const std::size_t> starts);

    qint64 m_total;
    int m_length = 0;
    std::vector<double> m_window;
    double m_scale = 1; ///< of a bin's power
    double m_noiseBandwidth = 1;
    qint64 m_taken = 0;        ///< samples appended
    qint64 m_next = 0;         ///< start of the next frame
    qint64 m_pendingFirst = 0; ///< position of the first pending sample
    std::vector<IqSample> m_pending;
    std::vector<double> m_sum;
    std::vector<double> m_maximum;
    std::vector<std::vector<double>> m_powers; ///< of the frames of one batch
    qint64 m_frames = 0;
};
