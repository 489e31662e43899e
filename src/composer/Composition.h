// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <QString>
#include <QtGlobal>

#include <optional>
#include <vector>

class QDir;
class QIODevice;

/// How a segment's level rises and falls.
enum FadeShape {
    FadeLinear = 0,
    FadeRaisedCosine = 1,
    FadeSquareRoot = 2,
    FadeBlank = 3,
};

/// What decides about the length of the target waveform.
enum LengthMode {
    LongestTrackWins = 0,
    LongestSegmentWins = 1,
    UserDefinedLength = 2,
};

/// One piece of a source waveform on a track. Source samples count at the file's clock, target
/// samples at that of the target; only the conversions of Composition relate the two.
struct ComposerSegment
{
    QString sName;         ///< source file, absolute
    bool missing = false;  ///< the source file was not found; not saved
    double dFOfs = 0;      ///< frequency offset, Hz
    double dLOfs = 0;      ///< attenuation, dB
    bool bAdjOfs = true;   ///< the frequency offset may be moved to close the loop
    double dAdjLim = 0.1;  ///< by how many percent of its size
    double dFadeIn = 0;    ///< s
    qint32 iFadeIn = 0;    ///< a FadeShape
    double dFadeOut = 0;   ///< s
    qint32 iFadeOut = 0;   ///< a FadeShape
    qint64 lSamples = 0;   ///< of the source file
    double dSrcClk = 0;    ///< of the source file, Hz
    qint64 lStart = 0;     ///< first used source sample
    qint64 lUsed = 0;      ///< used source samples
    qint64 lTarget = 0;    ///< target sample at which the segment starts
    bool bMkr = false;     ///< its markers go to the output
    bool bWrap = false;    ///< what runs past the target's end goes on at its start
    bool selected = false; ///< lies under the cursor on a selected track; not saved

    [[nodiscard]] bool hasFrequencyOffset() const;
    [[nodiscard]] bool hasLevelOffset() const;
    [[nodiscard]] bool isTruncatedAtStart() const { return lStart > 0; }
    [[nodiscard]] bool isTruncatedAtEnd() const;
};

/// Segments in the order of time.
struct ComposerTrack
{
    std::vector<ComposerSegment> segments;
    bool bEnable = true; ///< takes part in the render
    bool bSelect = true; ///< edits act on it
};

struct ComposerTarget
{
    QString sName = QStringLiteral("compositing.wv"); ///< output file, absolute
    qint32 iLenMode = LongestTrackWins;
    bool bSamples = false; ///< a length of the user's own was given in samples
    qint64 lSamples = 0;   ///< length in target samples
    double dTime = 0;      ///< length in s
    bool bClk = true;      ///< the highest clock of all segments wins
    double dUsrClk = 1e6;  ///< the clock in force, Hz

    /// Sets all but the name to the start values.
    void reset();
};

/// Where a segment lies on the target's time axis; both ends belong to it. An empty one ends before
/// it starts.
struct SegmentBorders
{
    qint64 first = 0;
    qint64 last = 0;

    [[nodiscard]] bool contains(qint64 sample) const { return first <= sample && sample <= last; }
    [[nodiscard]] qint64 count() const;
};

/// The segment at a sample and the free room around it.
struct SegmentPlace
{
    int index = 0;
    SegmentBorders borders;
    qint64 gapFirst = -1; ///< sample after the end of the segment before, -1 without one
    qint64 gapLast = -1;  ///< last sample before the start of the next segment, -1 without one
};

/// The frequency offset that a segment is rendered with.
struct EffectiveOffset
{
    double hz = 0;
    bool limited = false; ///< the permitted deviation is too small to close the loop
};

/// The document of the Composer: tracks of segments and the target into which they are rendered. A
/// value: copies are independent. Failures leave it as it was, unless stated otherwise, and are
/// logged. Tracks and segments count from 0 here and from 1 in messages.
class Composition
{
public:
    static constexpr int MaxTracks = 16;

    ComposerTarget target;

    [[nodiscard]] const std::vector<ComposerTrack> &tracks() const { return m_tracks; }
    [[nodiscard]] int trackCount() const { return static_cast<int>(m_tracks.size()); }
    [[nodiscard]] int segmentCount(int track) const; ///< 0 for a track that isn't there
    /// Null for a number out of range. Valid until the next edit.
    [[nodiscard]] ComposerTrack *track(int track);
    [[nodiscard]] const ComposerSegment *segment(int track, int index) const;
    [[nodiscard]] ComposerSegment *segment(int track, int index);

    [[nodiscard]] bool needsResampling(const ComposerSegment &segment) const;

    /// Cuts off what isn't a whole sample; -1 with a negative target clock.
    [[nodiscard]] qint64 timeToSample(double seconds) const;
    /// In s; -1 with a negative target clock or sample.
    [[nodiscard]] double sampleToTime(qint64 samples) const;
    /// Sets the target's length to the whole samples within the time.
    [[nodiscard]] bool setPlayTime(double seconds);
    /// Length of the used part in target samples; 0 if a clock is invalid.
    [[nodiscard]] qint64 targetSamples(const ComposerSegment &segment) const;
    [[nodiscard]] std::optional<SegmentBorders>
    segmentBorders(const ComposerSegment &segment) const;
    /// The times of all segments stay, their sample positions follow the clock.
    [[nodiscard]] bool setTargetClock(double clockHz);

    /// End of the segment of the longest duration in s; negative on failure.
    [[nodiscard]] double longestSegmentEnd() const;
    /// The latest end of a track's last segment in s, its source counted as a whole; negative on
    /// failure.
    [[nodiscard]] double longestTrackEnd() const;
    /// In Hz; 1 MHz without segments.
    [[nodiscard]] double highestClock() const;
    /// Derives clock and length of the target anew, as its modes tell; to be called after an edit.
    [[nodiscard]] bool adjustTarget();

    /// The edge of a segment of a selected track, or of the target, that lies closest; -1 on
    /// failure.
    [[nodiscard]] qint64 nearestBorder(qint64 position) const;
    /// The first segment of a track that lies over a sample.
    [[nodiscard]] std::optional<SegmentPlace> segmentAt(int track, qint64 sample) const;
    /// Marks what lies under the cursor on the selected tracks; `track` -1 means all of them.
    void markAt(qint64 cursor, int track = -1);

    /// The offset closest to that of the segment, within its permitted deviation, with which the
    /// segment holds a whole number of rotations.
    [[nodiscard]] EffectiveOffset effectiveOffset(const ComposerSegment &segment) const;

    /// Appends an empty track; false at MaxTracks.
    bool addTrack();
    /// Removes the selected tracks; one that slides into the first place stays.
    void deleteSelectedTracks();
    /// Removes all tracks and resets the target.
    void clear();

    /// Puts a copy of a whole file's segment into each selected track at its lTarget and moves what
    /// follows; a failure may leave some tracks changed.
    [[nodiscard]] bool insertSegment(const ComposerSegment &segment);
    /// As above, but replaces what the segment covers.
    [[nodiscard]] bool overwriteSegment(const ComposerSegment &segment);
    /// Removes the segment at a sample from each selected track; what follows stays.
    [[nodiscard]] bool liftAt(qint64 sample);
    /// As above; what follows moves up.
    [[nodiscard]] bool extractAt(qint64 sample);

    /// Writes and reads a .cms file, whose file names are relative to its folder. A file that can't
    /// be opened or read as XML leaves the document untouched, one with another root empties it.
    [[nodiscard]] bool save(const QString &fileName) const;
    [[nodiscard]] bool load(const QString &fileName);

    /// The same without the file: names are relative to `folder`. fromXml() returns what is wrong,
    /// empty for nothing, and logs none of it.
    [[nodiscard]] QByteArray toXml(const QDir &folder) const;
    [[nodiscard]] QString fromXml(QIODevice &device, const QDir &folder);

private:
    [[nodiscard]] qint64 scaledLength(const ComposerSegment &segment) const;
    [[nodiscard]] bool mayPlace(const ComposerSegment &segment, const QString &what) const;
    [[nodiscard]] bool insertInto(ComposerTrack &track, const ComposerSegment &segment,
                                  qint64 length) const;
    [[nodiscard]] bool overwriteInto(int track, const ComposerSegment &segment, qint64 length);
    [[nodiscard]] bool overwriteSplit(int track, std::size_t index, const ComposerSegment &segment,
                                      qint64 length);
    [[nodiscard]] bool removeCovered(int track, std::size_t index, qint64 end,
                                     const QString &coveredBy);
    [[nodiscard]] bool removeAt(qint64 sample, bool closesGap);

    std::vector<ComposerTrack> m_tracks;
};
