// SPDX-License-Identifier: Apache-2.0
#include "CWidgetTrackEdit.h"

#include "DlgWvEdit.h"
#include "DlgWvSettings.h"

#include "appearance/lineicon.h"
#include "composer/wholenumbers.h"
#include "log/Tracer.h"

#include <QActionGroup>
#include <QMenu>
#include <QMessageBox>
#include <QPushButton>
#include <QUndoCommand>

#include <algorithm>
#include <cmath>
#include <utility>

namespace {

/// A change of the whole document. The state behind it is taken when it is undone, so that it also
/// holds later changes that the full stack had no place for.
class DocumentChange : public QUndoCommand
{
public:
    explicit DocumentChange(Composition &document)
        : m_document(document)
        , m_other(document)
    {
    }

    void undo() override { std::swap(m_document, m_other); }
    void redo() override
    {
        // The first time the change is yet to be made.
        if (std::exchange(m_made, true)) {
            std::swap(m_document, m_other);
        }
    }

private:
    Composition &m_document;
    Composition m_other;
    bool m_made = false;
};

} // namespace

CWidgetTrackEdit::CWidgetTrackEdit(QWidget *parent)
    : CWidgetBase(parent)
    , m_editor([this] { pushUndo(); })
    , m_infoActions(new QActionGroup(this))
{
    setObjectName(QStringLiteral("w_tracks"));
    setAccessibleName(QStringLiteral("Tracks"));
    setFocusPolicy(Qt::StrongFocus);
    setAcceptDrops(true);
    setPlotMargins({8, 4, 12, 4});
    connect(&m_envelopes, &EnvelopeStore::changed, this, qOverload<>(&QWidget::update));
    const std::pair<const char *, void (CWidgetTrackEdit::*)()> choices[] = {
        {"Used Samples", &CWidgetTrackEdit::info_samples},
        {"Play Time", &CWidgetTrackEdit::info_playtime},
        {"Clock Rate", &CWidgetTrackEdit::info_clock},
        {"First Sample", &CWidgetTrackEdit::info_start},
        {"Frequency Offset", &CWidgetTrackEdit::info_freq},
        {"Attenuation", &CWidgetTrackEdit::info_lev},
        {"Start Sample", &CWidgetTrackEdit::info_targetstart},
        {"Start Time", &CWidgetTrackEdit::info_targetstarttime},
    };
    for (const auto &[text, slot] : choices) {
        QAction *action = m_infoActions->addAction(QString::fromLatin1(text));
        action->setCheckable(true);
        connect(action, &QAction::triggered, this, slot);
    }
    m_infoActions->actions().constFirst()->setChecked(true);
}

TrackGeometry CWidgetTrackEdit::geometryOfTracks() const
{
    return {plotRect().toRect(), composition().trackCount(),
            composition().timeToSample(m_viewStart), composition().timeToSample(m_viewEnd)};
}

void CWidgetTrackEdit::drawPlot(QPainter &painter, const QRectF &area)
{
    TrackScene scene{&composition(),
                     cursor(),
                     m_viewStart,
                     m_viewEnd,
                     m_info,
                     m_dragging ? m_dragged : DraggedSegment(),
                     [this](const QString &name) { return m_envelopes.find(name); }};
    const TrackGeometry geometry = geometryOfTracks();
    TrackPainter(plotStyle(), scene, geometry).paint(painter, area);
}

void CWidgetTrackEdit::pushUndo()
{
    // A full stack keeps its oldest states, and this change is not remembered.
    if (m_undo.index() < UndoLimit) {
        m_undo.push(new DocumentChange(m_editor.composition()));
        emit undoSize(m_undo.index());
    }
}

void CWidgetTrackEdit::popUndo()
{
    if (m_undo.canUndo()) {
        m_undo.undo();
        emit undoSize(m_undo.index());
        update();
    }
}

void CWidgetTrackEdit::redo()
{
    if (m_undo.canRedo()) {
        m_undo.redo();
        emit undoSize(m_undo.index());
        update();
    }
}

void CWidgetTrackEdit::tellCursor()
{
    emit mouse_xcsr(cursor(), composition().sampleToTime(std::max<qint64>(cursor(), 0)));
}

void CWidgetTrackEdit::edited()
{
    m_editor.composition().markAt(cursor());
    update();
    emit targetChanged();
    tellCursor();
}

void CWidgetTrackEdit::insertFile(const QString &name)
{
    bool wasEmpty = false;
    if (!m_editor.insertFile(name, wasEmpty)) {
        return;
    }
    if (wasEmpty && composition().target.dTime > 0) {
        showRange(0, 2 * composition().target.dTime);
    }
    edited();
}

void CWidgetTrackEdit::overwriteFile(const QString &name)
{
    if (m_editor.overwriteFile(name)) {
        edited();
    }
}

void CWidgetTrackEdit::extract()
{
    if (m_editor.extract()) {
        edited();
    }
}

void CWidgetTrackEdit::lift()
{
    if (m_editor.lift()) {
        edited();
    }
}

void CWidgetTrackEdit::setTargetName(const QString &name)
{
    m_editor.composition().target.sName = name;
}

void CWidgetTrackEdit::addTrack()
{
    m_editor.addTrack();
    update();
}

void CWidgetTrackEdit::deleteTrack()
{
    m_editor.deleteTracks();
    update();
    emit targetChanged();
}

void CWidgetTrackEdit::clearAll(bool bQuiet)
{
    if (!bQuiet) {
        QMessageBox box(QMessageBox::Warning, QStringLiteral("Delete All"),
                        QStringLiteral("Do you really want to delete everything.\n"
                                       "This action can not be undone."),
                        QMessageBox::Cancel, this);
        const QPushButton *confirm =
            box.addButton(QStringLiteral("Delete"), QMessageBox::AcceptRole);
        box.setDefaultButton(QMessageBox::Cancel);
        box.exec();
        if (box.clickedButton() != confirm) {
            return;
        }
    }
    m_editor.clear();
    m_undo.clear();
    emit undoSize(0);
    update();
    emit targetChanged();
}

void CWidgetTrackEdit::set_wvend()
{
    m_editor.setEndToCursor();
    update();
    emit targetChanged();
}

void CWidgetTrackEdit::targetSettings()
{
    DlgWvSettings dialog(composition(), this);
    if (dialog.exec() == QDialog::Accepted) {
        static_cast<void>(m_editor.applyTarget(dialog.target()));
        edited();
    }
}

void CWidgetTrackEdit::editSegment(int track, qint64 sample)
{
    const auto place = composition().segmentAt(track, sample);
    if (!place) {
        return;
    }
    Tracer::Trace(Tracer::Debug, QStringLiteral("Segment borders %1 - %2")
                                     .arg(place->borders.first)
                                     .arg(place->borders.last));
    DlgWvEdit dialog(*composition().segment(track, place->index),
                     m_editor.freeStarts(track, place->index), composition(), this);
    dialog.setWindowTitle(QStringLiteral("Segment Settings - Track %1").arg(track + 1));
    if (dialog.exec() == QDialog::Accepted) {
        m_editor.applySegment(track, place->index, dialog.segment());
        static_cast<void>(m_editor.composition().adjustTarget());
    }
    edited();
}

bool CWidgetTrackEdit::saveAll(const QString &fileName)
{
    return composition().save(fileName) || Tracer::fail("Error saving settings file. ");
}

bool CWidgetTrackEdit::loadAll(const QString &fileName)
{
    const bool loaded = m_editor.composition().load(fileName);
    if (!loaded) {
        Tracer::Trace(Tracer::Error, "Error loading settings file. ");
    }
    const double end = composition().longestTrackEnd();
    showRange(0, end > 0 ? end : 1);
    moveCursor(std::min(cursor(), composition().target.lSamples));
    edited();
    return loaded;
}

void CWidgetTrackEdit::showInfo(CenterInfo info)
{
    m_info = info;
    m_infoActions->actions().at(static_cast<int>(info))->setChecked(true);
    update();
}

void CWidgetTrackEdit::showRange(double startSeconds, double endSeconds)
{
    m_viewStart = std::max(startSeconds, 0.0);
    m_viewEnd = std::max(endSeconds, m_viewStart);
    update();
}

void CWidgetTrackEdit::zoom(double factor, const char *words)
{
    // In whole microseconds, so that the range doesn't drift.
    const qint64 from = wholePart(m_viewStart * 1e6 + 0.5);
    const qint64 to = wholePart(m_viewEnd * 1e6 + 0.5);
    if (from < 0 || to < 0) {
        Tracer::Trace(Tracer::Error, "Invalid time range. Values must be > 0.");
        return;
    }
    const double time = composition().sampleToTime(std::max<qint64>(cursor(), 0)) * 1e6;
    const double centre = time >= static_cast<double>(from) && time <= static_cast<double>(to)
                              ? time
                              : static_cast<double>(from + to) / 2;
    constexpr double Longest = 1e15;
    const auto newFrom =
        std::max<qint64>(wholePart(centre - (centre - static_cast<double>(from)) * factor), 0);
    const qint64 newTo =
        wholePart(std::min(centre + (static_cast<double>(to) - centre) * factor, Longest));
    // Below this there is nothing left to see.
    if (newTo - newFrom < 2) {
        return;
    }
    showRange(static_cast<double>(newFrom) / 1e6, static_cast<double>(newTo) / 1e6);
    Tracer::Trace(Tracer::Debug, QString(words).arg(m_viewEnd - m_viewStart));
}

void CWidgetTrackEdit::zoomIn()
{
    zoom(0.5, "Zoom in -> %1 s.");
}

void CWidgetTrackEdit::zoomOut()
{
    zoom(2, "Zoom out -> %1 s.");
}

void CWidgetTrackEdit::zoomFit()
{
    const double time = composition().target.dTime;
    showRange(0, time > 0 ? time : 1);
}

void CWidgetTrackEdit::moveStart()
{
    showRange(0, m_viewEnd - m_viewStart);
}

void CWidgetTrackEdit::moveEnd()
{
    const double width = m_viewEnd - m_viewStart;
    const double end = std::max(composition().target.dTime, width);
    showRange(end - width, end);
}

void CWidgetTrackEdit::moveCursor(qint64 sample)
{
    m_editor.setCursor(std::max<qint64>(sample, 0));
    m_editor.composition().markAt(cursor());
    update();
}

void CWidgetTrackEdit::setCsrSample(double sample)
{
    moveCursor(wholePart(sample));
    tellCursor();
}

void CWidgetTrackEdit::setCsrTime(double seconds)
{
    moveCursor(composition().timeToSample(seconds));
    tellCursor();
}

void CWidgetTrackEdit::setCsrBegin()
{
    setCsrSample(0);
}

void CWidgetTrackEdit::setCsrEnd()
{
    setCsrSample(static_cast<double>(composition().target.lSamples));
}

void CWidgetTrackEdit::extendContextMenu(QMenu &menu)
{
    QMenu *information = menu.addMenu(QStringLiteral("Center Information"));
    information->addActions(m_infoActions->actions());
    QMenu *zoomMenu = menu.addMenu(QStringLiteral("Zoom"));
    const auto icon = [](const char *name) { return lineIcon(QString::fromLatin1(name)); };
    zoomMenu->addAction(icon("jump_start"), QStringLiteral("To Beginning"), this,
                        &CWidgetTrackEdit::moveStart);
    zoomMenu->addAction(icon("jump_end"), QStringLiteral("To End"), this,
                        &CWidgetTrackEdit::moveEnd);
    zoomMenu->addAction(icon("zoom_fit"), QStringLiteral("Fit All"), this,
                        &CWidgetTrackEdit::zoomFit);
    zoomMenu->addAction(icon("zoom_in"), QStringLiteral("Zoom In"), this,
                        &CWidgetTrackEdit::zoomIn);
    zoomMenu->addAction(icon("zoom_out"), QStringLiteral("Zoom Out"), this,
                        &CWidgetTrackEdit::zoomOut);
    menu.addAction(QStringLiteral("Set End to Cursor"), this, &CWidgetTrackEdit::set_wvend);
}
