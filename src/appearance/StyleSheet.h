// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <QPalette>
#include <QString>

class QColor;
class QSettings;

/// The contrast of two colours as the web's accessibility guidelines (WCAG 2.1) count it, from 1
/// to 21.
[[nodiscard]] double contrastRatio(const QColor &a, const QColor &b);

/// The rules of all widget classes in the colours of the current set.
[[nodiscard]] QString applicationStyleSheet();

/// The current set for what is painted without a style sheet.
[[nodiscard]] QPalette applicationPalette();

/// Reads the set from its store and dresses the application in it. While the store has none, the
/// desktop's own palette decides between a dark and a light preset. To be called once, before any
/// window is built.
void startColors(QSettings &store);

/// Dresses all windows in the current set, after it was changed. What paints itself must be told
/// besides.
void applyColors();
