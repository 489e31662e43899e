// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <QStringList>

class QWidget;

/// What someone without a mouse, or without seeing the screen, misses in a window: controls that
/// take the focus but have no name, and keys that two controls of a page claim. Empty if nothing.
[[nodiscard]] QStringList barriers(const QWidget &window);
