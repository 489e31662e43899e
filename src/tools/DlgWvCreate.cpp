// SPDX-License-Identifier: Apache-2.0
#include "DlgWvCreate.h"

#include "toolpages.h"
#include "ui_DlgWvCreate.h"

#include "jobs/CreateJob.h"
#include "jobs/ReportText.h"
#include "log/Tracer.h"
#include "toolframe/questions.h"
#include "toolframe/runjob.h"
#include "toolframe/windowplace.h"

#include <QDir>
#include <QFileInfo>
#include <QFormLayout>
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
    setUpField(*m_ui->le_maxclock, createfields::maxClock);
    setUpField(*m_ui->le_minclock, createfields::minClock);
    setUpField(*m_ui->le_clockrate, createfields::clockRate);
    setUpResult(*m_ui->le_samples, tr("Number of Samples"), {}, 1e6);
    setUpResult(*m_ui->le_arbclock, tr("ARB clock rate"), "Hz", 6e8);
    setUpResult(*m_ui->le_peak, tr("Peak Vector"), {}, 100);
    setUpResult(*m_ui->le_crf, tr("Peak/RMS"), "dB", 100);
    m_ui->le_samples->setScaled(false);
    m_ui->le_crf->setPrecision(2);
    makeTypePages();
    m_ui->w_iq->setView(0);
    m_ui->w_spectrum->setView(0);

    for (const Waveform &waveform : waveforms()) {
        m_ui->cb_waveform->addItem(waveform.text);
    }
    connect(m_ui->cb_waveform, &QComboBox::currentIndexChanged, this, &DlgWvCreate::slot_waveform);
    connect(m_oversampling, &QCheckBox::stateChanged, this, &DlgWvCreate::slot_over_enable);
    connect(m_ui->rb_sc_auto, &QRadioButton::clicked, this, &DlgWvCreate::slot_scaling);
    connect(m_ui->rb_sc_no, &QRadioButton::clicked, this, &DlgWvCreate::slot_scaling);
    connect(m_ui->cb_zerocrf, &QCheckBox::stateChanged, this, &DlgWvCreate::slot_crf);
    connect(m_ui->pb_outfile, &QPushButton::clicked, this, &DlgWvCreate::slot_outfile);
    connect(m_ui->pb_next, &QPushButton::clicked, this, &DlgWvCreate::slot_next);
    connect(m_ui->pb_prev, &QPushButton::clicked, this, &DlgWvCreate::slot_prev);
    connect(m_ui->cb_close, &QPushButton::clicked, this, &DlgWvCreate::reject);
    m_ui->le_outfile->setText(QDir::homePath() + "/NewSignal.wv");
    slot_waveform(0);
    slot_over_enable(m_oversampling->checkState());
    showPage(WaveformPage);
}

DlgWvCreate::~DlgWvCreate() = default;

void DlgWvCreate::setUpField(QtNumericEdit &edit, const CreateField &field)
{
    const QString unit = field.unit;
    edit.setObjectName(field.object);
    edit.setName(field.text);
    edit.setUnit(unit);
    edit.setScaled(unit == "Hz" || unit == "s");
    edit.setLowerPrefix(unit == "s");
    edit.setMax(field.max);
    edit.setMin(field.min);
    edit.setVal(field.start);
    m_fields[&field] = &edit;
}

void DlgWvCreate::setUpResult(QtNumericEdit &edit, const QString &name, const QString &unit,
                              double max)
{
    edit.setName(name);
    edit.setUnit(unit);
    edit.setScaled(unit == "Hz");
    edit.setMax(max);
}

QFormLayout *DlgWvCreate::pageLayout(QWidget *page, const QString &title)
{
    auto *outer = new QVBoxLayout(page);
    auto *group = new QGroupBox(title, page);
    outer->addWidget(group);
    outer->addStretch();
    auto *layout = new QFormLayout(group);
    layout->setFieldGrowthPolicy(QFormLayout::AllNonFixedFieldsGrow);
    return layout;
}

QtNumericEdit *DlgWvCreate::addField(QFormLayout *layout, const QString &label,
                                     const CreateField &field)
{
    auto *edit = new QtNumericEdit;
    setUpField(*edit, field);
    layout->addRow(label, edit);
    return edit;
}

void DlgWvCreate::makeTypePages()
{
    using namespace createfields;
    const auto addRamp = [](QFormLayout *layout, const char *name) {
        auto *ramp = new QComboBox;
        ramp->setObjectName(name);
        ramp->setToolTip(tr("Shape of the edges"));
        ramp->addItems({"Linear", "RCOS"});
        layout->addRow(tr("Ramp &Type"), ramp);
        return ramp;
    };

    QFormLayout *layout = pageLayout(m_ui->page_function, tr("Function"));
    addField(layout, tr("&Frequency"), frequency);
    addField(layout, tr("&I Amplitude"), amplitudeI);
    addField(layout, tr("&Q Amplitude"), amplitudeQ);
    addField(layout, tr("I &Offset"), offsetI);
    addField(layout, tr("Q O&ffset"), offsetQ);
    addField(layout, tr("Q P&hase Offset"), phaseQ);
    m_oversampling = new QCheckBox(tr("&Custom\nOversampling"));
    m_oversampling->setObjectName("cb_over");
    m_oversampling->setToolTip(tr("Start from this number of samples per period"));
    auto *ratio = new QtNumericEdit;
    setUpField(*ratio, oversampling);
    layout->addRow(m_oversampling, ratio);

    layout = pageLayout(m_ui->page_pulse, tr("Pulse"));
    addField(layout, tr("&Rise Time"), pulseRise);
    addField(layout, tr("&On Time"), pulseOn);
    addField(layout, tr("&Fall Time"), pulseFall);
    addField(layout, tr("&Blank Time"), pulseBlank);
    m_pulseRamp = addRamp(layout, "cb_rtype");
    addField(layout, tr("Time R&esolution"), pulseResolution);

    layout = pageLayout(m_ui->page_chirp, tr("Chirp"));
    addField(layout, tr("&Rise Time"), chirpRise);
    addField(layout, tr("&On Time"), chirpOn);
    addField(layout, tr("&Fall Time"), chirpFall);
    addField(layout, tr("&Blank Time"), chirpBlank);
    m_chirpRamp = addRamp(layout, "cb_rtype_2");
    addField(layout, tr("Time R&esolution"), chirpResolution);
    addField(layout, tr("&Chirp Range"), chirpRange);

    layout = pageLayout(m_ui->page_fm, tr("FM"));
    addField(layout, tr("&Modulation Frequency"), fmFrequency);
    addField(layout, tr("&Deviation"), fmDeviation);
    addField(layout, tr("Modulation &Frequency, 2nd Tone"), fmFrequency2);
    addField(layout, tr("D&eviation, 2nd Tone"), fmDeviation2);

    layout = pageLayout(m_ui->page_sweep, tr("FM Sweep"));
    addField(layout, tr("&Deviation"), sweepDeviation);
    addField(layout, tr("Sweep &Time"), sweepTime);
    addField(layout, tr("&Start Phase"), sweepStart);
    addField(layout, tr("St&op Phase"), sweepStop);

    layout = pageLayout(m_ui->page_am, tr("AM"));
    addField(layout, tr("&Modulation Frequency"), amFrequency);
    addField(layout, tr("&Depth"), amDepth);
    addField(layout, tr("Modulation &Frequency, 2nd Tone"), amFrequency2);
    addField(layout, tr("D&epth, 2nd Tone"), amDepth2);

    layout = pageLayout(m_ui->page_multicarrier, tr("Multi Carrier"));
    addField(layout, tr("Frequency &Spacing"), spacing);
    addField(layout, tr("Number of &Carriers"), carriers);
    addField(layout, tr("&I Offset"), carrierOffsetI);
    m_randomPhase = new QCheckBox(tr("&Random Phase"));
    m_randomPhase->setObjectName("cb_randomphase");
    m_randomPhase->setToolTip(tr("Give each carrier a random phase, for a lower peak"));
    m_randomPhase->setChecked(true);
    layout->addRow(QString(), m_randomPhase);

    layout = pageLayout(m_ui->page_pm, tr("PM"));
    addField(layout, tr("&Modulation Frequency"), pmFrequency);
    addField(layout, tr("&Deviation"), pmDeviation);

    layout = pageLayout(m_ui->page_noise, tr("Noise"));
    addField(layout, tr("&Bandwidth"), noiseBandwidth);
    addField(layout, tr("&Duration"), noiseDuration);
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
    for (const auto &[field, edit] : m_fields) {
        if (*field->key != 0) {
            settings.setValue(field->key, edit->getVal());
        }
    }
    settings.setValue("wv.main", m_ui->cb_waveform->currentIndex());
    settings.setValue("wv.sub", m_ui->cb_wtype->currentIndex());
    settings.setValue("fn.overen", m_oversampling->isChecked());
    settings.setValue("pulse.ramp", m_pulseRamp->currentIndex());
    settings.setValue("chirp.ramp", m_chirpRamp->currentIndex());
    settings.setValue("mc.rndp", m_randomPhase->isChecked());
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
        for (const auto &[field, edit] : m_fields) {
            if (*field->key != 0) {
                edit->setVal(settings.value(field->key, field->start).toDouble());
            }
        }
        const auto choose = [&](QComboBox &box, const char *key) {
            const int index = settings.value(key, 0).toInt();
            box.setCurrentIndex(index >= 0 && index < box.count() ? index : 0);
        };
        choose(*m_ui->cb_waveform, "wv.main");
        choose(*m_ui->cb_wtype, "wv.sub");
        choose(*m_pulseRamp, "pulse.ramp");
        choose(*m_chirpRamp, "chirp.ramp");
        m_oversampling->setChecked(settings.value("fn.overen", false).toBool());
        m_randomPhase->setChecked(settings.value("mc.rndp", true).toBool());
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
    CreateChoices choices;
    choices.subKind = subKind();
    choices.ramp = static_cast<RampKind>(
        (kind() == CreateKind::Chirp ? m_chirpRamp : m_pulseRamp)->currentIndex());
    choices.customOversampling = m_oversampling->isChecked();
    choices.randomPhase = m_randomPhase->isChecked();
    CreateRequest request;
    request.output = {m_ui->le_outfile->text(), m_ui->te_comment->toPlainText(),
                      m_ui->le_copyright->text()};
    request.signal = makeSettings(kind(), choices, [this](const CreateField &field) {
        return m_fields.at(&field)->getVal();
    });
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
    m_fields.at(&createfields::fmFrequency2)->setEnabled(twoToneFm);
    m_fields.at(&createfields::fmDeviation2)->setEnabled(twoToneFm);
    m_fields.at(&createfields::amFrequency2)->setEnabled(twoToneAm);
    m_fields.at(&createfields::amDepth2)->setEnabled(twoToneAm);
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
    m_ui->le_crf->setVal(20 * std::log10(facts.peak / facts.rms));
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
    m_fields.at(&createfields::oversampling)->setEnabled(state != Qt::Unchecked);
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
        appendReport(*m_ui->te_result, failureLine("Creation aborted"));
        return;
    }
    CreateJob job(options());
    m_ui->pb_prev->setEnabled(false);
    // The outcome stands in the report.
    static_cast<void>(runJob(job, this, m_ui->te_result));
    m_ui->pb_prev->setEnabled(true);
}
