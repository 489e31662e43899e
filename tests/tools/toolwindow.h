// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <QAbstractButton>
#include <QApplication>
#include <QFocusEvent>
#include <QLineEdit>
#include <QTest>

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

} // namespace toolwindow
