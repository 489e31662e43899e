// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "instrument/InstrConfigEntry.h"
#include "jobs/instrument/CaptureJob.h"
#include "toolframe/ToolWizard.h"
#include "view/IqSample.h"

#include <QList>

#include <memory>

struct SpaImportPages;

/// Has a spectrum analyzer record a piece of its signal and makes a waveform of it: settings,
/// capture, preview, output file, status, a page each. The window is marked as modified while it
/// holds a record that was not saved.
///
/// A capture works in the GUI thread and lets the event loop run. All other windows of the program
/// take no input meanwhile; closing this one aborts the capture.
class DlgSpaImport : public ToolWizard
{
    Q_OBJECT

public:
    explicit DlgSpaImport(QWidget *parent = nullptr);
    ~DlgSpaImport() override;

    [[nodiscard]] bool startModule(const QString &path) override;

    /// Offers the enabled spectrum analyzers.
    void instrumentsUpdated(const QList<InstrConfigEntry> &instruments) override;

    /// What the fields of the first page ask for.
    [[nodiscard]] CaptureRequest request() const;

public slots:
    void slot_outfile();
    void slot_scaling();
    void captureData();
    void createPreview();
    void abortCapture();
    void slot_samplemode();
    void slot_updatesettings(double value);
    void updtProgress(int percent);

    /// Asks what becomes of a record that was not saved.
    void reject() override;

protected:
    [[nodiscard]] std::unique_ptr<ToolJob> makeJob() const override;
    [[nodiscard]] bool isComplete(int page) const override;
    void pageShown(int page) override;
    void jobEnded(JobOutcome outcome) override;
    void writeFields(QSettings &settings) const override;
    void readFields(const QSettings &settings) override;

private:
    [[nodiscard]] int scaling() const;
    [[nodiscard]] QList<IqSample> scaleData(int mode, QList<IqSample> samples) const;
    void showCapturing(bool capturing);

    std::unique_ptr<SpaImportPages> m_ui;
    std::unique_ptr<Capture> m_capture; ///< null while there are no data
    CaptureJob *m_job = nullptr;        ///< the running capture
};
