// SPDX-License-Identifier: Apache-2.0
#include "Overview.h"

#include "base/OutputFile.h"

#include <QCryptographicHash>
#include <QDateTime>
#include <QDir>
#include <QFile>
#include <QFileInfo>
#include <QStandardPaths>

#include <algorithm>
#include <array>
#include <cmath>
#include <cstring>
#include <utility>

namespace {

constexpr char Signature[] = "corvane-overview-1";
constexpr int MostKept = 500; ///< files in the cache folder

QString cacheFolder()
{
    return QStandardPaths::writableLocation(QStandardPaths::GenericCacheLocation) +
           "/corvane/overview";
}

/// The name in the cache, which changes with the file.
QString cacheName(const QString &fileName)
{
    const QFileInfo info(fileName);
    const QString key = QString("%1|%2|%3")
                            .arg(info.canonicalFilePath())
                            .arg(info.size())
                            .arg(info.lastModified().toMSecsSinceEpoch());
    return cacheFolder() + '/' +
           QCryptographicHash::hash(key.toUtf8(), QCryptographicHash::Sha1).toHex();
}

void dropOldest()
{
    const QFileInfoList files = QDir(cacheFolder()).entryInfoList(QDir::Files, QDir::Time);
    for (qsizetype k = MostKept; k < files.size(); ++k) {
        QFile::remove(files.at(k).filePath());
    }
}

/// The least and the greatest square of a magnitude, of at least one sample.
std::pair<float, float> squareRange(std::span<const float> iq)
{
    constexpr std::size_t Lanes = 8; // independent of each other, so that the loop is vectorised
    const auto square = [iq](std::size_t k) {
        return iq[2 * k] * iq[2 * k] + iq[2 * k + 1] * iq[2 * k + 1];
    };
    std::array<float, Lanes> low{};
    std::array<float, Lanes> high{};
    low.fill(square(0));
    high.fill(square(0));
    const std::size_t count = iq.size() / 2;
    std::size_t k = 0;
    for (; k + Lanes <= count; k += Lanes) {
        for (std::size_t lane = 0; lane < Lanes; ++lane) {
            const float value = square(k + lane);
            low[lane] = value < low[lane] ? value : low[lane];
            high[lane] = value > high[lane] ? value : high[lane];
        }
    }
    for (; k < count; ++k) {
        low[0] = std::min(low[0], square(k));
        high[0] = std::max(high[0], square(k));
    }
    return {*std::ranges::min_element(low), *std::ranges::max_element(high)};
}

} // namespace

Overview::Overview(qint64 samples)
    : m_samples(samples)
    , m_bins(static_cast<std::size_t>(std::clamp<qint64>(samples, 0, MostBins)))
{
}

/// The first sample behind a column.
qint64 Overview::endOf(int bin) const
{
    const qint64 count = std::ssize(m_bins);
    return ((bin + 1) * m_samples + count - 1) / count;
}

void Overview::append(std::span<const float> iq, std::span<const quint8> markers)
{
    const auto given = static_cast<qint64>(iq.size() / 2);
    qint64 done = 0;
    while (done < given && m_taken < m_samples) {
        while (m_taken >= endOf(m_bin)) {
            ++m_bin;
        }
        const auto from = static_cast<std::size_t>(done);
        const auto count = static_cast<std::size_t>(std::min(given - done, endOf(m_bin) - m_taken));
        const auto [lowest, highest] = squareRange(iq.subspan(2 * from, 2 * count));
        quint8 marksHigh = 0;
        quint8 marksLow = 0;
        for (std::size_t k = from; k < std::min(from + count, markers.size()); ++k) {
            marksHigh |= markers[k];
            marksLow |= static_cast<quint8>(~markers[k]);
        }
        OverviewBin &bin = m_bins[static_cast<std::size_t>(m_bin)];
        const qint64 start = m_bin == 0 ? 0 : endOf(m_bin - 1);
        const float low = std::sqrt(lowest);
        const float high = std::sqrt(highest);
        bin.low = m_taken == start ? low : std::min(bin.low, low);
        bin.high = m_taken == start ? high : std::max(bin.high, high);
        constexpr quint8 Bits = 15;
        bin.markersHigh |= marksHigh & Bits;
        bin.markersLow |= marksLow & Bits;
        done += static_cast<qint64>(count);
        m_taken += static_cast<qint64>(count);
    }
}

quint8 Overview::markersSeen() const
{
    quint8 seen = 0;
    for (const OverviewBin &bin : m_bins) {
        seen |= bin.markersHigh;
    }
    return seen;
}

bool Overview::save(const QString &fileName) const
{
    if (!isComplete() || !QDir().mkpath(cacheFolder())) {
        return false;
    }
    dropOldest();
    QByteArray bytes(Signature);
    const qint64 counts[2] = {m_samples, std::ssize(m_bins)};
    bytes.append(reinterpret_cast<const char *>(counts), sizeof counts);
    for (const OverviewBin &bin : m_bins) {
        bytes.append(reinterpret_cast<const char *>(&bin.low), sizeof bin.low);
        bytes.append(reinterpret_cast<const char *>(&bin.high), sizeof bin.high);
        bytes.append(static_cast<char>(bin.markersHigh)).append(static_cast<char>(bin.markersLow));
    }
    OutputFile file(cacheName(fileName));
    return file.open() && file.write(bytes) && file.commit();
}

Overview Overview::kept(const QString &fileName, qint64 samples)
{
    QFile file(cacheName(fileName));
    Overview overview(samples);
    constexpr qint64 BinBytes = 2 * sizeof(float) + 2;
    constexpr qint64 HeadBytes = qint64{sizeof Signature} - 1 + 2 * qint64{sizeof(qint64)};
    const qint64 bins = std::ssize(overview.m_bins);
    if (samples < 1 || !file.open(QIODevice::ReadOnly) ||
        file.size() != HeadBytes + bins * BinBytes) {
        return Overview(samples);
    }
    const QByteArray bytes = file.readAll();
    const qint64 counts[2] = {samples, bins};
    const char *place = bytes.constData();
    if (bytes.size() != HeadBytes + bins * BinBytes ||
        std::memcmp(place, Signature, sizeof Signature - 1) != 0 ||
        std::memcmp(place + sizeof Signature - 1, counts, sizeof counts) != 0) {
        return overview;
    }
    place += HeadBytes;
    for (OverviewBin &bin : overview.m_bins) {
        std::memcpy(&bin.low, place, sizeof bin.low);
        std::memcpy(&bin.high, place + sizeof bin.low, sizeof bin.high);
        bin.markersHigh = static_cast<quint8>(place[8]);
        bin.markersLow = static_cast<quint8>(place[9]);
        place += BinBytes;
    }
    overview.m_taken = samples;
    return overview;
}
