// SPDX-License-Identifier: Apache-2.0
#include "DlgMarker.h"

#include "ViewFrame.h"

#include "appearance/lineicon.h"
#include "base/limits.h"
#include "jobs/MarkerJob.h"
#include "log/Tracer.h"
#include "toolframe/runjob.h"

#include <QComboBox>
#include <QFormLayout>
#include <QGroupBox>
#include <QHBoxLayout>
#include <QLineEdit>
#include <QListWidget>
#include <QPushButton>
#include <QRadioButton>
#include <QRegularExpressionValidator>

#include <tuple>

DlgMarker::DlgMarker(QWidget *parent)
    : RangeTool("Edit Markers", "Marker", "_mkr", parent)
    , cb_markers(new QComboBox)
    , cb_maction(new QComboBox)
    , le_pattern(new QLineEdit)
    , pb_apply(new QPushButton("Apply to Trace"))
    , pb_undo(new QPushButton("Undo"))
    , rb_before(new QRadioButton("Before"))
    , rb_after(new QRadioButton("After"))
    , lw_edits(new QListWidget)
{
    addControls(makeControls());
    runButton().setToolTip("Create waveform with the changed markers");
    connect(pb_apply, &QPushButton::clicked, this, &DlgMarker::slot_apply);
    connect(pb_undo, &QPushButton::clicked, this, &DlgMarker::slot_undo);
    connect(rb_after, &QRadioButton::toggled, this, &DlgMarker::showMarkers);
    connect(cb_maction, &QComboBox::currentIndexChanged, this, &DlgMarker::refresh);
    refresh();
}

DlgMarker::~DlgMarker() = default;

QWidget *DlgMarker::makeControls()
{
    cb_markers->setObjectName("cb_markers");
    cb_markers->setAccessibleName("Marker trace");
    cb_maction->setAccessibleName("Change");
    le_pattern->setAccessibleName("Pattern");
    lw_edits->setAccessibleName("Changes so far");
    cb_markers->setToolTip("Select Affected Marker Traces");
    for (int marker = 1; marker <= MarkerCount; ++marker) {
        cb_markers->addItem(QString("M %1").arg(marker));
    }
    cb_maction->setObjectName("cb_maction");
    cb_maction->setToolTip("Select Marker Modification");
    cb_maction->addItems({"High", "Low", "Toggle 1010...", "Pattern"});
    le_pattern->setObjectName("le_pattern");
    le_pattern->setToolTip("Use sequence of '0' and '1' characters as pattern");
    le_pattern->setPlaceholderText("Pattern, such as 1100");
    le_pattern->setValidator(
        new QRegularExpressionValidator(QRegularExpression("[01]+"), le_pattern));
    pb_apply->setObjectName("pb_apply");
    pb_apply->setIcon(lineIcon("markers"));
    pb_undo->setObjectName("pb_undo");
    pb_undo->setIcon(lineIcon("undo"));
    pb_undo->setToolTip("Take the last change back");
    rb_before->setObjectName("rb_before");
    rb_after->setObjectName("rb_after");
    rb_before->setToolTip("Show the markers of the file");
    rb_after->setToolTip("Show the markers with all changes");
    rb_after->setChecked(true);
    lw_edits->setObjectName("lw_edits");
    lw_edits->setToolTip("Changes so far");
    lw_edits->setMinimumHeight(40);
    lw_edits->setMaximumHeight(96);
    for (QPushButton *button : {pb_apply, pb_undo}) {
        button->setAutoDefault(false);
    }
    auto *box = new QGroupBox("Markers");
    auto *row = new QHBoxLayout(box);
    auto *form = new QFormLayout;
    auto *choice = new QHBoxLayout;
    choice->addWidget(cb_markers);
    choice->addWidget(cb_maction, 1);
    form->addRow(choice);
    form->addRow(le_pattern);
    auto *buttons = new QHBoxLayout;
    buttons->addWidget(pb_apply);
    buttons->addWidget(pb_undo);
    form->addRow(buttons);
    auto *list = new QVBoxLayout;
    list->addWidget(lw_edits);
    auto *shown = new QHBoxLayout;
    shown->addWidget(rb_before);
    shown->addWidget(rb_after);
    shown->addStretch();
    list->addLayout(shown);
    row->addLayout(form);
    row->addLayout(list, 1);
    return box;
}

void DlgMarker::sourceChanged()
{
    m_edits.clear();
    m_edited.reset();
    lw_edits->clear();
    refresh();
}

void DlgMarker::refresh()
{
    le_pattern->setEnabled(cb_maction->currentIndex() == static_cast<int>(MarkerAction::Pattern));
    pb_apply->setEnabled(source() != nullptr);
    pb_undo->setEnabled(!m_edits.isEmpty());
    rb_before->setEnabled(!m_edits.isEmpty());
}

void DlgMarker::slot_apply()
{
    if (source() == nullptr) {
        return;
    }
    MarkerEdit edit;
    edit.mask = static_cast<quint8>(1U << static_cast<unsigned>(cb_markers->currentIndex()));
    edit.action = static_cast<MarkerAction>(cb_maction->currentIndex());
    if (edit.action == MarkerAction::Pattern) {
        edit.pattern = le_pattern->text().toLatin1();
    }
    std::tie(edit.first, edit.last) = range();
    if (const QString problem = orderAndCheck(edit, source()->info().samples); !problem.isEmpty()) {
        refuse(problem);
        return;
    }
    Tracer::Trace(
        Tracer::Information,
        QString("Changing Marker from pos. %1 to pos %2.").arg(edit.first + 1).arg(edit.last + 1));
    QList<MarkerEdit> edits = m_edits;
    edits.append(edit);
    if (!preview(edits)) {
        return;
    }
    lw_edits->addItem(QString("%1  %2  %3 to %4")
                          .arg(cb_markers->currentText(), edit.pattern.isEmpty()
                                                              ? cb_maction->currentText()
                                                              : QString::fromLatin1(edit.pattern))
                          .arg(edit.first + 1)
                          .arg(edit.last + 1));
    lw_edits->scrollToBottom();
    m_edits = std::move(edits);
    rb_after->setChecked(true);
    refresh();
    showMarkers();
}

void DlgMarker::slot_undo()
{
    if (m_edits.isEmpty() || !preview(m_edits.first(m_edits.size() - 1))) {
        return;
    }
    m_edits.removeLast();
    delete lw_edits->takeItem(lw_edits->count() - 1);
    rb_after->setChecked(true);
    refresh();
    showMarkers();
}

/// Writes the markers with the edits to a stream that takes the place of the last one. False, with
/// the last one as it was, if that fails or is cancelled.
bool DlgMarker::preview(const QList<MarkerEdit> &edits)
{
    auto edited = std::make_unique<TempStream>();
    if (!edited->open()) {
        return Tracer::fail("Cannot create temporary marker buffer.");
    }
    MarkerPreviewJob job(*source(), *edited->stream(), edits);
    if (runJob(job, this, nullptr) != JobOutcome::Finished) {
        return false;
    }
    view().showMarkers(edited->stream());
    m_edited = std::move(edited);
    return true;
}

void DlgMarker::showMarkers()
{
    if (source() != nullptr) {
        view().showMarkers(m_edited && rb_after->isChecked() ? m_edited->stream()
                                                             : source()->markers());
    }
}

std::unique_ptr<EditJob> DlgMarker::makeJob(const QString &inputFile,
                                            const OutputOptions &output) const
{
    return std::make_unique<MarkerJob>(MarkerRequest{inputFile, output, m_edits});
}
