// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "ImportWizard.h"

#include "import/dataguess.h"

class QCheckBox;
class QComboBox;
class QTextEdit;

/// The wizard that imports numbers from text and raw binary files: input files, type and format,
/// preview, output file, status.
class DlgWvFromData : public ImportWizard
{
    Q_OBJECT

public:
    explicit DlgWvFromData(QWidget *parent = nullptr);

    [[nodiscard]] bool startModule(const QString &path) override;

    /// What the fields ask for.
    [[nodiscard]] ImportPreset preset() const;
    void setPreset(const ImportPreset &preset);

protected:
    [[nodiscard]] std::unique_ptr<ImportJob> makeImportJob() const override;
    void inputChanged() override;
    void previewMade(const ImportJob &job) override;
    [[nodiscard]] bool isComplete(int page) const override;
    void writeFields(QSettings &settings) const override;
    void readFields(const QSettings &settings) override;

private slots:
    void slot_secin(int state);
    void slot_type();
    void slot_format(int index);
    void slot_Load();
    void slot_Save();

private:
    void addFilesPage();
    void addFormatPage();
    void fillPrecisions();
    void enableChoices();
    void showHead();
    [[nodiscard]] WvImportJob fillImportJob() const;

    QCheckBox *m_useSecond = nullptr;
    QLineEdit *m_second = nullptr;
    QRadioButton *m_text = nullptr;
    QRadioButton *m_binary = nullptr;
    QComboBox *m_format = nullptr;
    QComboBox *m_endianness = nullptr;
    QComboBox *m_precision = nullptr;
    QComboBox *m_signedness = nullptr;
    QTextEdit *m_head = nullptr;
    DataGuess m_guess;
};
