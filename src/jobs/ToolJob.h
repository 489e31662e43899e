// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <QObject>
#include <QString>

#include <atomic>

/// One run of a tool: takes a request (a plain struct) in its constructor, does the work in steps,
/// and tells about it by signals, so that a dialog and the command line can run the very same job.
///
/// run() works in the calling thread and lets the event loop run every 100 ms. It ends in one of
/// three ways: true; false with isCancelled(); false with the reason in the log.
class ToolJob : public QObject
{
    Q_OBJECT

public:
    explicit ToolJob(QObject *parent = nullptr);

    /// Does the whole work. A failure has been logged where it was seen.
    [[nodiscard]] virtual bool run() = 0;

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

    /// A line for the tool's report, HTML.
    void report(const QString &html);

    /// To the worker of the running step.
    void cancelRequested();

protected:
    /// The flag behind isCancelled(), for a loop of the job itself.
    [[nodiscard]] const std::atomic<bool> &cancelFlag() const { return m_cancelled; }

private:
    std::atomic<bool> m_cancelled{false};
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
