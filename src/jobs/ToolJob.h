// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "ReportLine.h"

#include <QObject>
#include <QString>

#include <atomic>

/// How a job ended: done; not done, with the reason in the log; ended by the user.
enum class JobOutcome { Finished, Failed, Cancelled };

/// The last lines of a job's report; an empty one is left out.
struct JobEnding
{
    QString success;
    QString failure;
    QString cancelled{}; ///< empty: that it was cancelled, in plain letters, which is no failure
};

/// One run of a tool: takes a request (a plain struct) in its constructor, does the work in steps,
/// and tells about it by signals, so that a dialog and the command line can run the very same job.
///
/// Works in the calling thread and lets the event loop run every 100 ms. A job runs once.
class ToolJob : public QObject
{
    Q_OBJECT

public:
    explicit ToolJob(QObject *parent = nullptr);

    /// Does the whole work and closes the report. The reason of a failure has been logged where it
    /// was seen.
    [[nodiscard]] JobOutcome run();

    [[nodiscard]] bool isCancelled() const { return m_cancelled; }

    /// To be asked between steps: false, with the abort logged, once the job was cancelled.
    [[nodiscard]] bool mayProceed() const;

public slots:
    /// Ends the running step at its next tick, and keeps later steps from starting.
    void cancel();

signals:
    /// A step begins; `label` is the text for a progress dialog, such as "Reading Waveform...".
    void stepStarted(const QString &label);

    /// Progress of the running step, 0 to 100.
    void ProgressUpdate(int iPercentage);

    /// How much of a transfer is done, in bytes, over all its steps.
    void bytesMoved(qint64 done, qint64 total);

    void report(const ReportLine &line);

    /// To the worker of the running step.
    void cancelRequested();

protected:
    /// The work of this job; false, with the reason logged, if it failed or was cancelled.
    [[nodiscard]] virtual bool work() = 0;

    /// The lines that close the report; by default none.
    void setEnding(JobEnding ending);

    /// For a part of the work whose failure has words of its own.
    void setFailureText(const QString &text);

    /// Logs why the job doesn't even begin, and leaves the report without a last line.
    [[nodiscard]] bool refuse(const QString &reason);

    /// Reports several lines in turn.
    void reportAll(const ReportLines &lines);

    /// The flag behind isCancelled(), for a loop of the job itself.
    [[nodiscard]] const std::atomic<bool> &cancelFlag() const { return m_cancelled; }

private:
    std::atomic<bool> m_cancelled{false};
    JobEnding m_ending;
};

/// The scope of one step: announces its label, wires a worker with the signal ProgressUpdate(int)
/// and the slot cancel() to the job, and unwires it at its end.
class JobStep
{
public:
    template <typename Worker>
    JobStep(ToolJob &job, const QString &label, Worker &worker)
        : m_progress(
              QObject::connect(&worker, &Worker::ProgressUpdate, &job, &ToolJob::ProgressUpdate))
        , m_cancel(QObject::connect(&job, &ToolJob::cancelRequested, &worker, &Worker::cancel))
    {
        emit job.stepStarted(label);
    }

    ~JobStep()
    {
        QObject::disconnect(m_progress);
        QObject::disconnect(m_cancel);
    }

    JobStep(const JobStep &) = delete;
    JobStep &operator=(const JobStep &) = delete;

private:
    QMetaObject::Connection m_progress;
    QMetaObject::Connection m_cancel;
};
