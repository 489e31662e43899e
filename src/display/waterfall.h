// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "ColorTable.h"
#include "view/SpectrumLines.h"

#include <QImage>
#include <QSize>

/// The line that a row of a waterfall of `rows` rows shows; the row is mixed with the next one.
[[nodiscard]] std::size_t waterfallLine(int row, int rows, std::size_t lineCount);

/// Paints spectrum lines as a picture of a size in device pixels, time downwards, frequency to the
/// right. Rows between two lines are mixed of both. Levels below -149 dB and above 0 dB keep the
/// background colour.
[[nodiscard]] QImage waterfallImage(const std::vector<SpectrumLines::Line> &lines,
                                    const ColorTable &colors, const QSize &size);
