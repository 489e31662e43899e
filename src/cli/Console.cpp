// SPDX-License-Identifier: Apache-2.0
#include "Console.h"

#include "base/visibletext.h"
#include "jobs/ReportText.h"
#include "jobs/ToolJob.h"

#include <QSocketNotifier>

#include <array>
#include <cerrno>
#include <csignal>
#include <cstdio>
#include <ctime>
#include <fcntl.h>
#include <unistd.h>

namespace {

/// A signal handler may do little more than write to a pipe; the event loop reads its other end.
std::array<int, 2> interruptPipe{-1, -1};

/// Set while a job watches the pipe.
volatile std::sig_atomic_t jobRuns = 0;
volatile std::sig_atomic_t interruptedAt = 0;

extern "C" void onInterrupt(int)
{
    timespec now{};
    clock_gettime(CLOCK_MONOTONIC, &now);
    const auto second = static_cast<std::sig_atomic_t>(now.tv_sec);
    // Nothing to be cancelled, or a job that hangs in a write to a reader that doesn't read: a
    // user who asks again gets the terminal back. One key press may come as two signals, though.
    constexpr int Patience = 2;
    if (jobRuns == 0 || (interruptedAt != 0 && second - interruptedAt >= Patience)) {
        _exit(ExitCancelled);
    }
    if (interruptedAt == 0) {
        interruptedAt = second;
    }
    const char byte = 1;
    [[maybe_unused]] const ssize_t written = write(interruptPipe[1], &byte, 1);
}

QString levelName(int level)
{
    if ((level & (Tracer::Error | Tracer::Severe)) != 0) {
        return "error";
    }
    if ((level & Tracer::Warning) != 0) {
        return "warning";
    }
    return (level & Tracer::Debug) != 0 ? "debug" : "info";
}

} // namespace

void Console::reserveStandardStreams()
{
    for (const int stream : {STDIN_FILENO, STDOUT_FILENO, STDERR_FILENO}) {
        if (fcntl(stream, F_GETFD) < 0) {
            [[maybe_unused]] const int opened =
                open("/dev/null", stream == STDIN_FILENO ? O_WRONLY : O_RDONLY);
        }
    }
}

Console::Console(QObject *parent)
    : QObject(parent)
{
    connect(&m_tracer, &Tracer::TraceDataAvailable, this, &Console::printLog);
    if (pipe2(interruptPipe.data(), O_CLOEXEC | O_NONBLOCK) == 0) {
        // Whoever ends the program, nothing unfinished is to stay.
        for (const int signal : {SIGINT, SIGTERM, SIGHUP}) {
            std::signal(signal, onInterrupt);
        }
    }
    // A closed reader of standard output ends the job, which tidies up, and not the program.
    std::signal(SIGPIPE, SIG_IGN);
}

void Console::setVerbose(bool verbose)
{
    m_verbose = verbose;
    Tracer::setMask(verbose ? Tracer::DebugMask : Tracer::DefaultMask);
}

void Console::printLog()
{
    const QList<Tracer::Entry> entries = Tracer::takeEntries();
    for (const auto &[stamped, level] : entries) {
        const QString name = levelName(level);
        if (!m_verbose && (name == "info" || name == "debug")) {
            continue;
        }
        // The time of day in front, closed by two blanks, is of no use in a script's log.
        QString text = stamped.mid(stamped.indexOf("  ") + 2);
        text.replace('\n', ' ');
        printLine(name + ": " + text);
        if (name == "error") {
            m_lastReason = text;
            if (m_jobReason.isEmpty()) {
                m_jobReason = text;
            }
        }
    }
}

void Console::printLine(const QString &line)
{
    clearProgress();
    m_lastLine = line;
    std::fprintf(stderr, "%s\n",
                 visibleText(QString(line).replace('\t', ' ')).toLocal8Bit().constData());
}

void Console::printReport(const ReportLine &line)
{
    const QString text = plainLine(line);
    if (line.kind == ReportLine::Kind::Warning) {
        printLine("warning: " + text);
    } else if (!m_quiet && !text.isEmpty()) {
        printLine(text);
    }
}

void Console::drawProgress(int percent)
{
    // A job that is done in a moment shows no bar at all.
    constexpr qint64 QuietMs = 500;
    if (!m_showProgress || m_jobTime.elapsed() < QuietMs || isatty(STDERR_FILENO) == 0) {
        return;
    }
    constexpr int Width = 30;
    const int filled = qBound(0, percent, 100) * Width / 100;
    const QString bar = QString(filled, '#').leftJustified(Width, '.');
    std::fprintf(stderr, "\r\033[K%s [%s] %3d %%", m_stepLabel.toLocal8Bit().constData(),
                 bar.toLocal8Bit().constData(), percent);
    std::fflush(stderr);
    m_progressDrawn = true;
}

void Console::clearProgress()
{
    if (m_progressDrawn) {
        std::fputs("\r\033[K", stderr);
        m_progressDrawn = false;
    }
}

int Console::run(ToolJob &job)
{
    connect(&job, &ToolJob::stepStarted, this,
            [this](const QString &label) { m_stepLabel = label; });
    connect(&job, &ToolJob::ProgressUpdate, this, &Console::drawProgress);
    connect(&job, &ToolJob::report, this, &Console::printReport);
    QSocketNotifier interrupt(interruptPipe[0], QSocketNotifier::Read);
    connect(&interrupt, &QSocketNotifier::activated, &job, [&job] {
        char byte = 0;
        while (read(interruptPipe[0], &byte, 1) > 0) {
        }
        job.cancel();
    });
    m_jobReason.clear();
    m_jobTime.start();
    interruptedAt = 0;
    jobRuns = 1;
    const JobOutcome outcome = job.run();
    jobRuns = 0;
    clearProgress();
    switch (outcome) {
    case JobOutcome::Finished:
        return ExitDone;
    case JobOutcome::Cancelled:
        return ExitCancelled;
    case JobOutcome::Failed:
        break;
    }
    // What was seen first is the cause; errors after it tell what came of it.
    return failedWith(m_jobReason);
}

int Console::failed()
{
    return failedWith(m_lastReason);
}

int Console::failedWith(const QString &text)
{
    if (m_isUnread) {
        return ExitUnread;
    }
    const QString reason = "error: " + text;
    if (m_lastLine != reason) {
        printLine(reason);
    }
    return ExitFailed;
}

int Console::wrongUsage(const QString &reason)
{
    printLine("error: " + reason);
    return ExitUsage;
}

bool Console::print(const QByteArray &bytes)
{
    if (std::fwrite(bytes.constData(), 1, static_cast<size_t>(bytes.size()), stdout) !=
            static_cast<size_t>(bytes.size()) ||
        std::fflush(stdout) != 0) {
        // Who reads, such as "head", has had enough: that is no fault to tell of.
        m_isUnread = errno == EPIPE;
        if (m_isUnread) {
            return false;
        }
        error("Cannot write to standard output.");
        return false;
    }
    return true;
}
