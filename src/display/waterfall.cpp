// SPDX-License-Identifier: Apache-2.0
#include "waterfall.h"

#include <algorithm>
#include <array>
#include <cmath>
#include <cstddef>

namespace {

constexpr int Bins = SpectrumLines::FrameSize;

using RowColors = std::array<QRgb, Bins>;

RowColors colorsOf(const std::vector<double> &a, const std::vector<double> &b, double shareOfB,
                   const ColorTable &colors, const LevelRange &range)
{
    RowColors row;
    for (std::size_t bin = 0; bin < row.size(); ++bin) {
        const double level = b[bin] * shareOfB + a[bin] * (1 - shareOfB);
        constexpr double Lowest = 1 - ColorTable::EntryCount;
        const double scaled = range.scaled(level);
        // Written so that a level that is no number counts as the lowest.
        row[bin] =
            colors.entry(static_cast<int>(scaled > Lowest ? std::max(-scaled, 0.0) : -Lowest));
    }
    return row;
}

double waterfallPlace(int row, int rows, std::size_t lineCount)
{
    return static_cast<double>(row) / rows * static_cast<double>(lineCount);
}

} // namespace

std::size_t waterfallLine(int row, int rows, std::size_t lineCount)
{
    return std::min(static_cast<std::size_t>(waterfallPlace(row, rows, lineCount)), lineCount - 1);
}

QImage waterfallImage(const std::vector<SpectrumLines::Line> &lines, const ColorTable &colors,
                      const QSize &size, const LevelRange &range)
{
    if (size.isEmpty()) {
        return {};
    }
    QImage image(size, QImage::Format_RGB32);
    image.fill(colors.background());
    if (lines.empty()) {
        return image;
    }
    std::vector<std::size_t> binOfColumn(static_cast<std::size_t>(size.width()));
    for (std::size_t column = 0; column < binOfColumn.size(); ++column) {
        const double share = static_cast<double>(column) / size.width();
        binOfColumn[column] =
            std::min(static_cast<std::size_t>(share * Bins), static_cast<std::size_t>(Bins - 1));
    }
    const std::size_t last = lines.size() - 1;
    for (int y = 0; y < size.height(); ++y) {
        const double place = waterfallPlace(y, size.height(), lines.size());
        const std::size_t a = waterfallLine(y, size.height(), lines.size());
        const std::size_t b = std::min(a + 1, last);
        const RowColors row =
            colorsOf(lines[a].level, lines[b].level, place - std::floor(place), colors, range);
        auto *pixels = reinterpret_cast<QRgb *>(image.scanLine(y));
        for (std::size_t column = 0; column < binOfColumn.size(); ++column) {
            pixels[column] = row[binOfColumn[column]];
        }
    }
    return image;
}

LevelRange fittedRange(const std::vector<SpectrumLines::Line> &lines)
{
    constexpr int Lowest = -150;
    constexpr int Step = 10;
    std::array<qint64, -Lowest + 1> counts{}; // by whole dB below 0
    qint64 total = 0;
    double highest = Lowest;
    for (const SpectrumLines::Line &line : lines) {
        for (const double level : line.level) {
            const double limited = level > Lowest ? std::min(level, 0.0) : Lowest;
            ++counts[static_cast<std::size_t>(-limited)];
            ++total;
            highest = std::max(highest, level);
        }
    }
    if (total == 0 || highest <= Lowest) {
        return {};
    }
    int floorDb = Lowest;
    qint64 below = 0;
    while (below * 20 < total && floorDb < 0) {
        below += counts[static_cast<std::size_t>(-floorDb)];
        ++floorDb;
    }
    LevelRange range;
    constexpr double Rounding = 0.05; // a tone of full scale may exceed it by that
    range.high = std::ceil((highest - Rounding) / Step) * Step;
    range.low = std::floor(static_cast<double>(floorDb) / Step) * Step;
    // A wider range shows the noise of the number format, a narrower one nothing but noise.
    constexpr double Widest = 120;
    constexpr double Narrowest = 30;
    range.low = std::clamp(range.low, range.high - Widest, range.high - Narrowest);
    return range;
}
