// SPDX-License-Identifier: Apache-2.0
#include "FirstPaint.h"

#include <QByteArray>
#include <QEvent>
#include <QFile>
#include <QList>
#include <QTimer>
#include <QWidget>

#include <ctime>
#include <unistd.h>

namespace {

/// Milliseconds since the system started this process; -1 if it can't be told.
qint64 processAgeMs()
{
    // proc(5): behind the name in parentheses, which may hold blanks, field 22 of the line is the
    // start of the process in clock ticks since the system was booted.
    constexpr qsizetype StartField = 22 - 3;
    QFile file("/proc/self/stat");
    timespec now{};
    if (!file.open(QIODevice::ReadOnly) || clock_gettime(CLOCK_BOOTTIME, &now) != 0) {
        return -1;
    }
    const QByteArray line = file.readAll();
    const QList<QByteArray> fields = line.mid(line.lastIndexOf(')') + 2).split(' ');
    const qint64 ticksPerSecond = sysconf(_SC_CLK_TCK);
    if (fields.size() <= StartField || ticksPerSecond <= 0) {
        return -1;
    }
    const qint64 startMs = fields.at(StartField).toLongLong() * 1000 / ticksPerSecond;
    return now.tv_sec * 1000 + now.tv_nsec / 1000000 - startMs;
}

} // namespace

FirstPaint::FirstPaint(QWidget &window)
{
    window.installEventFilter(this);
}

bool FirstPaint::eventFilter(QObject *watched, QEvent *event)
{
    if (event->type() == QEvent::Paint && !m_seen) {
        m_seen = true;
        // The children are painted within the same pass, before the next turn of the event loop.
        QTimer::singleShot(0, this, [this] { m_ageMs = processAgeMs(); });
    }
    return QObject::eventFilter(watched, event);
}
