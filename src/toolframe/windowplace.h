// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <QPoint>
#include <QSize>

class QSettings;
class QWidget;

/// Writes position and size of a window as "pos" and "size" of the current settings group; of a
/// maximised window those that it goes back to.
void writeWindowPlace(QSettings &settings, const QWidget &window);

/// Puts a window where writeWindowPlace saw it, or at the given place. A window that no present
/// screen would show is brought back onto one, and it is never made larger than its screen.
void readWindowPlace(const QSettings &settings, QWidget &window, QPoint position, QSize size);
