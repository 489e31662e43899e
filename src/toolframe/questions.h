// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <QString>
#include <QStringList>

#include <optional>

class QWidget;

/// A modal question with Yes and No, No being preset, since a yes here destroys something. The
/// texts are shown as they are: a "<" in a file name is no markup. The details, such as names and
/// sizes, stand below the question.
[[nodiscard]] bool askYesNo(QWidget *parent, const QString &title, const QString &text,
                            const QString &details = {});

/// A modal question for a line of text, `initial` being preset and its first `marked` characters,
/// or all, marked; nothing if the user cancels.
[[nodiscard]] std::optional<QString> askText(QWidget *parent, const QString &title,
                                             const QString &label, const QString &initial,
                                             qsizetype marked = -1);

/// What tells one file from another of its name, a line each: path, size and date. A long list is
/// cut.
[[nodiscard]] QString fileDetails(const QStringList &paths);

/// Whether a tool may write to this path: there is no such file, or the user agrees to overwrite
/// it. A refusal is logged.
[[nodiscard]] bool confirmOverwrite(QWidget *parent, const QString &path);
