// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "toolframe/DlgBase.h"

#include <memory>

class CWidgetConstellation;
class CWidgetSpectrum;
class FiguresBox;
class QComboBox;
class QPushButton;
class QSplitter;
class SourceWaveform;
class ViewWindow;

namespace Ui {
class DlgView;
}

/// Looks at a waveform: a window of samples as trace, spectrum and constellation, with an overview
/// bar, zoom, playback and two cursors. Reads the file once; changes nothing.
class DlgView : public DlgBase
{
    Q_OBJECT

public:
    explicit DlgView(QWidget *parent = nullptr);
    ~DlgView() override;

    [[nodiscard]] bool startModule(const QString &path) override;
    void writeSettings(QSettings &settings) override;
    void readSettings(QSettings &settings) override;

    [[nodiscard]] const ViewWindow &window() const;

public slots:
    void slot_view_mode(int mode);
    void slot_spectrum_mode(int mode);
    /// The measuring cursor went to a sample of the waveform.
    void set_csr_data(qlonglong sample, double i, double q);
    /// Copies the measuring cursor to the reference cursor.
    void fix_ref_csr(bool checked);

protected:
    void done(int result) override;

private:
    void addPlots();
    void addSideColumn();
    void addSpectrumChoices();
    void applySpectrumChoices();
    void showFrequencyLimits();
    void enlarge(QWidget *plot);
    void showWindow();
    void showSpectrum();
    void showCursorSample();
    void clearCursorValues();
    void showDelta();
    void saveSelection();
    void showFile();
    [[nodiscard]] QString timeText(qint64 samples) const;
    void unload();

    std::unique_ptr<Ui::DlgView> m_ui;
    std::unique_ptr<SourceWaveform> m_source;
    CWidgetSpectrum *m_spectrum = nullptr;
    CWidgetConstellation *m_constellation = nullptr;
    QSplitter *m_plots = nullptr;
    FiguresBox *m_figures = nullptr;
    QPushButton *m_saveSelection = nullptr;
    QComboBox *m_average = nullptr;
    QComboBox *m_length = nullptr;
    QComboBox *m_window = nullptr;
};
