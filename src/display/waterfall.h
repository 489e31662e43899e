// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "ColorTable.h"
#include "view/SpectrumLines.h"

#include <QImage>
#include <QSize>

/// The line that a row of a waterfall of `rows` rows shows; the row is mixed with the next one.
[[nodiscard]] std::size_t waterfallLine(int row, int rows, std::size_t lineCount);

/// Paints spectrum lines as a picture of a size in device pixels, time downwards, frequency to the
/// right. Rows between two lines are mixed of both. The range takes the whole scale of colours;
/// levels beyond it have the colour of its nearer end.
[[nodiscard]] QImage waterfallImage(const std::vector<SpectrumLines::Line> &lines,
                                    const ColorTable &colors, const QSize &size,
                                    const LevelRange &range = {});

/// The range in which the levels of the lines lie, in steps of 10 dB: up to the highest one, down
/// to what only a twentieth of them falls below. Lines without levels don't count.
[[nodiscard]] LevelRange fittedRange(const std::vector<SpectrumLines::Line> &lines);
