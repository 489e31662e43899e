// SPDX-License-Identifier: Apache-2.0
#include "RangeTool.h"

#include "ViewFrame.h"

#include "appearance/lineicon.h"
#include "display/CWidgetIQTrace.h"
#include "display/QtNumericEdit.h"
#include "display/TracePainter.h"
#include "jobs/EditJob.h"
#include "jobs/LoadJob.h"
#include "log/Tracer.h"
#include "toolframe/questions.h"
#include "toolframe/runjob.h"
#include "toolframe/toolpages.h"
#include "toolframe/windowplace.h"

#include <QComboBox>
#include <QFileInfo>
#include <QGridLayout>
#include <QGroupBox>
#include <QLabel>
#include <QPushButton>
#include <QSettings>
#include <QTextEdit>
#include <QVBoxLayout>

#include <algorithm>
#include <cmath>

namespace {

constexpr double ShortestTime = 1e-6;
constexpr double MaxCursorPosition = 4e9;

QPushButton *makeButton(const QString &name, const QString &text, const QString &toolTip)
{
    auto *button = new QPushButton(text);
    button->setObjectName(name);
    button->setToolTip(toolTip);
    button->setAutoDefault(false);
    return button;
}

} // namespace

RangeTool::RangeTool(QString title, QString settingsGroup, QString suffix, QWidget *parent)
    : DlgBase(parent)
    , m_title(std::move(title))
    , m_settingsGroup(std::move(settingsGroup))
    , m_suffix(std::move(suffix))
    , m_view(new ViewFrame)
    , m_mode(new QComboBox)
    , m_controls(new QVBoxLayout)
    , m_target(new QLabel)
    , m_report(new QTextEdit)
    , m_run(makeButton("pb_run", "Run", {}))
{
    setWindowTitle(m_title);
    m_view->setObjectName("w_view");
    m_mode->setObjectName("cb_ViewMode");
    m_mode->addItem("Lin Mag Average", static_cast<int>(TraceMode::LinMagAverage));
    m_mode->addItem("Log Mag Average", static_cast<int>(TraceMode::LogMagAverage));
    m_mode->addItem("Log Mag Envelope", static_cast<int>(TraceMode::LogMagEnvelope));
    m_mode->addItem("I/Q Envelope", static_cast<int>(TraceMode::IqEnvelope));
    m_mode->setAccessibleName("View Mode");
    m_view->addButton(m_mode);
    m_target->setObjectName("l_target");
    m_target->setTextFormat(Qt::PlainText);
    m_target->setWordWrap(true);
    m_report->setObjectName("te_result");
    m_report->setAccessibleName("Report");
    m_report->setReadOnly(true);
    constexpr int ReportHeight = 84;
    m_report->setMinimumHeight(ReportHeight / 2); // on small screens
    m_report->setMaximumHeight(ReportHeight);

    auto *lower = new QHBoxLayout;
    lower->addWidget(makeCursorBox());
    lower->addLayout(m_controls, 1);
    auto *buttons = new QHBoxLayout;
    buttons->addWidget(m_target, 1);
    buttons->addWidget(m_run);
    QPushButton *close = makeButton("cb_close", "Close", {});
    close->setIcon(lineIcon("close"));
    m_run->setIcon(lineIcon("render"));
    buttons->addWidget(close);
    auto *column = new QVBoxLayout(this);
    column->addWidget(m_view, 1);
    column->addLayout(lower);
    column->addWidget(m_report);
    column->addLayout(buttons);

    connect(m_mode, &QComboBox::currentIndexChanged, this, &RangeTool::slot_view_mode);
    connect(m_run, &QPushButton::clicked, this, &RangeTool::slot_run);
    connect(close, &QPushButton::clicked, this, &RangeTool::reject);
    slot_view_mode(0);
    unload();
}

RangeTool::~RangeTool() = default;

QGroupBox *RangeTool::makeCursorBox()
{
    auto *box = new QGroupBox("Cursors");
    auto *grid = new QGridLayout(box);
    for (int which : {0, 1}) {
        const QString number = QString::number(which + 1);
        Cursor &cursor = m_cursors.at(static_cast<size_t>(which));
        cursor.position = new QtNumericEdit;
        cursor.position->setObjectName("le_mkrpos_" + number);
        cursor.position->setName("Marker Cursor Position " + number);
        cursor.position->setMax(MaxCursorPosition);
        cursor.position->setMin(1);
        cursor.position->setStep(1);
        cursor.position->setPrecision(10);
        cursor.position->setVal(1);
        cursor.time = new QtNumericEdit;
        cursor.time->setObjectName("le_mkrpostime_" + number);
        cursor.time->setName("Marker Cursor Position " + number);
        cursor.time->setUnit("s");
        cursor.time->setScaled(true);
        cursor.time->setLowerPrefix(true);
        cursor.time->setMax(MaxCursorPosition);
        cursor.time->setMin(ShortestTime);
        cursor.time->setPrecision(9);
        connect(cursor.position, &QtNumericEdit::valueUpdated, this,
                [this, which](double position) { moveCursor(which, std::llround(position)); });
        connect(cursor.time, &QtNumericEdit::valueUpdated, this,
                which == 0 ? &RangeTool::slot_mkr_pos_time_user_1
                           : &RangeTool::slot_mkr_pos_time_user_2);
        auto *set = makeButton("pb_set_" + number, "Set",
                               "Set marker " + number + " to current cursor position");
        auto *start = makeButton("pb_begin_" + number, {}, "Move marker to beginning");
        auto *end = makeButton("pb_end_" + number, {}, "Move marker to end");
        connect(set, &QPushButton::clicked, this, [this, which] {
            if (const qint64 sample = m_view->cursor(ViewFrame::Measuring); sample >= 0) {
                moveCursor(which, sample + 1);
            }
        });
        connect(start, &QPushButton::clicked, this, [this, which] { moveCursor(which, 1); });
        connect(end, &QPushButton::clicked, this,
                [this, which] { moveCursor(which, m_source ? m_source->info().samples : 1); });
        auto *label = new QLabel("Cursor " + number);
        label->setBuddy(cursor.position);
        set->setIcon(lineIcon("set"));
        start->setIcon(lineIcon("cursor_start"));
        end->setIcon(lineIcon("cursor_end"));
        for (QPushButton *button : {set, start, end}) {
            button->setAccessibleName(button->toolTip());
        }
        const std::array<QWidget *, 6> row{label, cursor.position, cursor.time, set, start, end};
        for (int column = 0; QWidget * widget : row) {
            grid->addWidget(widget, which, column++);
        }
        for (QtNumericEdit *field : {cursor.position, cursor.time}) {
            field->setMinimumWidth(field->fontMetrics().horizontalAdvance("1234567890 us"));
        }
        for (QPushButton *button : {set, start, end}) {
            button->setMaximumWidth(button->fontMetrics().horizontalAdvance(button->text()) +
                                    button->iconSize().width() + 28);
        }
    }
    return box;
}

void RangeTool::addControls(QWidget *controls)
{
    m_controls->addWidget(controls);
    // They are made last, but stand before the report and the buttons.
    QList<QWidget *> order = controls->findChildren<QWidget *>();
    order.removeIf([this](const QWidget *one) { // the list of a box of choices is another window
        return one->focusPolicy() == Qt::NoFocus || one->window() != this;
    });
    if (order.isEmpty()) {
        return;
    }
    order.prepend(findChild<QWidget *>("pb_end_2"));
    order.append({m_report, m_run, findChild<QWidget *>("cb_close")});
    for (qsizetype i = 1; i < order.size(); ++i) {
        setTabOrder(order.at(i - 1), order.at(i));
    }
}

bool RangeTool::startModule(const QString &path)
{
    m_view->slot_stop();
    auto source = std::make_unique<SourceWaveform>();
    LoadJob job(path, *source);
    if (runJob(job, this, nullptr) != JobOutcome::Finished) {
        return false;
    }
    unload();
    m_source = std::move(source);
    const WvFileInfo &info = m_source->info();
    if (!m_view->setWaveform(m_source->data(), m_source->markers(), info.samples, info.clock)) {
        unload();
        return false;
    }
    m_file = path;
    setWindowTitle(m_title + " - " + QFileInfo(path).fileName());
    m_target->setText("Writes " + fileNameWithSuffix(path, m_suffix));
    m_report->clear();
    m_run->setEnabled(true);
    for (Cursor &cursor : m_cursors) {
        cursor.position->setMax(info.samples);
        cursor.time->setEnabled(info.clock > 0);
    }
    moveCursor(0, 1);
    moveCursor(1, info.samples);
    sourceChanged();
    return true;
}

void RangeTool::writeSettings(QSettings &settings)
{
    settings.beginGroup(m_settingsGroup);
    writeWindowPlace(settings, *this);
    settings.endGroup();
}

void RangeTool::readSettings(QSettings &settings)
{
    settings.beginGroup(m_settingsGroup);
    readWindowPlace(settings, *this, {140, 90}, {960, 720});
    settings.endGroup();
}

void RangeTool::slot_view_mode(int row)
{
    m_view->trace().setView(m_mode->itemData(row).toInt());
}

void RangeTool::slot_mkr_pos_time_user_1(double seconds)
{
    moveCursor(0, m_source ? std::llround(seconds * m_source->info().clock) : 1);
}

void RangeTool::slot_mkr_pos_time_user_2(double seconds)
{
    moveCursor(1, m_source ? std::llround(seconds * m_source->info().clock) : 1);
}

/// Puts a cursor on a sample, counted from 1, and shows its time.
void RangeTool::moveCursor(int which, qint64 position)
{
    const Cursor &cursor = m_cursors.at(static_cast<size_t>(which));
    cursor.position->setVal(static_cast<qlonglong>(position));
    if (m_source && m_source->info().clock > 0) {
        cursor.time->setVal(cursor.position->getVal() / m_source->info().clock);
    }
    showRange();
}

std::pair<qint64, qint64> RangeTool::range() const
{
    return std::minmax(
        {m_cursors[0].position->getValInt() - 1, m_cursors[1].position->getValInt() - 1});
}

void RangeTool::showRange()
{
    const auto [first, last] = range();
    m_view->setRange(m_source ? first : ViewFrame::NoSample, m_source ? last : ViewFrame::NoSample);
}

void RangeTool::slot_run()
{
    if (!m_source) {
        return;
    }
    OutputOptions output{fileNameWithSuffix(m_file, m_suffix), {}, {}};
    if (!confirmOverwrite(this, output.fileName)) {
        return;
    }
    // The user was asked about the file that stands there, not about one that appears later.
    output.overwrite = QFileInfo::exists(output.fileName);
    const std::unique_ptr<EditJob> job = makeJob(m_file, output);
    job->useSource(*m_source);
    m_report->clear();
    m_run->setEnabled(false);
    if (runJob(*job, this, m_report) == JobOutcome::Failed && m_report->toPlainText().isEmpty()) {
        appendReport(*m_report, ReportLine::failure("No file was written. The message log of the "
                                                    "main window tells why."));
    }
    m_run->setEnabled(m_source != nullptr);
}

void RangeTool::refuse(const QString &problem)
{
    Tracer::Trace(Tracer::Error, problem);
    appendReport(*m_report, ReportLine::failure(problem));
}

/// A waveform can fill gigabytes of temporary files; they go when nobody looks at it any more.
void RangeTool::done(int result)
{
    DlgBase::done(result);
    unload();
    sourceChanged();
}

void RangeTool::unload()
{
    m_view->clear();
    m_source.reset();
    m_file.clear();
    m_target->clear();
    m_run->setEnabled(false);
}
