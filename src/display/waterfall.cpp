// SPDX-License-Identifier: Apache-2.0
#include "waterfall.h"

#include <algorithm>
#include <array>
#include <cmath>
#include <cstddef>

namespace {

constexpr int Bins = SpectrumLines::FrameSize;
constexpr double LowestDb = -149;
/// The level of a full-scale tone may exceed 0 dB by rounding; it is full scale all the same.
constexpr double RoundingDb = 1e-9;

using RowColors = std::array<QRgb, Bins>;

RowColors colorsOf(const std::vector<double> &a, const std::vector<double> &b, double shareOfB,
                   const ColorTable &colors)
{
    RowColors row;
    for (std::size_t bin = 0; bin < row.size(); ++bin) {
        const double level = b[bin] * shareOfB + a[bin] * (1 - shareOfB);
        row[bin] = level >= LowestDb && level <= RoundingDb ? colors.entry(static_cast<int>(-level))
                                                            : colors.background();
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
                      const QSize &size)
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
            colorsOf(lines[a].level, lines[b].level, place - std::floor(place), colors);
        auto *pixels = reinterpret_cast<QRgb *>(image.scanLine(y));
        for (std::size_t column = 0; column < binOfColumn.size(); ++column) {
            pixels[column] = row[binOfColumn[column]];
        }
    }
    return image;
}
