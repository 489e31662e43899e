// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "IqSample.h"

#include <array>
#include <span>

/// What one column of the trace display knows of its samples.
struct TraceBin
{
    double iMin = 0;
    double iMax = 0;
    double qMin = 0;
    double qMax = 0;
    double magMin = 0; ///< magnitudes sqrt(I*I + Q*Q)
    double magMax = 0;
    double magAvg = 0;
    double phaseLow = 0; ///< the phase of least absolute value, rad
    double phaseHigh = 0;
    double freqMin = 0; ///< phase steps between neighbouring samples, rad
    double freqMax = 0;
    int count = 0;      ///< samples folded in; all else means nothing while it is 0
    quint8 mkrHigh = 0; ///< a bit is set where the marker was high at least once
    quint8 mkrLow = 0;  ///< a bit is set where the marker was low at least once
};

/// The fixed table of columns into which a stretch of samples is folded, so that drawing costs the
/// same for any number of samples. Sample i of n goes to bin i * 512 / n.
///
/// Samples on the imaginary axis have the phase of plus or minus a full circle (6.283185308), not a
/// quarter: established behaviour of this display, which puts them off the pane.
class TraceBins
{
public:
    static constexpr int BinCount = 512;
    static constexpr int MinSamples = 4;    ///< fewer leave the table as it was
    static constexpr int SparseLimit = 250; ///< fewer samples are drawn as single dots too

    /// Folds the samples in. `markers` may be shorter or empty; its four low bits count.
    void compute(std::span<const IqSample> samples, std::span<const quint8> markers);

    /// The same in pieces, for stretches that aren't in memory as a whole: begin with the total
    /// number of samples, then append them in order. Below 4 samples both leave the table alone.
    void begin(qint64 total);
    void append(std::span<const IqSample> samples, std::span<const quint8> markers);

    void clear();

    [[nodiscard]] const std::array<TraceBin, BinCount> &bins() const { return m_bins; }

    /// Whether the last computed stretch was short enough for single dots.
    [[nodiscard]] bool isSparse() const { return m_sparse; }

private:
    std::array<TraceBin, BinCount> m_bins{};
    bool m_sparse = false;
    // Where append goes on.
    qint64 m_total = 0;
    qint64 m_done = 0;
    int m_bin = 0;
    double m_sum = 0;       ///< of the magnitudes in the bin
    double m_lastPhase = 0; ///< folded phase of the sample before
};
