// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "toolframe/ToolWizard.h"

#include "jobs/CreateRequest.h"

#include <memory>

class CreateTypePages;
class QtNumericEdit;
class SignalSketch;

namespace Ui {
class DlgWvCreate;
}

/// The wizard that makes a signal: kind, its settings, preview, output file, status.
class DlgWvCreate : public ToolWizard
{
    Q_OBJECT

public:
    explicit DlgWvCreate(QWidget *parent = nullptr);
    ~DlgWvCreate() override;

    [[nodiscard]] bool startModule(const QString &path) override;

    /// What the fields ask for.
    [[nodiscard]] CreateRequest options() const;

protected:
    [[nodiscard]] std::unique_ptr<ToolJob> makeJob() const override;
    [[nodiscard]] int pageAfter(int page) override;
    [[nodiscard]] int pageBefore(int page) override;
    void pageShown(int page) override;
    void writeFields(QSettings &settings) const override;
    void readFields(const QSettings &settings) override;

private slots:
    void slot_waveform(int index);
    void slot_scaling();
    void slot_crf(int state);
    void slot_over_enable(int state);

private:
    void setUpResult(QtNumericEdit &edit, const QString &name, const QString &unit, double max);
    [[nodiscard]] CreateKind kind() const;
    [[nodiscard]] int typePage() const;
    [[nodiscard]] int subKind() const;
    void enableSecondTone();
    [[nodiscard]] bool preview();
    void addSketch();

    std::unique_ptr<Ui::DlgWvCreate> m_ui;
    std::unique_ptr<CreateTypePages> m_pages;
    SignalSketch *m_sketch = nullptr; ///< on the page of the kind that is set up
    unsigned m_seed = 0;              ///< of the random values that the preview shows
};
