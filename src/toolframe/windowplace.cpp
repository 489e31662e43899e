// SPDX-License-Identifier: Apache-2.0
#include "windowplace.h"

#include <QGuiApplication>
#include <QScreen>
#include <QSettings>
#include <QVariant>
#include <QWidget>

void writeWindowPlace(QSettings &settings, const QWidget &window)
{
    const bool normal = !window.isMaximized() && !window.isFullScreen();
    settings.setValue("pos", normal ? window.pos() : window.normalGeometry().topLeft());
    settings.setValue("size", normal ? window.size() : window.normalGeometry().size());
}

void readWindowPlace(const QSettings &settings, QWidget &window, QPoint position, QSize size)
{
    const QVariant storedPosition = settings.value("pos");
    const QVariant storedSize = settings.value("size");
    if (storedPosition.canConvert<QPoint>()) {
        position = storedPosition.toPoint();
    }
    if (storedSize.canConvert<QSize>() && !storedSize.toSize().isEmpty()) {
        size = storedSize.toSize();
    }
    const QScreen *screen = QGuiApplication::screenAt(position);
    if (!screen) {
        screen = QGuiApplication::primaryScreen();
        position = screen->availableGeometry().topLeft();
    }
    const QRect room = screen->availableGeometry();
    size = size.boundedTo(room.size());
    if (!room.contains(QRect(position, size))) {
        // The buttons are at its lower edge. What is moved has room for its frame, too.
        constexpr QSize Frame(8, 36);
        size = size.boundedTo(room.size() - Frame);
        const QPoint last = room.bottomRight() - QPoint(size.width(), size.height()) -
                            QPoint(Frame.width(), Frame.height());
        position = {qMax(room.left(), qMin(position.x(), last.x())),
                    qMax(room.top(), qMin(position.y(), last.y()))};
    }
    window.resize(size);
    window.move(position);
}
