// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "Composition.h"

#include "dsp/Resample.h"
#include "wvfile/HvFileIO.h"

#include <QString>
#include <QThread>

#include <atomic>

struct SegmentBuffers;

/// One segment's work in one pass of the engine, on a thread of its own. It touches the buffers of
/// this segment alone and reads the document, which nobody changes meanwhile.
class Pass23 : public QThread
{
    Q_OBJECT

public:
    struct Job
    {
        const Composition *composition = nullptr;
        const ComposerSegment *segment = nullptr;
        SegmentBuffers *buffers = nullptr;
        int track = 0;
        int index = 0;
        unsigned processors = 1; ///< that this thread may use
    };

    explicit Pass23(const Job &job, QObject *parent = nullptr);

    /// Whether the work succeeded; to be asked when the thread has ended.
    [[nodiscard]] bool ok() const { return m_ok; }
    /// In percent, from any thread.
    [[nodiscard]] int progress() const { return m_progress; }

signals:
    /// To the worker, in the thread that sends it.
    void cancelTask();

public slots:
    /// Ends the work as soon as it looks; may be repeated.
    void cancel();
    void progressValueChanged(int percent);

protected:
    void run() final;
    [[nodiscard]] virtual bool work() = 0;

    /// Wires a worker that lives as long as the pass.
    template <typename Worker>
    void wire(Worker &worker)
    {
        connect(this, &Pass23::cancelTask, &worker, &Worker::cancel, Qt::DirectConnection);
        connect(&worker, &Worker::ProgressUpdate, this, &Pass23::progressValueChanged,
                Qt::DirectConnection);
    }

    [[nodiscard]] const Composition &composition() const { return *m_job.composition; }
    [[nodiscard]] const ComposerSegment &segment() const { return *m_job.segment; }
    [[nodiscard]] SegmentBuffers &buffers() { return *m_job.buffers; }
    /// "track 1, segment 2".
    [[nodiscard]] QString place() const;

private:
    Job m_job;
    std::atomic<int> m_progress{0};
    std::atomic<bool> m_cancelled{false};
    bool m_ok = false;
};

/// Reads the source file.
class Pass1 : public Pass23
{
    Q_OBJECT

public:
    explicit Pass1(const Job &job, QObject *parent = nullptr);

private:
    [[nodiscard]] bool work() override;

    HvFileIO m_file;
};

/// Brings the samples to the target clock, the whole source and not only its used part.
class Pass2 : public Pass23
{
    Q_OBJECT

public:
    explicit Pass2(const Job &job, QObject *parent = nullptr);

private:
    [[nodiscard]] bool work() override;

    Resample m_resample;
};

/// Applies the frequency offset.
class Pass3 : public Pass23
{
    Q_OBJECT

public:
    explicit Pass3(const Job &job, QObject *parent = nullptr);

private:
    [[nodiscard]] bool work() override;

    Resample m_resample;
};
