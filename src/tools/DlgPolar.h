// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "SourceWizard.h"

#include "jobs/PolarJob.h"

#include <memory>

namespace Ui {
class DlgPolar;
}

/// Splits a waveform into a phase and an amplitude waveform: source file, amplitude level with a
/// preview, output files, status, a page each.
class DlgPolar : public SourceWizard
{
    Q_OBJECT

public:
    explicit DlgPolar(QWidget *parent = nullptr);
    ~DlgPolar() override;

    /// What the fields ask for.
    [[nodiscard]] PolarRequest options() const;

protected:
    [[nodiscard]] std::unique_ptr<ToolJob> makeJob() const override;
    [[nodiscard]] QStringList outputFiles() const override;
    [[nodiscard]] bool isComplete(int page) const override;
    [[nodiscard]] bool sourceRead() override;
    void sourceChanged() override;
    void writeFields(QSettings &settings) const override;
    void readFields(const QSettings &settings) override;
    void sourceReleased() override;
    void makePreview() override;

private:
    void slot_levels();

    std::unique_ptr<Ui::DlgPolar> m_ui;
};
