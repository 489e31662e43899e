// SPDX-License-Identifier: Apache-2.0
#include "modals.h"

#include <QAbstractButton>
#include <QApplication>
#include <QContextMenuEvent>
#include <QInputDialog>
#include <QLineEdit>
#include <QMenu>
#include <QMessageBox>
#include <QTest>
#include <QTimer>
#include <QWheelEvent>

#include <algorithm>

namespace {

constexpr int PollMs = 10;
constexpr int LimitMs = 5000;

bool isProgress(const QWidget &window)
{
    return window.inherits("QtProgressDialog");
}

/// The modal window that can be seen, or null.
QWidget *visibleModal()
{
    QWidget *window = QApplication::activeModalWidget();
    return window != nullptr && window->isVisible() ? window : nullptr;
}

QString textOf(const QWidget &window)
{
    const auto *box = qobject_cast<const QMessageBox *>(&window);
    return box != nullptr ? box->text() : window.windowTitle();
}

} // namespace

bool withModals(const std::function<void()> &action, const QList<Answer> &answers)
{
    qsizetype count = 0;
    QTimer poll;
    QObject::connect(&poll, &QTimer::timeout, [&] {
        QWidget *modal = visibleModal();
        if (modal == nullptr || isProgress(*modal)) {
            return;
        }
        if (count < answers.size()) {
            answers.at(count)(*modal);
        } else {
            qWarning("unexpected window: %s", qPrintable(textOf(*modal)));
            modal->close();
        }
        ++count;
    });
    poll.start(PollMs);
    action();
    const bool done = QTest::qWaitFor([&] { return count >= answers.size(); }, LimitMs) &&
                      QTest::qWaitFor([] { return !QApplication::activeModalWidget(); }, LimitMs);
    return done && count == answers.size();
}

bool withModal(const std::function<void()> &action, const Answer &answer)
{
    return withModals(action, {answer});
}

Answer press(const QString &button)
{
    return [button](QWidget &box) {
        const QList<QAbstractButton *> buttons = box.findChildren<QAbstractButton *>();
        const auto found = std::find_if(buttons.begin(), buttons.end(), [&](QAbstractButton *each) {
            return each->text().remove('&') == button;
        });
        if (found == buttons.end()) {
            QTest::qFail(qPrintable("no button " + button), __FILE__, __LINE__);
            box.close();
            return;
        }
        QTest::mouseClick(*found, Qt::LeftButton);
    };
}

Answer answer(const QString &button, Seen &seen)
{
    return [button, &seen](QWidget &box) {
        seen = {box.windowTitle(), textOf(box)};
        press(button)(box);
    };
}

Answer typeName(const QString &name, Seen &seen, Qt::Key key)
{
    return [name, &seen, key](QWidget &box) {
        auto *dialog = qobject_cast<QInputDialog *>(&box);
        if (dialog == nullptr) {
            QTest::qFail(qPrintable("no request for a text: " + textOf(box)), __FILE__, __LINE__);
            box.close();
            return;
        }
        seen = {dialog->windowTitle(), dialog->labelText()};
        auto *edit = dialog->findChild<QLineEdit *>();
        edit->selectAll();
        QTest::keyClick(edit, Qt::Key_Delete);
        QTest::keyClicks(edit, name);
        QTest::keyClick(edit, key);
    };
}

void whenModal(const std::function<bool(QWidget &)> &accepts, const Answer &action)
{
    auto *poll = new QTimer(qApp);
    QObject::connect(poll, &QTimer::timeout, poll, [poll, accepts, action] {
        QWidget *window = visibleModal();
        if (window != nullptr && accepts(*window)) {
            poll->stop();
            poll->deleteLater();
            action(*window);
        }
    });
    poll->start(PollMs);
}

void whenModal(const Answer &action)
{
    whenModal([](const QWidget &window) { return !isProgress(window); }, action);
}

void cancelNextJob()
{
    whenModal([](const QWidget &window) { return isProgress(window); },
              [](const QWidget &window) {
                  QTest::mouseClick(window.findChild<QAbstractButton *>("pb_cancel"),
                                    Qt::LeftButton);
              });
}

bool chooseFromMenu(QWidget &widget, const QString &text)
{
    const QPoint center = widget.rect().center();
    QContextMenuEvent event(QContextMenuEvent::Mouse, center, widget.mapToGlobal(center));
    QApplication::sendEvent(&widget, &event);
    auto *menu = qobject_cast<QMenu *>(QApplication::activePopupWidget());
    if (menu == nullptr) {
        return false;
    }
    const QList<QAction *> actions = menu->actions();
    const auto found = std::find_if(actions.begin(), actions.end(), [&](const QAction *each) {
        return each->text() == text && each->isEnabled();
    });
    if (found == actions.end()) {
        menu->close();
        return false;
    }
    QTest::mouseClick(menu, Qt::LeftButton, {}, menu->actionGeometry(*found).center());
    return QTest::qWaitFor([] { return QApplication::activePopupWidget() == nullptr; }, LimitMs);
}

bool turnWheel(QWidget &widget, int delta)
{
    const QPointF center = widget.rect().center();
    QWheelEvent event(center, widget.mapToGlobal(center), {}, {0, delta}, Qt::NoButton,
                      Qt::NoModifier, Qt::NoScrollPhase, false);
    event.setAccepted(false);
    QApplication::sendEvent(&widget, &event);
    return event.isAccepted();
}
