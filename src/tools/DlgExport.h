// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "toolframe/DlgBase.h"

#include "jobs/ExportJob.h"

class QComboBox;
class QLineEdit;
class QPushButton;
class QTextEdit;
class QtNumericEdit;

/// Writes a waveform, or a piece of it, for other programs; the suffix of the name tells the
/// format.
class DlgExport : public DlgBase
{
    Q_OBJECT

public:
    explicit DlgExport(QWidget *parent = nullptr);

    [[nodiscard]] bool startModule(const QString &path) override;
    void writeSettings(QSettings &settings) override;
    void readSettings(QSettings &settings) override;

    /// What the fields ask for.
    [[nodiscard]] ExportRequest options() const;

private:
    [[nodiscard]] static QtNumericEdit *sampleField(const char *name, const QString &title);
    void chooseTarget();
    void showTypes();
    void run();

    qint64 m_samples = 0;
    QLineEdit *m_source = nullptr;
    QLineEdit *m_target = nullptr;
    QComboBox *m_type = nullptr;
    QtNumericEdit *m_from = nullptr;
    QtNumericEdit *m_count = nullptr;
    QTextEdit *m_report = nullptr;
    QPushButton *m_run = nullptr;
};
