// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "waveformcheck.h"

#include "jobs/ToolJob.h"

#include <QString>

class VisaDevice;

/// The instrument that a job works with: an open device of the caller, which isn't owned and stays
/// open, or else a VISA resource that the job opens for itself and closes at its end.
struct InstrumentRef
{
    VisaDevice *device = nullptr;
    QString resource{};
    bool noVisa = false; ///< loads no library for the resource, so that it can't be opened
};

/// Base of the jobs that talk to one instrument. The window and the command line run the same ones.
class InstrumentJob : public ToolJob
{
    Q_OBJECT

public:
    /// What the instrument itself reported on a failure, with "; " between; empty if nothing.
    [[nodiscard]] const QString &reported() const { return m_reported; }

protected:
    /// `label` is the text for the progress.
    InstrumentJob(InstrumentRef instrument, QString label, QObject *parent = nullptr);

    [[nodiscard]] bool work() final;

    /// The work on the open device, whose progress and cancel are wired to the job.
    [[nodiscard]] virtual bool talk(VisaDevice &device) = 0;

    /// True if a command was done and left no error in the instrument's queue, which tells of what
    /// an instrument has refused without an answer; otherwise the reason is logged.
    [[nodiscard]] bool checked(VisaDevice &device, bool done);

    /// Reports why the instrument can't play a waveform. False, with the reason logged, if that is
    /// a reason to go no further.
    [[nodiscard]] bool mayPlay(const QStringList &problems, WaveformCheck check);

    /// Adds to what the instrument has reported.
    void noteReported(const QString &errors);

private:
    [[nodiscard]] bool talkTo(VisaDevice &device);

    InstrumentRef m_instrument;
    QString m_label;
    QString m_reported;
};
