// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "Composition.h"

#include <QString>

#include <functional>

/// The edits as the user gives them: at a cursor, with their checks and their lines in the log.
/// Each one that changes the document says so before, for an undo, and derives the target anew
/// behind.
///
/// An edit returns whether the document may have changed, so that it is to be shown again.
class CompositionEditor
{
public:
    /// The document before a change.
    using BeforeChange = std::function<void()>;

    explicit CompositionEditor(BeforeChange beforeChange);

    [[nodiscard]] const Composition &composition() const { return m_composition; }
    [[nodiscard]] Composition &composition() { return m_composition; }
    [[nodiscard]] qint64 cursor() const { return m_cursor; } ///< target sample
    void setCursor(qint64 sample) { m_cursor = sample; }

    /// Puts a whole file at the cursor. `wasEmpty` tells whether nothing sounded before.
    [[nodiscard]] bool insertFile(const QString &name, bool &wasEmpty);
    [[nodiscard]] bool overwriteFile(const QString &name);
    [[nodiscard]] bool extract();
    [[nodiscard]] bool lift();
    void addTrack();
    void deleteTracks();
    void clear();

    /// The target ends at the cursor.
    void setEndToCursor();

    /// Takes over what a dialog has made of a segment.
    void applySegment(int track, int index, const ComposerSegment &edited);
    /// Takes over what a dialog has made of the target.
    [[nodiscard]] bool applyTarget(const ComposerTarget &edited);
    /// Moves a segment in time within the free room around it; false if it stays where it is.
    [[nodiscard]] bool moveSegment(int track, int index, qint64 target);
    /// Where a segment can start without touching its neighbours.
    [[nodiscard]] SegmentBorders freeStarts(int track, int index) const;

private:
    [[nodiscard]] bool placeFile(const QString &name, bool inserts, bool &wasEmpty);
    [[nodiscard]] bool removeAtCursor(bool closesGap);
    void scaleCursor(double oldClockHz);

    BeforeChange m_beforeChange;
    Composition m_composition;
    qint64 m_cursor = 0;
};
