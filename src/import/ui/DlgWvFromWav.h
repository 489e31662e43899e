// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "ImportWizard.h"

class QLabel;

/// The wizard that imports a WAVE file: file with its header, preview, output file, status.
class DlgWvFromWav : public ImportWizard
{
    Q_OBJECT

public:
    explicit DlgWvFromWav(QWidget *parent = nullptr);

protected:
    [[nodiscard]] std::unique_ptr<ImportJob> makeImportJob() const override;
    void inputChanged() override;
    void previewMade(const ImportJob &job) override;
    [[nodiscard]] bool isComplete(int page) const override;

private:
    QtNumericEdit *m_dataClock = nullptr;
    QtNumericEdit *m_samples = nullptr;
    QtNumericEdit *m_playTime = nullptr;
    QLabel *m_error = nullptr;
    bool m_headerValid = false;
};
