// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "log/Tracer.h"

#include <QElapsedTimer>
#include <QObject>
#include <QString>

class ToolJob;
struct ReportLine;

/// Exit status of the program.
enum ExitCode {
    ExitDone = 0,
    ExitFailed = 1,
    ExitUsage = 2,
    ExitLimit = 3, ///< all done, but a limit isn't met
    ExitCancelled = 130,
    ExitUnread = 141, ///< the reader of standard output has gone; as a shell tells of SIGPIPE
};

/// The terminal side of the program: prints the log and the report lines to standard error, draws
/// the progress of a job there, and turns SIGINT into its cancel().
class Console : public QObject
{
    Q_OBJECT

public:
    /// To be called before anything opens a file. A standard stream that the caller has closed
    /// would be given to the next file, and results be written into that; opened the wrong way
    /// round, it fails as a closed one does.
    static void reserveStandardStreams();

    explicit Console(QObject *parent = nullptr);

    void setQuiet(bool quiet) { m_quiet = quiet; }
    void setVerbose(bool verbose);
    void setShowProgress(bool show) { m_showProgress = show; }

    /// Runs a job and returns the exit code. When it fails, the reason, which is the first error
    /// that it has logged, is the last line.
    [[nodiscard]] int run(ToolJob &job);

    /// Ends a command that failed with the reason in the log: makes that the last line.
    [[nodiscard]] int failed();

    /// Ends a command that was used wrongly.
    [[nodiscard]] int wrongUsage(const QString &reason);

    /// Logs an error of the command line itself.
    void error(const QString &text) { Tracer::Trace(Tracer::Error, text); }

    /// The text of the last error in the log; empty if there was none.
    [[nodiscard]] const QString &lastReason() const { return m_lastReason; }

    /// Writes to standard output; false, with the reason logged, if that is closed or full. False
    /// without a word if its reader has gone: failed() then says nothing either.
    [[nodiscard]] bool print(const QByteArray &bytes);

private:
    [[nodiscard]] int failedWith(const QString &text);
    void printLog();
    void printReport(const ReportLine &line);
    void printLine(const QString &line);
    void drawProgress(int percent);
    void clearProgress();

    Tracer m_tracer;
    bool m_quiet = false;
    bool m_verbose = false;
    bool m_showProgress = false;
    bool m_progressDrawn = false;
    bool m_isUnread = false; ///< the reader of standard output has gone
    QString m_stepLabel;
    QElapsedTimer m_jobTime;
    QString m_jobReason;
    QString m_lastReason;
    QString m_lastLine;
};
