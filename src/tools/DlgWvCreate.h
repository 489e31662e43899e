// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "toolframe/DlgBase.h"

#include "jobs/CreateRequest.h"

#include <memory>

class CreateTypePages;
class QtNumericEdit;

namespace Ui {
class DlgWvCreate;
}

/// The wizard that makes a signal: kind, its settings, preview, output file, status.
class DlgWvCreate : public DlgBase
{
    Q_OBJECT

public:
    explicit DlgWvCreate(QWidget *parent = nullptr);
    ~DlgWvCreate() override;

    [[nodiscard]] bool startModule(const QString &path) override;
    [[nodiscard]] QString moduleName() const override;
    [[nodiscard]] QString menuPath() const override;
    [[nodiscard]] bool selectionAllowed(bool isFile) const override;
    [[nodiscard]] bool extensionAllowed(const QString &upperCaseExtension) const override;
    void writeSettings(QSettings &settings) override;
    void readSettings(QSettings &settings) override;

    /// What the fields ask for.
    [[nodiscard]] CreateRequest options() const;

private slots:
    void slot_waveform(int index);
    void slot_first();
    void slot_next_type();
    void slot_next_preview();
    void slot_next_outfile();
    void slot_prev4();
    void slot_outfile();
    void slot_create();
    void slot_scaling();
    void slot_crf(int state);
    void slot_over_enable(int state);
    void slot_next();
    void slot_prev();

private:
    void setUpResult(QtNumericEdit &edit, const QString &name, const QString &unit, double max);
    [[nodiscard]] CreateKind kind() const;
    [[nodiscard]] int typePage() const;
    [[nodiscard]] int subKind() const;
    [[nodiscard]] bool preview();
    void showPage(int page);

    std::unique_ptr<Ui::DlgWvCreate> m_ui;
    std::unique_ptr<CreateTypePages> m_pages;
};
