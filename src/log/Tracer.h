// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <QList>
#include <QObject>
#include <QPair>
#include <QString>

/// The process-wide log: the only diagnostic channel of the program.
///
/// A message is a finished text with a level, one of the bits below. The state is static; a Tracer
/// object is a listener that is told by a signal when lines wait to be taken. Any thread may log;
/// a listener in another thread gets the signal through its own event loop.
class Tracer : public QObject
{
    Q_OBJECT

public:
    enum Level {
        Information = 1,
        Warning = 2,
        Error = 4,
        Severe = 8,
        Debug = 16,
    };

    /// One logged line, stamped with the time of day, and its level.
    using Entry = QPair<QString, int>;

    static constexpr unsigned DefaultMask = Information | Warning | Error | Severe;
    static constexpr unsigned DebugMask = DefaultMask | Debug;

    explicit Tracer(QObject *parent = nullptr);
    ~Tracer() override;

    /// Logs a text. A level without a common bit with the mask drops it at the cost of one test.
    static void Trace(int level, const QString &text);

    /// As above, without converting the literal when the mask drops it.
    static void Trace(int level, const char *text);

    /// Logs an error and returns false, for `return Tracer::fail("Reason.")` where it was seen.
    static bool fail(const QString &text);

    /// Whether a message of this level would be kept; spares the formatting of one that is not.
    [[nodiscard]] static bool isEnabled(int level);

    /// Replaces the mask; to be called before any worker thread exists.
    static void setMask(unsigned mask);

    /// Returns all waiting lines in order of arrival and forgets them. Without a taker not more
    /// than 100 000 wait: the oldest are dropped first.
    [[nodiscard]] static QList<Entry> takeEntries();

    /// Keeps the first error that is logged while it lives, by any thread and whatever the mask:
    /// the reason why a piece of work has failed.
    class ErrorWatch
    {
    public:
        ErrorWatch();
        ~ErrorWatch();
        ErrorWatch(const ErrorWatch &) = delete;
        ErrorWatch &operator=(const ErrorWatch &) = delete;

        /// Empty if there was none.
        [[nodiscard]] QString text() const;

    private:
        friend class Tracer;
        QString m_text;
    };

signals:
    /// Lines wait to be taken. An earlier taker may have emptied the list meanwhile.
    void TraceDataAvailable();
};
