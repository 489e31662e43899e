// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <QString>
#include <QtGlobal>

#include <span>
#include <vector>

/// One column of an overview.
struct OverviewBin
{
    float low = 0; ///< magnitudes
    float high = 0;
    quint8 markersHigh = 0; ///< a bit is set where the marker was high at least once
    quint8 markersLow = 0;  ///< a bit is set where the marker was low at least once
};

/// The envelope and the markers of a whole waveform in 2048 columns at most, made in one pass.
class Overview
{
public:
    static constexpr int MostBins = 2048;

    Overview() = default;

    /// For a waveform of so many samples, none of them taken yet.
    explicit Overview(qint64 samples);

    /// Takes the next samples, interleaved I and Q, and their marker bytes.
    void append(std::span<const float> iq, std::span<const quint8> markers);

    [[nodiscard]] qint64 samples() const { return m_samples; }
    /// Samples taken so far.
    [[nodiscard]] qint64 taken() const { return m_taken; }
    [[nodiscard]] bool isComplete() const { return m_samples > 0 && m_taken == m_samples; }
    /// Columns; those of samples not taken yet are empty.
    [[nodiscard]] const std::vector<OverviewBin> &bins() const { return m_bins; }
    /// Whether any marker was high.
    [[nodiscard]] quint8 markersSeen() const;

    /// Keeps a complete overview of a file in the cache folder, under its path, size and date.
    /// False if that can't be written, which nobody needs to be told of.
    bool save(const QString &fileName) const;

    /// The overview kept of a file as it stands now with that many samples; incomplete if there is
    /// none.
    [[nodiscard]] static Overview kept(const QString &fileName, qint64 samples);

private:
    [[nodiscard]] qint64 endOf(int bin) const;

    qint64 m_samples = 0;
    qint64 m_taken = 0;
    int m_bin = 0;
    std::vector<OverviewBin> m_bins;
};
