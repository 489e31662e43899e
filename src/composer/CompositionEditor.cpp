// SPDX-License-Identifier: Apache-2.0
#include "CompositionEditor.h"

#include "wholenumbers.h"

#include "log/Tracer.h"
#include "wvfile/HvFileIO.h"

#include <QFileInfo>

#include <algorithm>
#include <limits>
#include <utility>

namespace {

/// The highest target clock at which something can be placed.
constexpr double MaxTargetClockHz = 1e9;

} // namespace

CompositionEditor::CompositionEditor(BeforeChange beforeChange)
    : m_beforeChange(std::move(beforeChange))
{
}

bool CompositionEditor::insertFile(const QString &name, bool &wasEmpty)
{
    return placeFile(name, true, wasEmpty);
}

bool CompositionEditor::overwriteFile(const QString &name)
{
    bool wasEmpty = false;
    return placeFile(name, false, wasEmpty);
}

bool CompositionEditor::placeFile(const QString &name, bool inserts, bool &wasEmpty)
{
    wasEmpty = false;
    const QString words = inserts
                              ? QStringLiteral("Inserting new segment '%1' at position %2.")
                              : QStringLiteral("Overwriting with new segment '%1' at position %2.");
    Tracer::Trace(Tracer::Information, words.arg(name).arg(m_cursor));
    if (m_cursor < 0) {
        return Tracer::fail("Invalid cursor position.");
    }
    if (name.isEmpty()) {
        return Tracer::fail("File name cannot be empty.");
    }
    if (m_composition.trackCount() == 0) {
        return Tracer::fail(
            inserts ? "No tracks available for insert operation. Create tracks first."
                    : "No tracks available for overwrite operation. Create tracks first.");
    }
    WvFileSummary summary;
    if (!HvFileIO().readWaveformInfo(name, &summary)) {
        return Tracer::fail("Waveform data cannot be evaluated. Probably invalid file format.");
    }
    ComposerSegment segment;
    segment.sName = name;
    segment.lSamples = summary.samples;
    segment.lUsed = summary.samples;
    segment.dSrcClk = summary.clock;
    segment.lTarget = m_cursor;
    segment.bAdjOfs = false;
    segment.dAdjLim = 0;
    const double oldClockHz = m_composition.target.dUsrClk;
    if (oldClockHz < 0 || oldClockHz > MaxTargetClockHz) {
        return Tracer::fail("Invalid clock rate used in waveform file.");
    }
    m_beforeChange();
    const bool hadSegments = m_composition.longestSegmentEnd() > 0;
    if (!(inserts ? m_composition.insertSegment(segment)
                  : m_composition.overwriteSegment(segment))) {
        static_cast<void>(Tracer::fail(inserts ? "Cannot insert segment."
                                               : "Cannot overwrite with new segment."));
        return true;
    }
    static_cast<void>(m_composition.adjustTarget());
    if (inserts) {
        if (const auto borders = m_composition.segmentBorders(segment)) {
            m_cursor = boundedSum(borders->last, 1);
        }
        wasEmpty = !hadSegments;
    } else {
        scaleCursor(oldClockHz);
        m_cursor = m_composition.nearestBorder(m_cursor);
    }
    return true;
}

void CompositionEditor::scaleCursor(double oldClockHz)
{
    m_cursor =
        wholePart(static_cast<double>(m_cursor) * (m_composition.target.dUsrClk / oldClockHz));
}

bool CompositionEditor::extract()
{
    return removeAtCursor(true);
}

bool CompositionEditor::lift()
{
    return removeAtCursor(false);
}

bool CompositionEditor::removeAtCursor(bool closesGap)
{
    Tracer::Trace(Tracer::Information,
                  (closesGap ? QStringLiteral("Extracting segment(s) at position %1.")
                             : QStringLiteral("Lifting segment(s) at position %1."))
                      .arg(m_cursor));
    if (m_cursor < 0) {
        return Tracer::fail("Invalid cursor position.");
    }
    m_beforeChange();
    // What can fail here, an invalid clock, has been logged; the rest of the tracks is done.
    static_cast<void>(closesGap ? m_composition.extractAt(m_cursor)
                                : m_composition.liftAt(m_cursor));
    const double oldClockHz = m_composition.target.dUsrClk;
    static_cast<void>(m_composition.adjustTarget());
    scaleCursor(oldClockHz);
    return true;
}

void CompositionEditor::addTrack()
{
    m_beforeChange();
    m_composition.addTrack();
}

void CompositionEditor::deleteTracks()
{
    m_beforeChange();
    m_composition.deleteSelectedTracks();
}

void CompositionEditor::clear()
{
    m_composition.clear();
    m_cursor = 0;
}

void CompositionEditor::setEndToCursor()
{
    m_beforeChange();
    static_cast<void>(m_composition.setPlayTime(m_composition.sampleToTime(m_cursor)));
    m_composition.target.iLenMode = UserDefinedLength;
    m_composition.target.bSamples = false;
}

void CompositionEditor::applySegment(int track, int index, const ComposerSegment &edited)
{
    if (m_composition.segment(track, index) == nullptr) {
        return;
    }
    m_beforeChange();
    ComposerSegment &segment = *m_composition.segment(track, index);
    if (edited.sName != segment.sName) {
        Tracer::Trace(Tracer::Debug,
                      QStringLiteral("Segment waveform changed to '%1'").arg(edited.sName));
        segment.sName = edited.sName;
        segment.missing = !QFileInfo(edited.sName).isFile();
        segment.lSamples = edited.lSamples;
        segment.dSrcClk = edited.dSrcClk;
    }
    segment.dFOfs = edited.dFOfs;
    segment.dLOfs = edited.dLOfs;
    segment.lStart = edited.lStart;
    segment.lUsed = edited.lUsed;
    segment.dFadeIn = edited.dFadeIn;
    segment.iFadeIn = edited.iFadeIn;
    segment.dFadeOut = edited.dFadeOut;
    segment.iFadeOut = edited.iFadeOut;
    segment.bAdjOfs = edited.bAdjOfs;
    segment.dAdjLim = edited.dAdjLim;
    segment.bMkr = edited.bMkr;
    segment.bWrap = edited.bWrap;
    if (edited.lTarget != segment.lTarget) {
        Tracer::Trace(Tracer::Debug,
                      QStringLiteral("Segment position changed to sample %1").arg(edited.lTarget));
        segment.lTarget = edited.lTarget;
    }
}

bool CompositionEditor::applyTarget(const ComposerTarget &edited)
{
    m_beforeChange();
    ComposerTarget &target = m_composition.target;
    target.sName = edited.sName;
    target.iLenMode = edited.iLenMode;
    target.bSamples = edited.bSamples;
    target.bClk = edited.bClk;
    const double oldClockHz = target.dUsrClk;
    if (!target.bClk && !m_composition.setTargetClock(edited.dUsrClk)) {
        return false;
    }
    if (target.iLenMode == UserDefinedLength) {
        if (target.bSamples) {
            target.lSamples = edited.lSamples;
            target.dTime = m_composition.sampleToTime(edited.lSamples);
        } else {
            static_cast<void>(m_composition.setPlayTime(edited.dTime));
        }
    }
    const bool adjusted = m_composition.adjustTarget();
    scaleCursor(oldClockHz);
    return adjusted;
}

SegmentBorders CompositionEditor::freeStarts(int track, int index) const
{
    const ComposerSegment *segment = m_composition.segment(track, index);
    if (segment == nullptr) {
        return {};
    }
    SegmentBorders room{0, std::numeric_limits<qint32>::max()};
    const ComposerSegment *before = m_composition.segment(track, index - 1);
    const auto borders = before != nullptr ? m_composition.segmentBorders(*before) : std::nullopt;
    if (borders) {
        room.first = std::max<qint64>(boundedSum(borders->last, 1), 0);
    }
    if (const ComposerSegment *next = m_composition.segment(track, index + 1)) {
        room.last = boundedDifference(next->lTarget, m_composition.targetSamples(*segment));
    }
    // A segment that lies over its neighbours already can stay where it is.
    room.first = std::min(room.first, segment->lTarget);
    room.last = std::max(room.last, segment->lTarget);
    return room;
}

bool CompositionEditor::moveSegment(int track, int index, qint64 target)
{
    const ComposerSegment *segment = m_composition.segment(track, index);
    if (segment == nullptr) {
        return false;
    }
    const SegmentBorders room = freeStarts(track, index);
    const qint64 start = std::clamp(target, room.first, room.last);
    if (start == segment->lTarget) {
        return false;
    }
    ComposerSegment moved = *segment;
    moved.lTarget = start;
    applySegment(track, index, moved);
    static_cast<void>(m_composition.adjustTarget());
    return true;
}
