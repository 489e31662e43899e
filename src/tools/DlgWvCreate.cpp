// SPDX-License-Identifier: Apache-2.0
#include "DlgWvCreate.h"

#include "CreateTypePages.h"
#include "toolpages.h"
#include "ui_DlgWvCreate.h"

#include "jobs/CreateJob.h"
#include "log/Tracer.h"
#include "toolframe/questions.h"
#include "toolframe/runjob.h"
#include "toolframe/windowplace.h"

#include <QDir>
#include <QFileInfo>
#include <QSettings>

#include <cmath>

namespace {

/// Pages of the wizard, by their index on the stack. Those of the types lie between.
enum Page {
    WaveformPage = 0,
    FirstTypePage = 1,
    PreviewPage = 10,
    OutputPage = 11,
    StatusPage = 12
};

/// The entries of the first choice, in their order, with the variants that each offers.
struct Waveform
{
    const char *text;
    CreateKind kind;
    QStringList variants;
};

const QList<Waveform> &waveforms()
{
    static const QList<Waveform> list{
        {"Function", CreateKind::Function, {"Sine", "Square", "Triangular", "Sawtooth"}},
        {"AM",
         CreateKind::Am,
         {"Regular", "LSB", "USB", "LSB+C", "USB+C", "LSB+USB", "2-Tone", "2-Tone w/o C"}},
        {"PM", CreateKind::Pm, {}},
        {"FM", CreateKind::Fm, {"Single Tone", "Two Tone"}},
        {"FM Sweep", CreateKind::Sweep, {"Linear", "Sine", "Tringular"}},
        {"Multi Carrier", CreateKind::MultiCarrier, {}},
        {"Pulse", CreateKind::Pulse, {"Single", "Chirp"}},
        {"Noise", CreateKind::Noise, {"White", "Pink 1/f", "Brown 1/f^2"}},
    };
    return list;
}

constexpr int chirpData = static_cast<int>(PulseKind::Chirp);
constexpr double settingsVersion = 1.0;
constexpr int shortWaveform = 512;

} // namespace

DlgWvCreate::DlgWvCreate(QWidget *parent)
    : DlgBase(parent)
    , m_ui(std::make_unique<Ui::DlgWvCreate>())
{
    m_ui->setupUi(this);
    m_pages = std::make_unique<CreateTypePages>(*m_ui);
    setUpResult(*m_ui->le_samples, tr("Number of Samples"), {}, 1e6);
    setUpResult(*m_ui->le_arbclock, tr("ARB clock rate"), "Hz", 6e8);
    setUpResult(*m_ui->le_peak, tr("Peak Vector"), {}, 100);
    setUpResult(*m_ui->le_crf, tr("Peak/RMS"), "dB", 100);
    m_ui->le_samples->setScaled(false);
    m_ui->le_crf->setPrecision(2);
    m_ui->w_iq->setView(0);
    m_ui->w_spectrum->setView(0);

    for (const Waveform &waveform : waveforms()) {
        m_ui->cb_waveform->addItem(waveform.text);
    }
    connect(m_ui->cb_waveform, &QComboBox::currentIndexChanged, this, &DlgWvCreate::slot_waveform);
    connect(&m_pages->oversamplingBox(), &QCheckBox::stateChanged, this,
            &DlgWvCreate::slot_over_enable);
    connect(m_ui->rb_sc_auto, &QRadioButton::clicked, this, &DlgWvCreate::slot_scaling);
    connect(m_ui->rb_sc_no, &QRadioButton::clicked, this, &DlgWvCreate::slot_scaling);
    connect(m_ui->cb_zerocrf, &QCheckBox::stateChanged, this, &DlgWvCreate::slot_crf);
    connect(m_ui->pb_outfile, &QPushButton::clicked, this, &DlgWvCreate::slot_outfile);
    connect(m_ui->pb_next, &QPushButton::clicked, this, &DlgWvCreate::slot_next);
    connect(m_ui->pb_prev, &QPushButton::clicked, this, &DlgWvCreate::slot_prev);
    connect(m_ui->cb_close, &QPushButton::clicked, this, &DlgWvCreate::reject);
    m_ui->le_outfile->setText(QDir::homePath() + "/NewSignal.wv");
    slot_waveform(0);
    slot_over_enable(m_pages->oversamplingBox().checkState());
    showPage(WaveformPage);
}

DlgWvCreate::~DlgWvCreate() = default;

void DlgWvCreate::setUpResult(QtNumericEdit &edit, const QString &name, const QString &unit,
                              double max)
{
    edit.setName(name);
    edit.setUnit(unit);
    edit.setScaled(unit == "Hz");
    edit.setMax(max);
}

bool DlgWvCreate::startModule(const QString &path)
{
    // A name in the selection is taken over; a folder keeps the name and changes the place.
    const QFileInfo current(m_ui->le_outfile->text());
    if (path.endsWith('/')) {
        m_ui->le_outfile->setText(path + current.fileName());
    } else if (!path.isEmpty()) {
        m_ui->le_outfile->setText(QFileInfo(path).path() + '/' +
                                  QFileInfo(path).completeBaseName() + ".wv");
    }
    showPage(WaveformPage);
    return true;
}

QString DlgWvCreate::moduleName() const
{
    return "Create Signal";
}

QString DlgWvCreate::menuPath() const
{
    return "/File/Create";
}

bool DlgWvCreate::selectionAllowed(bool) const
{
    return true;
}

bool DlgWvCreate::extensionAllowed(const QString &) const
{
    return true;
}

void DlgWvCreate::writeSettings(QSettings &settings)
{
    settings.beginGroup("WvCreate");
    writeWindowPlace(settings, *this);
    settings.setValue("ver", settingsVersion);
    m_pages->writeSettings(settings);
    settings.setValue("wv.main", m_ui->cb_waveform->currentIndex());
    settings.setValue("wv.sub", m_ui->cb_wtype->currentIndex());
    settings.setValue("outfile", m_ui->le_outfile->text());
    settings.setValue("comment", m_ui->te_comment->toPlainText());
    settings.setValue("copyright", m_ui->le_copyright->text());
    settings.endGroup();
}

void DlgWvCreate::readSettings(QSettings &settings)
{
    settings.beginGroup("WvCreate");
    readWindowPlace(settings, *this, {180, 120}, {820, 560});
    if (settings.value("ver", 0.0).toDouble() >= settingsVersion) {
        m_pages->readSettings(settings);
        readChoice(settings, "wv.main", *m_ui->cb_waveform);
        readChoice(settings, "wv.sub", *m_ui->cb_wtype);
        const QString output = settings.value("outfile").toString();
        if (!output.isEmpty()) {
            m_ui->le_outfile->setText(output);
        }
        m_ui->te_comment->setPlainText(settings.value("comment").toString());
        m_ui->le_copyright->setText(settings.value("copyright").toString());
    }
    settings.endGroup();
}

CreateKind DlgWvCreate::kind() const
{
    const CreateKind chosen = waveforms().at(m_ui->cb_waveform->currentIndex()).kind;
    return chosen == CreateKind::Pulse && subKind() == chirpData ? CreateKind::Chirp : chosen;
}

int DlgWvCreate::subKind() const
{
    return m_ui->cb_wtype->currentData().toInt();
}

int DlgWvCreate::typePage() const
{
    return FirstTypePage + static_cast<int>(kind());
}

CreateRequest DlgWvCreate::options() const
{
    CreateChoices choices = m_pages->choices(kind());
    choices.subKind = subKind();
    CreateRequest request;
    request.output = {m_ui->le_outfile->text(), m_ui->te_comment->toPlainText(),
                      m_ui->le_copyright->text()};
    request.signal = makeSettings(
        kind(), choices, [this](const CreateField &field) { return m_pages->value(field); });
    request.minClockHz = m_ui->le_minclock->getVal();
    request.maxClockHz = m_ui->le_maxclock->getVal();
    request.clockHz = m_ui->le_clockrate->getVal();
    request.autoScaling = m_ui->rb_sc_auto->isChecked();
    request.zeroCrest = m_ui->cb_zerocrf->isChecked();
    return request;
}

void DlgWvCreate::slot_waveform(int index)
{
    const Waveform &waveform = waveforms().at(index);
    m_ui->cb_wtype->clear();
    for (int number = 0; number < waveform.variants.size(); ++number) {
        const bool isChirp = waveform.kind == CreateKind::Pulse && number == 1;
        m_ui->cb_wtype->addItem(waveform.variants.at(number), isChirp ? chirpData : number);
    }
    m_ui->cb_wtype->setVisible(!waveform.variants.isEmpty());
    m_ui->t_cb_wtype->setVisible(!waveform.variants.isEmpty());
}

void DlgWvCreate::slot_first()
{
    showPage(WaveformPage);
}

void DlgWvCreate::slot_next_type()
{
    const bool twoToneFm = subKind() == static_cast<int>(FmKind::TwoTone);
    const bool twoToneAm = subKind() >= static_cast<int>(AmKind::TwoTone);
    m_pages->setEnabled(createfields::fmFrequency2, twoToneFm);
    m_pages->setEnabled(createfields::fmDeviation2, twoToneFm);
    m_pages->setEnabled(createfields::amFrequency2, twoToneAm);
    m_pages->setEnabled(createfields::amDepth2, twoToneAm);
    showPage(typePage());
}

void DlgWvCreate::slot_next_preview()
{
    if (preview()) {
        showPage(PreviewPage);
    }
}

bool DlgWvCreate::preview()
{
    m_ui->w_iq->clear();
    m_ui->w_spectrum->clear();
    m_ui->w_constellation->clear();
    SignalPreviewJob job(options());
    if (runJob(job, this, nullptr) != JobOutcome::Finished) {
        return false;
    }
    const SignalFacts &facts = job.facts();
    const std::vector<double> &values = job.samples();
    IqList samples;
    samples.reserve(static_cast<qsizetype>(values.size() / 2));
    for (size_t i = 0; i + 1 < values.size(); i += 2) {
        samples.append({values[i], values[i + 1]});
    }
    m_ui->w_iq->setClock(facts.clockHz);
    m_ui->w_iq->setData(samples);
    m_ui->w_spectrum->setClock(facts.clockHz);
    m_ui->w_spectrum->setData(samples);
    m_ui->w_constellation->setData(samples);
    m_ui->l_warn->setVisible(facts.samples < shortWaveform);
    m_ui->le_samples->setVal(facts.samples);
    m_ui->le_arbclock->setVal(facts.clockHz);
    m_ui->le_peak->setVal(facts.peak);
    m_ui->le_crf->setVal(facts.rms > 0 ? 20 * std::log10(facts.peak / facts.rms) : 0.0);
    m_ui->le_clockrate->setVal(facts.clockHz);
    return true;
}

void DlgWvCreate::slot_scaling()
{
    if (m_ui->sw_assist->currentIndex() == PreviewPage && !preview()) {
        showPage(typePage());
    }
}

void DlgWvCreate::slot_crf(int state)
{
    // The file will state 0 dB; the measured value would mislead.
    m_ui->le_crf->setEnabled(state == Qt::Unchecked);
}

void DlgWvCreate::slot_over_enable(int state)
{
    m_pages->setEnabled(createfields::oversampling, state != Qt::Unchecked);
}

void DlgWvCreate::slot_next_outfile()
{
    showPage(OutputPage);
}

void DlgWvCreate::slot_prev4()
{
    showPage(PreviewPage);
}

void DlgWvCreate::slot_outfile()
{
    chooseTargetFile(this, *m_ui->le_outfile);
}

void DlgWvCreate::slot_next()
{
    switch (m_ui->sw_assist->currentIndex()) {
    case WaveformPage:
        slot_next_type();
        break;
    case PreviewPage:
        slot_next_outfile();
        break;
    case OutputPage:
        slot_create();
        break;
    default:
        slot_next_preview();
        break;
    }
}

void DlgWvCreate::slot_prev()
{
    switch (m_ui->sw_assist->currentIndex()) {
    case PreviewPage:
        showPage(typePage());
        break;
    case OutputPage:
        slot_prev4();
        break;
    case StatusPage:
        showPage(OutputPage);
        break;
    default:
        slot_first();
        break;
    }
}

void DlgWvCreate::showPage(int page)
{
    m_ui->sw_assist->setCurrentIndex(page);
    m_ui->pb_prev->setEnabled(page != WaveformPage);
    m_ui->pb_next->setVisible(page != StatusPage);
    m_ui->pb_next->setText(page == OutputPage ? tr("&Run") : tr("&Next"));
    m_ui->pb_next->setDefault(page != StatusPage);
    m_ui->cb_close->setDefault(page == StatusPage);
}

void DlgWvCreate::slot_create()
{
    m_ui->te_result->clear();
    showPage(StatusPage);
    const QString fileName = m_ui->le_outfile->text();
    if (!fileName.isEmpty() && !confirmOverwrite(this, fileName)) {
        appendReport(*m_ui->te_result, ReportLine::failure("Creation aborted"));
        return;
    }
    CreateJob job(options());
    m_ui->pb_prev->setEnabled(false);
    // The outcome stands in the report.
    static_cast<void>(runJob(job, this, m_ui->te_result));
    m_ui->pb_prev->setEnabled(true);
}
