// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "SourceWizard.h"

#include "jobs/FilterJob.h"
#include "jobs/FilterPreview.h"

#include <memory>

namespace Ui {
class DlgFilter;
}

/// Filters a waveform at its length: source file, filter with the spectra before and after, output
/// file, status, a page each.
class DlgFilter : public SourceWizard
{
    Q_OBJECT

public:
    explicit DlgFilter(QWidget *parent = nullptr);
    ~DlgFilter() override;

    /// What the fields ask for.
    [[nodiscard]] FilterRequest options() const;

protected:
    [[nodiscard]] std::unique_ptr<ToolJob> makeJob() const override;
    [[nodiscard]] bool sourceRead() override;
    void sourceReleased() override;
    void makePreview() override;
    void cancelPreview() override;
    void writeFields(QSettings &settings) const override;
    void readFields(const QSettings &settings) override;

private slots:
    void slot_ftype(int index);
    void slot_createpreview(double value);
    void slot_createpreview(int index);

private:
    void setUpFields();
    [[nodiscard]] FilterKind kind() const;

    std::unique_ptr<Ui::DlgFilter> m_ui;
    FilterPreview m_filterPreview;
};
