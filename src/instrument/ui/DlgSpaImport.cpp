// SPDX-License-Identifier: Apache-2.0
#include "DlgSpaImport.h"

#include "SpaImportPages.h"

#include "display/CWidgetConstellation.h"
#include "display/CWidgetIQTrace.h"
#include "display/CWidgetSpectrum.h"
#include "display/QtNumericEdit.h"
#include "jobs/instrument/CaptureSaveJob.h"
#include "log/Tracer.h"
#include "toolframe/QtProgressWidget.h"
#include "toolframe/questions.h"
#include "toolframe/runjob.h"

#include <QApplication>
#include <QComboBox>
#include <QFileDialog>
#include <QFileInfo>
#include <QLabel>
#include <QPlainTextEdit>
#include <QPointer>
#include <QPushButton>
#include <QRadioButton>
#include <QSettings>
#include <QSignalBlocker>
#include <QTextEdit>

#include <algorithm>
#include <array>
#include <cmath>

namespace {

enum Page { SettingsPage, CapturePage, PreviewPage, OutputPage, StatusPage };

constexpr int PreviewSamples = 10240;
constexpr int SampleBytes = 8;

/// Keeps input from all windows but one, which stays usable while its work goes on.
class OthersDisabled
{
public:
    explicit OthersDisabled(const QWidget *exception)
    {
        const QList<QWidget *> windows = QApplication::topLevelWidgets();
        for (QWidget *window : windows) {
            if (window != exception && window->isVisible() && window->isEnabled()) {
                window->setEnabled(false);
                m_disabled.append(window);
            }
        }
    }
    ~OthersDisabled()
    {
        for (const QPointer<QWidget> &window : std::as_const(m_disabled)) {
            if (window) {
                window->setEnabled(true);
            }
        }
    }
    OthersDisabled(const OthersDisabled &) = delete;
    OthersDisabled &operator=(const OthersDisabled &) = delete;

private:
    QList<QPointer<QWidget>> m_disabled;
};

} // namespace

DlgSpaImport::DlgSpaImport(QWidget *parent)
    : ToolWizard({.settingsGroup = "SpaImport",
                  .position = {200, 140},
                  .size = {620, 500},
                  .abortedText = "Creation aborted"},
                 parent)
    , m_ui(std::make_unique<SpaImportPages>(*this))
{
    setWindowTitle("[*] - Import From Analyzer");
    connect(m_ui->pb_capture, &QPushButton::clicked, this, &DlgSpaImport::captureData);
    connect(m_ui->pb_abort, &QPushButton::clicked, this, &DlgSpaImport::abortCapture);
    connect(m_ui->pb_outfile, &QPushButton::clicked, this, &DlgSpaImport::slot_outfile);
    for (const QRadioButton *button : {m_ui->rb_samples, m_ui->rb_time}) {
        connect(button, &QRadioButton::clicked, this, &DlgSpaImport::slot_samplemode);
    }
    for (const QtNumericEdit *field : {m_ui->le_samplerate, m_ui->le_samples, m_ui->le_time}) {
        connect(field, &QtNumericEdit::valueUpdated, this, &DlgSpaImport::slot_updatesettings);
    }
    for (const QRadioButton *button : {m_ui->rb_sc_no, m_ui->rb_sc_down, m_ui->rb_sc_auto}) {
        connect(button, &QRadioButton::clicked, this, &DlgSpaImport::slot_scaling);
    }
    setUpWizard();
    slot_samplemode();
}

DlgSpaImport::~DlgSpaImport() = default;

bool DlgSpaImport::startModule(const QString &path)
{
    if (m_job != nullptr || m_capture) {
        return true; // as it stands: a record is not thrown away unasked
    }
    if (!path.isEmpty()) {
        const QString folder = path.endsWith('/') ? path : QFileInfo(path).path() + '/';
        const QString name = QFileInfo(m_ui->le_outfile->text()).fileName();
        m_ui->le_outfile->setText(folder + (name.isEmpty() ? "imported.wv" : name));
    }
    showPage(SettingsPage);
    return true;
}

void DlgSpaImport::instrumentsUpdated(const QList<InstrConfigEntry> &instruments)
{
    const QString chosen = m_ui->cb_device->currentData().toString();
    m_ui->cb_device->clear();
    for (const InstrConfigEntry &entry : instruments) {
        if (entry.enabled && entry.model.startsWith("PAX-6")) {
            m_ui->cb_device->addItem(entry.model + ", " + entry.serial, entry.resource);
        }
    }
    m_ui->cb_device->setCurrentIndex(std::max(m_ui->cb_device->findData(chosen), 0));
    updateButtons();
}

CaptureRequest DlgSpaImport::request() const
{
    CaptureRequest request;
    request.resource = m_ui->cb_device->currentData().toString();
    request.input = static_cast<CaptureRequest::Input>(m_ui->cb_input->currentIndex());
    request.sampleRateHz = m_ui->le_samplerate->getVal();
    request.samples = static_cast<int>(m_ui->le_samples->getValInt());
    request.rbwHz = m_ui->le_rbw->getVal();
    request.pretriggerSamples = static_cast<int>(m_ui->le_pretrigger->getValInt());
    request.trigger = static_cast<CaptureRequest::Trigger>(m_ui->cb_triggersource->currentIndex());
    request.slope = static_cast<CaptureRequest::Slope>(m_ui->cb_triggerslope->currentIndex());
    request.triggerLevelDbm = m_ui->le_triggerlevel->getVal();
    return request;
}

void DlgSpaImport::slot_samplemode()
{
    const bool timeDecides = m_ui->rb_time->isChecked();
    m_ui->le_time->setEnabled(timeDecides);
    m_ui->le_samples->setEnabled(!timeDecides);
    slot_updatesettings(0);
}

void DlgSpaImport::slot_updatesettings(double /*value*/)
{
    const double rateHz = m_ui->le_samplerate->getVal();
    const QSignalBlocker samplesBlocker(m_ui->le_samples);
    const QSignalBlocker timeBlocker(m_ui->le_time);
    if (m_ui->rb_time->isChecked()) {
        m_ui->le_samples->setVal(std::round(rateHz * m_ui->le_time->getVal()));
    } else {
        m_ui->le_time->setVal(m_ui->le_samples->getVal() / rateHz);
    }
}

bool DlgSpaImport::isComplete(int page) const
{
    if (m_job != nullptr) {
        return false;
    }
    return page == SettingsPage ? m_ui->cb_device->count() > 0 : m_capture != nullptr;
}

void DlgSpaImport::pageShown(int page)
{
    if (page == PreviewPage) {
        createPreview();
    } else if (page == CapturePage && !m_capture) {
        m_ui->pb_capture->setFocus(Qt::TabFocusReason);
        m_ui->pb_capture->setDefault(true);
    }
}

void DlgSpaImport::showCapturing(bool capturing)
{
    updateButtons();
    m_ui->pb_prev->setEnabled(!capturing);
    m_ui->pb_capture->setEnabled(!capturing);
    m_ui->pb_abort->setEnabled(capturing);
    m_ui->w_progress->setValue(-1);
    m_ui->w_progress->setVisible(capturing);
    (capturing ? m_ui->pb_abort : m_capture ? m_ui->pb_next : m_ui->pb_capture)->setFocus();
}

void DlgSpaImport::captureData()
{
    if (m_job != nullptr) {
        return;
    }
    m_capture.reset();
    m_ui->te_capture->clear();
    setWindowModified(false);
    {
        CaptureJob job(request());
        connect(&job, &ToolJob::report, this,
                [this](const ReportLine &line) { appendReport(*m_ui->te_capture, line); });
        connect(&job, &ToolJob::ProgressUpdate, this, &DlgSpaImport::updtProgress);
        m_job = &job;
        showCapturing(true);
        const OthersDisabled alone(this);
        (void)job.run();
        m_capture = job.takeCapture();
        m_job = nullptr;
    }
    if (m_capture) {
        // A waveform plays at the rate at which it was recorded.
        m_ui->le_clockrate->setVal(m_capture->clockHz);
        m_ui->te_comment->setPlainText(m_capture->comment);
        setWindowModified(true);
    }
    showCapturing(false);
}

void DlgSpaImport::abortCapture()
{
    if (m_job != nullptr) {
        m_job->cancel();
    }
}

void DlgSpaImport::updtProgress(int percent)
{
    m_ui->w_progress->setValue(percent);
}

int DlgSpaImport::scaling() const
{
    const std::array<const QRadioButton *, 3> buttons{m_ui->rb_sc_no, m_ui->rb_sc_down,
                                                      m_ui->rb_sc_auto};
    const auto checked = std::find_if(buttons.begin(), buttons.end(),
                                      [](const QRadioButton *b) { return b->isChecked(); });
    return static_cast<int>(checked - buttons.begin());
}

void DlgSpaImport::slot_scaling()
{
    createPreview();
}

void DlgSpaImport::createPreview()
{
    if (!m_capture) {
        Tracer::Trace(Tracer::Error, "No data available for preview.");
        return;
    }
    BufferedIO &stream = *m_capture->data.stream();
    const int count = std::min(m_capture->samples, PreviewSamples);
    std::vector<float> values(static_cast<std::size_t>(count) * 2);
    if (!stream.checkHeader(BufferedIO::DataHeader) ||
        !stream.readBytes(count * SampleBytes, reinterpret_cast<char *>(values.data()))) {
        Tracer::Trace(Tracer::Error, "Cannot read from temporary data buffer.");
        return;
    }
    if (Tracer::isEnabled(Tracer::Debug)) {
        Tracer::Trace(Tracer::Debug, QString("%1 samples read from buffer.").arg(count));
    }
    QList<IqSample> samples;
    samples.reserve(count);
    for (std::size_t i = 0; i < values.size(); i += 2) {
        samples.append({values[i], values[i + 1]});
    }
    samples = scaleData(scaling(), samples);
    m_ui->l_preview->setText(
        QString("Showing %1 of %2 Samples").arg(count).arg(m_capture->samples));
    m_ui->w_iq->setClock(m_capture->clockHz);
    m_ui->w_spectrum->setClock(m_capture->clockHz);
    m_ui->w_iq->setData(samples);
    m_ui->w_spectrum->setData(samples);
    m_ui->w_constellation->setData(samples);
}

QList<IqSample> DlgSpaImport::scaleData(int mode, QList<IqSample> samples) const
{
    // The stream may have been scaled by an earlier run.
    const double peak = m_capture->peak / m_capture->gain;
    const bool divides = mode == 1 ? peak > 1 : mode == 2 && peak != 0;
    const double factor = (divides ? 1 / peak : 1) / m_capture->gain;
    for (IqSample &sample : samples) {
        sample = {sample.i * factor, sample.q * factor};
        if (mode == 0) {
            sample = {std::clamp(sample.i, -1.0, 1.0), std::clamp(sample.q, -1.0, 1.0)};
        }
    }
    return samples;
}

void DlgSpaImport::slot_outfile()
{
    QString present = m_ui->le_outfile->text();
    if (present.isEmpty() || QFileInfo(present).isDir()) {
        present = QFileInfo(present + "/").path() + "/imported.wv";
    }
    const QString path =
        QFileDialog::getSaveFileName(this, "Select waveform file", present, "Waveform File (*.wv)",
                                     nullptr, QFileDialog::DontConfirmOverwrite);
    if (!path.isEmpty()) {
        Tracer::Trace(Tracer::Information, QString("User selected path: '%1'").arg(path));
        m_ui->le_outfile->setText(path);
    }
}

std::unique_ptr<ToolJob> DlgSpaImport::makeJob() const
{
    return std::make_unique<CaptureSaveJob>(*m_capture, outputOptions(),
                                            m_ui->le_clockrate->getVal(),
                                            static_cast<ImportScaling>(scaling()));
}

void DlgSpaImport::jobEnded(JobOutcome outcome)
{
    if (outcome == JobOutcome::Finished) {
        setWindowModified(false);
    }
}

void DlgSpaImport::reject()
{
    if (m_job != nullptr) {
        abortCapture();
        return;
    }
    if (isWindowModified() && askYesNo(this, "Spectrum Analyzer Import",
                                       "Data was captured from the Spectrum Analyzer.\n"
                                       "Do you want to save your changes?")) {
        showPage(OutputPage);
        return;
    }
    m_capture.reset();
    m_ui->te_capture->clear();
    setWindowModified(false);
    showPage(SettingsPage);
    ToolWizard::reject();
}

void DlgSpaImport::writeFields(QSettings &settings) const
{
    settings.setValue("input", m_ui->cb_input->currentIndex());
    settings.setValue("samplerate", m_ui->le_samplerate->getVal());
    settings.setValue("samples", m_ui->le_samples->getValInt());
    settings.setValue("rbw", m_ui->le_rbw->getVal());
    settings.setValue("pretrigger", m_ui->le_pretrigger->getValInt());
    settings.setValue("trgsrc", m_ui->cb_triggersource->currentIndex());
    settings.setValue("trgslope", m_ui->cb_triggerslope->currentIndex());
    settings.setValue("trglevel", m_ui->le_triggerlevel->getVal());
    settings.setValue("scaling", 1 << scaling());
    settings.setValue("outfile", m_ui->le_outfile->text());
    settings.setValue("comment", m_ui->te_comment->toPlainText());
    settings.setValue("copyright", m_ui->le_copyright->text());
    settings.setValue("clock", m_ui->le_clockrate->getVal());
}

void DlgSpaImport::readFields(const QSettings &settings)
{
    const auto readChoice = [&](const char *key, QComboBox *box) {
        box->setCurrentIndex(std::clamp(settings.value(key, "0").toInt(), 0, box->count() - 1));
    };
    const auto readNumber = [&](const char *key, const QVariant &start, QtNumericEdit *field) {
        field->setVal(settings.value(key, start).toDouble());
    };
    readChoice("input", m_ui->cb_input);
    readNumber("samplerate", "1e6", m_ui->le_samplerate);
    readNumber("samples", "32768", m_ui->le_samples);
    readNumber("rbw", "10e6", m_ui->le_rbw);
    readNumber("pretrigger", "0", m_ui->le_pretrigger);
    readChoice("trgsrc", m_ui->cb_triggersource);
    readChoice("trgslope", m_ui->cb_triggerslope);
    readNumber("trglevel", "-20.0", m_ui->le_triggerlevel);
    const int bits = settings.value("scaling", 1 << static_cast<int>(ImportScaling::Auto)).toInt();
    m_ui->rb_sc_no->setChecked((bits & 1) != 0);
    m_ui->rb_sc_down->setChecked((bits & 2) != 0);
    m_ui->rb_sc_auto->setChecked((bits & 4) != 0);
    m_ui->le_outfile->setText(settings.value("outfile").toString());
    m_ui->te_comment->setPlainText(settings.value("comment").toString());
    m_ui->le_copyright->setText(settings.value("copyright").toString());
    readNumber("clock", m_ui->le_clockrate->getVal(), m_ui->le_clockrate);
    slot_samplemode();
}
