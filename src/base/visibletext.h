// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <QString>

/// A text from elsewhere for a terminal or a line of a file: control characters, which could move
/// the cursor or worse, stand as "\\xNN".
[[nodiscard]] QString visibleText(const QString &text);
