// SPDX-License-Identifier: Apache-2.0
#include "DlgWvCreate.h"

#include "CreateTypePages.h"
#include "SignalSketch.h"
#include "ui_DlgWvCreate.h"

#include "jobs/CreateJob.h"
#include "toolframe/toolpages.h"

#include <QDir>
#include <QFileInfo>
#include <QSettings>

#include <cmath>
#include <random>

namespace {

/// Pages of the wizard, by their index on the stack. Those of the types lie between.
enum Page { WaveformPage = 0, FirstTypePage = 1, PreviewPage = 10, OutputPage = 11 };

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

constexpr int ChirpData = static_cast<int>(PulseKind::Chirp);
constexpr double SettingsVersion = 1.0;
constexpr int ShortWaveform = 512;

} // namespace

DlgWvCreate::DlgWvCreate(QWidget *parent)
    : ToolWizard({.settingsGroup = "WvCreate",
                  .position = {180, 120},
                  .size = {820, 560},
                  .abortedText = "Creation aborted"},
                 parent)
    , m_ui(std::make_unique<Ui::DlgWvCreate>())
{
    m_ui->setupUi(this);
    m_pages = std::make_unique<CreateTypePages>(*m_ui);
    setUpResult(*m_ui->le_samples, "Number of Samples", {}, 1e6);
    setUpResult(*m_ui->le_arbclock, "ARB clock rate", "Hz", 6e8);
    setUpResult(*m_ui->le_peak, "Peak Vector", {}, 100);
    setUpResult(*m_ui->le_crf, "Peak/RMS", "dB", 100);
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
    connect(m_ui->pb_outfile, &QPushButton::clicked, this,
            [this] { chooseTargetFile(this, *m_ui->le_outfile, waveformTitle()); });
    m_ui->le_outfile->setText(QDir::homePath() + "/NewSignal.wv");
    slot_waveform(0);
    slot_over_enable(m_pages->oversamplingBox().checkState());
    addSketch();
    setUpWizard();
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

void DlgWvCreate::writeFields(QSettings &settings) const
{
    settings.setValue("ver", SettingsVersion);
    m_pages->writeSettings(settings);
    settings.setValue("wv.main", m_ui->cb_waveform->currentIndex());
    settings.setValue("wv.sub", m_ui->cb_wtype->currentIndex());
    settings.setValue("outfile", m_ui->le_outfile->text());
    settings.setValue("comment", m_ui->te_comment->toPlainText());
    settings.setValue("copyright", m_ui->le_copyright->text());
}

void DlgWvCreate::readFields(const QSettings &settings)
{
    if (settings.value("ver", 0.0).toDouble() < SettingsVersion) {
        return;
    }
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

CreateKind DlgWvCreate::kind() const
{
    const CreateKind chosen = waveforms().at(m_ui->cb_waveform->currentIndex()).kind;
    return chosen == CreateKind::Pulse && subKind() == ChirpData ? CreateKind::Chirp : chosen;
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
    request.output = outputOptions();
    request.signal = makeSettings(
        kind(), choices, [this](const SignalField &field) { return m_pages->value(field); });
    request.minClockHz = m_ui->le_minclock->getVal();
    request.maxClockHz = m_ui->le_maxclock->getVal();
    request.clockHz = m_ui->le_clockrate->getVal();
    request.autoScaling = m_ui->rb_sc_auto->isChecked();
    request.seed = m_seed;
    request.zeroCrest = m_ui->cb_zerocrf->isChecked();
    return request;
}

void DlgWvCreate::slot_waveform(int index)
{
    const Waveform &waveform = waveforms().at(index);
    m_ui->cb_wtype->clear();
    for (int number = 0; number < waveform.variants.size(); ++number) {
        const bool isChirp = waveform.kind == CreateKind::Pulse && number == 1;
        m_ui->cb_wtype->addItem(waveform.variants.at(number), isChirp ? ChirpData : number);
    }
    m_ui->cb_wtype->setVisible(!waveform.variants.isEmpty());
    m_ui->t_cb_wtype->setVisible(!waveform.variants.isEmpty());
}

void DlgWvCreate::enableSecondTone()
{
    const bool twoToneFm = subKind() == static_cast<int>(FmKind::TwoTone);
    const bool twoToneAm = subKind() >= static_cast<int>(AmKind::TwoTone);
    m_pages->setEnabled(signalfields::fmFrequency2, twoToneFm);
    m_pages->setEnabled(signalfields::fmDeviation2, twoToneFm);
    m_pages->setEnabled(signalfields::amFrequency2, twoToneAm);
    m_pages->setEnabled(signalfields::amDepth2, twoToneAm);
}

bool DlgWvCreate::preview()
{
    m_sketch->cancel();
    m_ui->w_iq->clear();
    m_ui->w_spectrum->clear();
    m_ui->w_constellation->clear();
    // The file is to hold the very noise that was shown.
    m_seed = std::random_device()();
    SignalPreviewJob job(options());
    if (runInPlace(job) != JobOutcome::Finished) {
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
    m_ui->l_warn->setVisible(facts.samples < ShortWaveform);
    m_ui->le_samples->setVal(facts.samples);
    m_ui->le_arbclock->setVal(facts.clockHz);
    m_ui->le_peak->setVal(facts.peak);
    m_ui->le_crf->setVal(facts.rms > 0 ? 20 * std::log10(facts.peak / facts.rms) : 0.0);
    m_ui->le_clockrate->setVal(facts.clockHz);
    return true;
}

/// Every field of the kinds draws the sketch anew.
void DlgWvCreate::addSketch()
{
    m_sketch = new SignalSketch([this] { return options(); }, this);
    const auto draw = [this] { m_sketch->request(); };
    for (int page = FirstTypePage; page < PreviewPage; ++page) {
        const QWidget *fields = m_ui->sw_assist->widget(page);
        for (const auto *edit : fields->findChildren<QtNumericEdit *>()) {
            connect(edit, &QtNumericEdit::valueUpdated, m_sketch, draw);
        }
        for (const auto *box : fields->findChildren<QComboBox *>()) {
            connect(box, &QComboBox::currentIndexChanged, m_sketch, draw);
        }
        for (const auto *box : fields->findChildren<QCheckBox *>()) {
            connect(box, &QCheckBox::toggled, m_sketch, draw);
        }
    }
}

void DlgWvCreate::pageShown(int page)
{
    if (page < FirstTypePage || page >= PreviewPage) {
        return;
    }
    static_cast<QBoxLayout *>(m_ui->sw_assist->widget(page)->layout())->addWidget(m_sketch, 1);
    m_sketch->show();
    m_sketch->request();
}

void DlgWvCreate::slot_scaling()
{
    if (currentPage() == PreviewPage && !preview()) {
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
    m_pages->setEnabled(signalfields::oversampling, state != Qt::Unchecked);
}

int DlgWvCreate::pageAfter(int page)
{
    switch (page) {
    case WaveformPage:
        enableSecondTone();
        return typePage();
    case PreviewPage:
        return OutputPage;
    default:
        return preview() ? PreviewPage : page;
    }
}

int DlgWvCreate::pageBefore(int page)
{
    switch (page) {
    case PreviewPage:
        return typePage();
    case OutputPage:
    case OutputPage + 1:
        return page - 1;
    default:
        return WaveformPage;
    }
}

std::unique_ptr<ToolJob> DlgWvCreate::makeJob() const
{
    return std::make_unique<CreateJob>(options());
}
