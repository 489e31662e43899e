// SPDX-License-Identifier: Apache-2.0
#include "SourceWizard.h"

#include "display/QtNumericEdit.h"
#include "jobs/EditJob.h"
#include "jobs/LoadJob.h"

#include <QTimer>

#include <utility>

SourceWizard::SourceWizard(Frame frame, QString suffix, QWidget *parent)
    : EditWizard(std::move(frame), std::move(suffix), parent)
    , m_preview(
          [this] {
              if (m_source) {
                  makePreview();
              }
          },
          [this] { cancelPreview(); })
{
}

int SourceWizard::pageAfter(int page)
{
    if (m_preview.isRunning()) {
        return page;
    }
    if (page > 0) {
        return EditWizard::pageAfter(page);
    }
    // Always anew: the file may have been written since.
    auto loaded = std::make_unique<SourceWaveform>();
    LoadJob job(sourceFile(), *loaded);
    if (runInPlace(job) != JobOutcome::Finished) {
        return page;
    }
    m_source = std::move(loaded);
    if (!sourceRead()) {
        return page;
    }
    requestPreview();
    return page + 1;
}

void SourceWizard::giveSource(EditJob &job) const
{
    if (m_source) {
        job.useSource(*m_source);
    }
}

void SourceWizard::resetClock(OutputPage &page)
{
    page.clockRate().setVal(sourceClockHz());
    m_shownClockHz = page.clockRate().getVal();
}

std::optional<double> SourceWizard::wantedClockHz(const OutputPage &page) const
{
    const double shown = page.clockRate().getVal();
    return shown == m_shownClockHz ? std::nullopt : std::optional(shown);
}

/// A waveform can fill gigabytes of temporary files; they go when nobody looks at it any more.
void SourceWizard::done(int result)
{
    if (m_preview.isRunning()) {
        cancelPreview();
        QTimer::singleShot(0, this, [this, result] { done(result); });
        return;
    }
    EditWizard::done(result);
    sourceReleased();
    m_source.reset();
    showPage(0);
}
