// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "EditWizard.h"
#include "PreviewRunner.h"
#include "editpages.h"

#include "jobs/SourceWaveform.h"

#include <memory>
#include <optional>

class EditJob;

/// Base of the editing tools with a preview: leaving the first page reads the whole source, which
/// is then kept, so that previews and runs need not read it again, until the dialog is closed.
class SourceWizard : public EditWizard
{
    Q_OBJECT

protected:
    SourceWizard(Frame frame, QString suffix, QWidget *parent);

    /// Makes the preview of what the fields say; from within a running one, that one again.
    void requestPreview() { m_preview.request(); }

    /// Shows what the fields would make of the source. It has been read.
    virtual void makePreview() = 0;

    /// Makes a running preview end soon.
    virtual void cancelPreview() {}

    /// The source has been read and the next page is about to come up. False keeps the first page;
    /// the reason has been logged.
    [[nodiscard]] virtual bool sourceRead() = 0;

    /// The source is about to be given back; what shows it must be cleared.
    virtual void sourceReleased() = 0;

    /// Null before the first page was left.
    [[nodiscard]] SourceWaveform *source() const { return m_source.get(); }

    /// Hands the source that was read over to a job.
    void giveSource(EditJob &job) const;

    /// Fills the clock rate of the output page from the source.
    void resetClock(OutputPage &page);

    /// The clock rate (Hz) that the output page asks for; nothing as long as the field shows the
    /// source's, which may lie outside what can be typed.
    [[nodiscard]] std::optional<double> wantedClockHz(const OutputPage &page) const;

    [[nodiscard]] int pageAfter(int page) override;
    void sourceChanged() override {}
    void done(int result) override;

private:
    PreviewRunner m_preview;
    std::unique_ptr<SourceWaveform> m_source;
    double m_shownClockHz = 0;
};
