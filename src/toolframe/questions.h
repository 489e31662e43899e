// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <QString>

#include <optional>

class QWidget;

/// A modal question with Yes and No, No being preset, since a yes here destroys something. The
/// text is shown as it is: a "<" in a file name is no markup.
[[nodiscard]] bool askYesNo(QWidget *parent, const QString &title, const QString &text);

/// A modal question for a line of text, `initial` being preset and its first `marked` characters,
/// or all, marked; nothing if the user cancels.
[[nodiscard]] std::optional<QString> askText(QWidget *parent, const QString &title,
                                             const QString &label, const QString &initial,
                                             qsizetype marked = -1);

/// Whether a tool may write to this path: there is no such file, or the user agrees to overwrite
/// it. A refusal is logged.
[[nodiscard]] bool confirmOverwrite(QWidget *parent, const QString &path);
