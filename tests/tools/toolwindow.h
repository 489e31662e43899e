// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <QAbstractButton>
#include <QApplication>
#include <QFocusEvent>
#include <QLineEdit>
#include <QMessageBox>
#include <QTest>
#include <QTimer>

/// A user at the window of a tool.
namespace toolwindow {

template <typename Widget>
Widget *child(QWidget &dialog, const char *name)
{
    return dialog.findChild<Widget *>(name);
}

inline void click(QWidget &dialog, const char *button)
{
    QTest::mouseClick(child<QAbstractButton>(dialog, button), Qt::LeftButton);
}

inline void type(QLineEdit *edit, const QString &text)
{
    edit->setFocus();
    edit->selectAll();
    QTest::keyClicks(edit, text);
    // Leaving the field takes the text; Return would go on to the next page as well.
    QFocusEvent leave(QEvent::FocusOut);
    QApplication::sendEvent(edit, &leave);
}

/// Clicks, as soon as it can be seen, on a button of the next modal window that has it.
template <typename Find>
void whenModal(Find find)
{
    auto *timer = new QTimer(qApp);
    timer->setInterval(20);
    QObject::connect(timer, &QTimer::timeout, timer, [timer, find] {
        QWidget *window = QApplication::activeModalWidget();
        QAbstractButton *button = window != nullptr ? find(*window) : nullptr;
        if (button != nullptr && button->isVisible()) {
            timer->deleteLater();
            QTest::mouseClick(button, Qt::LeftButton);
        }
    });
    timer->start();
}

/// Answers the next message box with Yes or No; `text` gets what it asked.
inline void answerNextQuestion(QMessageBox::StandardButton answer, QString *text)
{
    whenModal([answer, text](QWidget &window) -> QAbstractButton * {
        auto *box = qobject_cast<QMessageBox *>(&window);
        if (box == nullptr) {
            return nullptr;
        }
        *text = box->text();
        return box->button(answer);
    });
}

/// Cancels the next job that runs long enough to show its progress.
inline void cancelNextJob()
{
    whenModal([](QWidget &window) { return window.findChild<QAbstractButton *>("pb_cancel"); });
}

} // namespace toolwindow
