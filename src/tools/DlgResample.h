// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "EditWizard.h"

#include "jobs/ResampleJob.h"

#include <memory>

namespace Ui {
class DlgResample;
}

/// Converts a waveform file to another clock rate or number of samples: source file, target,
/// output file, status, a page each.
class DlgResample : public EditWizard
{
    Q_OBJECT

public:
    explicit DlgResample(QWidget *parent = nullptr);
    ~DlgResample() override;

    /// What the fields ask for.
    [[nodiscard]] ResampleRequest options() const;

protected:
    [[nodiscard]] std::unique_ptr<ToolJob> makeJob() const override;
    [[nodiscard]] bool isComplete(int page) const override;
    void jobEnded(JobOutcome outcome) override;
    void sourceChanged() override;
    void writeFields(QSettings &settings) const override;
    void readFields(const QSettings &settings) override;

private slots:
    void slot_mode();
    void slot_updatesettings();

private:
    [[nodiscard]] ResampleTarget target() const;

    std::unique_ptr<Ui::DlgResample> m_ui;
};
