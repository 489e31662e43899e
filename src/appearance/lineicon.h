// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <QColor>
#include <QIcon>

/// An icon of the program's own by the name of its drawing, such as "copy". It is drawn at the size
/// and pixel ratio of each painting in the colours that the set has then, so that a window that is
/// painted anew after a change of colours shows it in the new ones. A disabled icon is drawn in the
/// colour of disabled text, one of a selected row in that of text. A name without a drawing gives
/// an empty icon and an error in the log. To be painted in the thread of the window alone.
[[nodiscard]] QIcon lineIcon(const QString &name);

/// What icons mark their essential part with, and texts their links.
[[nodiscard]] QColor accentColor();
