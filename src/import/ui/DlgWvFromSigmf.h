// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "ImportWizard.h"

class QLabel;

/// The wizard that imports a SigMF recording: file with its metadata, preview, output file, status.
class DlgWvFromSigmf : public ImportWizard
{
    Q_OBJECT

public:
    explicit DlgWvFromSigmf(QWidget *parent = nullptr);

protected:
    [[nodiscard]] std::unique_ptr<ImportJob> makeImportJob() const override;
    void inputChanged() override;
    void previewMade(const ImportJob &job) override;
    [[nodiscard]] bool isComplete(int page) const override;

private:
    QtNumericEdit *m_sampleRate = nullptr;
    QtNumericEdit *m_samples = nullptr;
    QtNumericEdit *m_playTime = nullptr;
    QtNumericEdit *m_channel = nullptr;
    QLabel *m_type = nullptr;
    QLabel *m_error = nullptr;
    QString m_description;
    QString m_copyrightNote;
    bool m_isReadable = false;
};
