// SPDX-License-Identifier: Apache-2.0
#include "Tracer.h"

#include <QLocale>
#include <QMutex>
#include <QMutexLocker>
#include <QRecursiveMutex>
#include <QThread>
#include <QTime>

#include <algorithm>
#include <utility>
#include <vector>

namespace {

/// Without a taker the waiting lines stay within this many; the oldest go first.
constexpr qsizetype MaxPending = 100'000;

struct LogState
{
    unsigned mask = Tracer::DefaultMask;
    QMutex queueMutex;
    QList<Tracer::Entry> pending;
    // Recursive, since a slot that runs at once in the logging thread may log itself.
    QRecursiveMutex listenerMutex;
    std::vector<Tracer *> listeners;
    std::vector<Tracer::ErrorWatch *> watches; // under the mutex of the queue
};

LogState &state()
{
    static LogState theState;
    return theState;
}

} // namespace

Tracer::Tracer(QObject *parent)
    : QObject(parent)
{
    const QMutexLocker locker(&state().listenerMutex);
    state().listeners.push_back(this);
}

Tracer::~Tracer()
{
    const QMutexLocker locker(&state().listenerMutex);
    std::erase(state().listeners, this);
}

bool Tracer::isEnabled(int level)
{
    return (static_cast<unsigned>(level) & state().mask) != 0;
}

void Tracer::Trace(int level, const char *text)
{
    if (isEnabled(level)) {
        Trace(level, QString::fromUtf8(text));
    }
}

Tracer::ErrorWatch::ErrorWatch()
{
    const QMutexLocker locker(&state().queueMutex);
    state().watches.push_back(this);
}

Tracer::ErrorWatch::~ErrorWatch()
{
    const QMutexLocker locker(&state().queueMutex);
    std::erase(state().watches, this);
}

QString Tracer::ErrorWatch::text() const
{
    const QMutexLocker locker(&state().queueMutex);
    return m_text;
}

void Tracer::Trace(int level, const QString &text)
{
    if ((level & (Error | Severe)) != 0 && !text.isEmpty()) {
        const QMutexLocker locker(&state().queueMutex);
        for (ErrorWatch *watch : state().watches) {
            if (watch->m_text.isEmpty()) {
                watch->m_text = text;
            }
        }
    }
    if (!isEnabled(level) || text.isEmpty()) {
        return;
    }
    const QString line =
        QLocale::system().toString(QTime::currentTime(), QLocale::ShortFormat) + "  " + text;
    {
        const QMutexLocker locker(&state().queueMutex);
        QList<Entry> &pending = state().pending;
        if (pending.size() >= MaxPending) {
            pending.remove(0, MaxPending / 10);
        }
        pending.append({line, level});
    }
    // No QList, whose copy would share its block with the list that other threads change.
    std::vector<Tracer *> listeners;
    {
        const QMutexLocker locker(&state().listenerMutex);
        listeners = state().listeners;
    }
    for (Tracer *listener : listeners) {
        QMutexLocker locker(&state().listenerMutex);
        // A slot or another thread may have destroyed a listener that the copy still names.
        if (std::ranges::find(state().listeners, listener) == state().listeners.end()) {
            continue;
        }
        if (listener->thread() == QThread::currentThread()) {
            // Its slots run right here, and other threads must be able to log meanwhile. Only this
            // thread can destroy it.
            locker.unlock();
        }
        emit listener->TraceDataAvailable();
    }
}

bool Tracer::fail(const QString &text)
{
    Trace(Error, text);
    return false;
}

void Tracer::setMask(unsigned mask)
{
    state().mask = mask;
}

QList<Tracer::Entry> Tracer::takeEntries()
{
    const QMutexLocker locker(&state().queueMutex);
    return std::exchange(state().pending, {});
}
