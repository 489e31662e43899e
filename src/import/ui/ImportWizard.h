// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "toolframe/ToolWizard.h"

#include "jobs/ImportJob.h"

class CWidgetConstellation;
class ContentTree;
class CWidgetIQTrace;
class CWidgetSpectrum;
class QGridLayout;
class QLabel;
class QLineEdit;
class QPlainTextEdit;
class QRadioButton;
class QStackedWidget;
class QtNumericEdit;
class QVBoxLayout;

/// What the import wizards share: the frame, a page with preview and scaling, the output page and
/// the status page. A derived class makes its own pages first, then the shared ones, and calls
/// setUpWizard().
class ImportWizard : public ToolWizard
{
    Q_OBJECT

public:
    /// Takes the file as the input and names the output after it.
    [[nodiscard]] bool startModule(const QString &path) override;

protected:
    ImportWizard(const QString &settingsGroup, const QString &title, QWidget *parent);

    /// The job that the fields ask for; a preview is made by the same.
    [[nodiscard]] virtual std::unique_ptr<ImportJob> makeImportJob() const = 0;

    /// The input file has a new name: looks at it.
    virtual void inputChanged() = 0;

    /// A preview was made; its job tells what else the input says.
    virtual void previewMade(const ImportJob &job);

    /// Adds a page, whose layout is returned.
    [[nodiscard]] QVBoxLayout *addPage(const QString &name);

    /// Adds the first page with the input file alone; more goes below it in the layout returned.
    [[nodiscard]] QVBoxLayout *addInputPage(const QString &dialogTitle, const QString &filter);

    /// Adds the content of a file of several signals, which fills what is left of a page.
    [[nodiscard]] ContentTree *addContentTree(QVBoxLayout &column);

    /// Adds a row with "le_infile1" and its button to a grid.
    void addInputRow(QGridLayout &grid, const QString &dialogTitle, const QString &filter);

    /// Adds a labelled field to a grid, with a tool tip; the row is that behind the last one.
    static void addRow(QGridLayout &grid, const QString &label, QWidget *field,
                       const QString &toolTip = {});

    /// Adds a row with a number that the input tells.
    [[nodiscard]] static QtNumericEdit *addFact(QGridLayout &grid, const char *name,
                                                const QString &title, const QString &unit,
                                                double min, double max);

    /// Makes a file field and its button, which asks for a file to read, and returns the field.
    [[nodiscard]] QLineEdit *addFileRow(QGridLayout &grid, const QString &label,
                                        const QString &number, const QString &dialogTitle,
                                        const QString &filter);

    /// Adds the pages for preview and scaling, for the output and for the status.
    void addSharedPages();

    [[nodiscard]] ImportTarget target() const;
    [[nodiscard]] QString inputFile() const;
    [[nodiscard]] QtNumericEdit &clockEdit() { return *m_clock; }
    [[nodiscard]] QPlainTextEdit &commentEdit() { return *m_comment; }
    [[nodiscard]] QLineEdit &copyrightEdit() { return *m_copyright; }
    [[nodiscard]] QLineEdit &inputEdit() { return *m_input; }
    [[nodiscard]] QLineEdit &outputEdit() { return *m_output; }
    [[nodiscard]] ImportScaling scaling() const;
    void setScaling(ImportScaling scaling);
    void setPreviewSamples(qint64 samples) { m_previewSamples = samples; }

    /// Whether the proposals for clock and comment from this source are still to be made: each
    /// source proposes once, so that what the user types stays.
    [[nodiscard]] bool isNewSource(const QString &source);

    /// Holds a sample rate to the range of the clock field.
    void proposeClock(double clockHz);

    [[nodiscard]] std::unique_ptr<ToolJob> makeJob() const override;
    [[nodiscard]] int pageAfter(int page) override;
    void writeFields(QSettings &settings) const override;
    void readFields(const QSettings &settings) override;

private slots:
    void slot_infile1();
    void slot_outfile();
    void slot_scaling();

private:
    [[nodiscard]] int previewPage() const { return outputPage() - 1; }
    void addPreviewPage();
    void addOutputPage();
    void addStatusPage();
    [[nodiscard]] bool preview();

    QStackedWidget *m_stack = nullptr;
    QLineEdit *m_input = nullptr;
    CWidgetIQTrace *m_trace = nullptr;
    CWidgetSpectrum *m_spectrum = nullptr;
    CWidgetConstellation *m_constellation = nullptr;
    QLabel *m_info = nullptr;
    QRadioButton *m_noScaling = nullptr;
    QRadioButton *m_scaleDown = nullptr;
    QRadioButton *m_autoScaling = nullptr;
    QLineEdit *m_output = nullptr;
    QPlainTextEdit *m_comment = nullptr;
    QLineEdit *m_copyright = nullptr;
    QtNumericEdit *m_clock = nullptr;
    qint64 m_previewSamples = 10000;
    QString m_source;
    QString m_shownInput; ///< the name that inputChanged() has seen last
};
