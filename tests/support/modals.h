// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <QList>
#include <QString>

#include <functional>

class QWidget;

/// A user at modal windows, which hold up the code that opens them.

using Answer = std::function<void(QWidget &)>;

/// Runs `action`, which opens modal windows one after the other, and has one answer act on each,
/// which must close it; the progress of a job isn't one of them. False when not all of them came,
/// or more.
[[nodiscard]] bool withModals(const std::function<void()> &action, const QList<Answer> &answers);

/// As above, for a single one.
[[nodiscard]] bool withModal(const std::function<void()> &action, const Answer &answer);

/// What a modal box said.
struct Seen
{
    QString title;
    QString text;
};

/// An answer to a question or a box: presses the button with this text, mnemonics left out.
[[nodiscard]] Answer press(const QString &button);

/// As press(), noting what the box said.
[[nodiscard]] Answer answer(const QString &button, Seen &seen);

/// Answers a request for a text by typing it in the place of what stands there, and `key`.
[[nodiscard]] Answer typeName(const QString &name, Seen &seen, Qt::Key key = Qt::Key_Return);

/// Without waiting for it: does something to the next modal window, progress too, that `accepts`
/// it, as soon as it can be seen. Forgotten at the end of the test program only, so a window that
/// doesn't come is found by the caller.
void whenModal(const std::function<bool(QWidget &)> &accepts, const Answer &action);

/// As above, for the next window that isn't the progress of a job.
void whenModal(const Answer &action);

/// Cancels the next job that runs long enough to show its progress.
void cancelNextJob();

/// Chooses an entry of the context menu of a widget's middle with the mouse. False if the menu
/// doesn't come or has no such entry that is enabled.
[[nodiscard]] bool chooseFromMenu(QWidget &widget, const QString &text);

/// Turns the wheel over a widget's middle; tells whether the event was taken.
bool turnWheel(QWidget &widget, int delta);
