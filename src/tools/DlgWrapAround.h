// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "SourceWizard.h"

#include "jobs/WrapJob.h"

#include <memory>
#include <optional>

namespace Ui {
class DlgWrapAround;
}

/// Shows the point where a waveform closes its loop and removes the step there: source file,
/// analysis, output file, status, a page each.
class DlgWrapAround : public SourceWizard
{
    Q_OBJECT

public:
    explicit DlgWrapAround(QWidget *parent = nullptr);
    ~DlgWrapAround() override;

    /// What the fields ask for.
    [[nodiscard]] WrapRequest options() const;

public slots:
    void createPreview();

protected:
    [[nodiscard]] std::unique_ptr<ToolJob> makeJob() const override;
    [[nodiscard]] bool isComplete(int page) const override;
    [[nodiscard]] bool sourceRead() override;
    void sourceReleased() override;
    void makePreview() override;
    void writeFields(QSettings &settings) const override;
    void readFields(const QSettings &settings) override;

private:
    void setUpFields();
    [[nodiscard]] bool readUncorrected(const WrapSettings &settings);
    void showJoint(const Joint &corrected);
    void showSteps(const Joint &corrected, const WrapSettings &settings);
    void showProblem(const QString &problem);

    /// The joint as the file has it, and where it was read.
    struct Uncorrected
    {
        qint64 start;
        qint64 end;
        Joint joint;
    };

    std::unique_ptr<Ui::DlgWrapAround> m_ui;
    std::optional<Uncorrected> m_uncorrected;
};
