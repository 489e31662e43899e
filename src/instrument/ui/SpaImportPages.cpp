// SPDX-License-Identifier: Apache-2.0
#include "SpaImportPages.h"

#include "display/CWidgetConstellation.h"
#include "display/CWidgetIQTrace.h"
#include "display/CWidgetSpectrum.h"
#include "display/QtNumericEdit.h"
#include "jobs/ImportJob.h"
#include "jobs/instrument/CaptureJob.h"
#include "toolframe/QtProgressWidget.h"

#include <QButtonGroup>
#include <QComboBox>
#include <QDialog>
#include <QFormLayout>
#include <QGroupBox>
#include <QHBoxLayout>
#include <QLabel>
#include <QLineEdit>
#include <QPlainTextEdit>
#include <QPushButton>
#include <QRadioButton>
#include <QStackedWidget>
#include <QTextEdit>
#include <QVBoxLayout>

namespace {

/// The range of a number field, in its unit.
struct Range
{
    QString unit;
    double min;
    double max;
    double step;
    double value;
};

template <typename Widget, typename... Arguments>
Widget *make(const char *name, Arguments... arguments)
{
    auto *widget = new Widget(arguments...);
    widget->setObjectName(name);
    return widget;
}

QtNumericEdit *numberField(const char *objectName, const QString &name, const Range &range)
{
    constexpr int Digits = 6;
    auto *field = make<QtNumericEdit>(objectName);
    field->setName(name);
    field->setUnit(range.unit);
    field->setScaled(!range.unit.isEmpty());
    field->setLowerPrefix(range.unit == "s");
    field->setPrecision(Digits);
    field->setMax(range.max);
    field->setMin(range.min);
    field->setStep(range.step);
    field->setVal(range.value);
    return field;
}

QComboBox *choice(const char *name, const QStringList &texts)
{
    auto *box = make<QComboBox>(name);
    box->addItems(texts);
    return box;
}

QTextEdit *reportText(const char *name)
{
    auto *text = make<QTextEdit>(name);
    text->setReadOnly(true);
    constexpr int ValueColumn = 170;
    text->setTabStopDistance(ValueColumn);
    return text;
}

/// A new page with one titled group, whose layout is `layout`.
QWidget *addPage(QStackedWidget &pages, const char *name, const QString &title, QLayout *layout)
{
    auto *page = make<QWidget>(name);
    auto *group = new QGroupBox(title);
    group->setLayout(layout);
    auto *column = new QVBoxLayout(page);
    column->addWidget(group);
    pages.addWidget(page);
    return page;
}

} // namespace

SpaImportPages::SpaImportPages(QDialog &window)
    : sw_assist(make<QStackedWidget>("sw_assist"))
{
    window.setWindowTitle("Create Waveform From Data");
    addSettingsPage();
    addCapturePage();
    addPreviewPage();
    addOutputPage();
    addResultPage();
    pb_prev = make<QPushButton>("pb_prev", "&Previous");
    pb_next = make<QPushButton>("pb_next", "&Next");
    cb_close = make<QPushButton>("cb_close", "&Close");
    auto *buttons = new QHBoxLayout;
    buttons->addStretch();
    for (QPushButton *button : {pb_prev, pb_next, cb_close}) {
        buttons->addWidget(button);
    }
    auto *column = new QVBoxLayout(&window);
    column->addWidget(sw_assist);
    column->addLayout(buttons);
}

void SpaImportPages::addSettingsPage()
{
    using R = CaptureRequest;
    cb_device = make<QComboBox>("cb_device");
    cb_input = choice("cb_input", {"RF", "Analog IQ", "Digital IQ"});
    le_samplerate =
        numberField("le_samplerate", "Sample Rate", {"Hz", R::MinRateHz, R::MaxRateHz, 1000, 1e6});
    rb_samples = make<QRadioButton>("rb_samples", "&Samples");
    rb_samples->setChecked(true);
    le_samples =
        numberField("le_samples", "Samples", {{}, R::MinSamples, R::MaxSamples, 1, 1'000'000});
    rb_time = make<QRadioButton>("rb_time", "Recording &Time");
    le_time = numberField("le_time", "Recording Time", {"s", 1e-6, 100, 0.001, 0.001});
    le_rbw =
        numberField("le_rbw", "Resolution Bandwidth", {"Hz", R::MinRbwHz, R::MaxRbwHz, 1000, 1000});
    le_pretrigger = numberField("le_pretrigger", "Pretrigger Samples",
                                {{}, R::MinPretrigger, R::MaxPretrigger, 1, 0});
    cb_triggersource = choice("cb_triggersource", {"Immediate", "External", "IF Power"});
    cb_triggerslope = choice("cb_triggerslope", {"Positive", "Negative"});
    le_triggerlevel = numberField("le_triggerlevel", "IF Trigger Level",
                                  {"dBm", R::MinLevelDbm, R::MaxLevelDbm, 1, 0});
    le_triggerlevel->setScaled(false);
    for (QRadioButton *button : {rb_samples, rb_time}) {
        button->setToolTip("This value decides; the other one follows");
    }

    auto *form = new QFormLayout;
    form->setFieldGrowthPolicy(QFormLayout::AllNonFixedFieldsGrow);
    form->addRow("&Device", cb_device);
    form->addRow("&Input", cb_input);
    form->addRow("Sample &Rate", le_samplerate);
    for (QRadioButton *button : {rb_samples, rb_time}) { // level with their fields
        button->setMinimumHeight(le_samples->sizeHint().height());
    }
    form->addRow(rb_samples, le_samples);
    form->addRow(rb_time, le_time);
    form->addRow("Resolution &Bandwidth", le_rbw);
    form->addRow("Pretri&gger Samples", le_pretrigger);
    form->addRow("Trigger S&ource", cb_triggersource);
    form->addRow("Trigger S&lope", cb_triggerslope);
    form->addRow("IF Trigger Le&vel", le_triggerlevel);
    form->addRow(make<QLabel>("l_warn",
                              "Please see the instrument's operating\nmanual for valid settings."));
    addPage(*sw_assist, "page_settings", "Settings", form)->layout()->setAlignment(Qt::AlignTop);
}

void SpaImportPages::addCapturePage()
{
    te_capture = reportText("te_capture");
    te_capture->setAccessibleName("Progress of the capture");
    w_progress = make<QtProgressWidget>("w_progress");
    QSizePolicy policy = w_progress->sizePolicy();
    policy.setRetainSizeWhenHidden(true);
    w_progress->setSizePolicy(policy);
    w_progress->hide();
    pb_capture = make<QPushButton>("pb_capture", "C&apture");
    pb_abort = make<QPushButton>("pb_abort", "A&bort");
    pb_abort->setEnabled(false);
    auto *row = new QHBoxLayout;
    row->addWidget(pb_capture);
    row->addWidget(pb_abort);
    row->addWidget(w_progress, 1);
    auto *column = new QVBoxLayout;
    column->addWidget(te_capture);
    column->addLayout(row);
    addPage(*sw_assist, "page_capture", "Capture", column);
}

void SpaImportPages::addPreviewPage()
{
    rb_iq = make<QRadioButton>("rb_iq", "&IQ vs Time");
    rb_spectrum = make<QRadioButton>("rb_spectrum", "&Spectrum");
    rb_constellation = make<QRadioButton>("rb_constellation", "C&onstellation");
    rb_iq->setChecked(true);
    sw_preview = make<QStackedWidget>("sw_preview");
    w_iq = make<CWidgetIQTrace>("w_iq");
    w_spectrum = make<CWidgetSpectrum>("w_spectrum");
    w_constellation = make<CWidgetConstellation>("w_constellation");
    w_iq->setView(0);
    w_spectrum->setView(0);
    const QList<QPair<QRadioButton *, QWidget *>> views{
        {rb_iq, w_iq}, {rb_spectrum, w_spectrum}, {rb_constellation, w_constellation}};
    auto *viewRow = new QHBoxLayout;
    auto *viewGroup = new QButtonGroup(sw_preview);
    for (const auto &[button, view] : views) {
        sw_preview->addWidget(view);
        viewGroup->addButton(button);
        viewRow->addWidget(button);
        QObject::connect(button, &QRadioButton::clicked, sw_preview,
                         [pages = sw_preview, shown = view] { pages->setCurrentWidget(shown); });
    }
    viewRow->addStretch();
    l_preview = make<QLabel>("l_preview");
    viewRow->addWidget(l_preview);

    rb_sc_no = make<QRadioButton>("rb_sc_no", "Do Not Scale,\nClip if Required");
    rb_sc_down = make<QRadioButton>("rb_sc_down", "Only Scale Down,\nif Required");
    rb_sc_auto = make<QRadioButton>("rb_sc_auto", "Full Auto Scaling");
    rb_sc_auto->setChecked(true);
    auto *scalingRow = new QHBoxLayout;
    auto *scalingGroup = new QButtonGroup(sw_preview);
    for (QRadioButton *button : {rb_sc_no, rb_sc_down, rb_sc_auto}) {
        scalingGroup->addButton(button);
        scalingRow->addWidget(button);
    }
    scalingRow->addStretch();
    auto *column = new QVBoxLayout;
    column->addLayout(viewRow);
    column->addWidget(sw_preview, 1);
    column->addLayout(scalingRow);
    addPage(*sw_assist, "page_preview", "Preview", column);
}

void SpaImportPages::addOutputPage()
{
    le_outfile = make<QLineEdit>("le_outfile");
    pb_outfile = make<QPushButton>("pb_outfile", "&Browse...");
    te_comment = make<QPlainTextEdit>("te_comment");
    te_comment->setTabChangesFocus(true);
    le_copyright = make<QLineEdit>("le_copyright");
    le_clockrate =
        numberField("le_clockrate", "ARB Clockrate",
                    {"Hz", ImportTarget::MinClockHz, ImportTarget::MaxClockHz, 1000, 1e6});
    auto *fileRow = new QHBoxLayout;
    fileRow->addWidget(le_outfile);
    fileRow->addWidget(pb_outfile);
    auto *form = new QFormLayout;
    auto *fileLabel = new QLabel("&File");
    fileLabel->setBuddy(le_outfile);
    form->addRow(fileLabel, fileRow);
    form->addRow("C&omment", te_comment);
    form->addRow("Cop&yright", le_copyright);
    form->addRow("&ARB Clockrate", le_clockrate);
    addPage(*sw_assist, "page_output", "Output File", form);
}

void SpaImportPages::addResultPage()
{
    te_result = reportText("te_result");
    auto *column = new QVBoxLayout;
    column->addWidget(te_result);
    addPage(*sw_assist, "page_status", "Status", column);
}
