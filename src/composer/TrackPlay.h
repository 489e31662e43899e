// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "Composition.h"

#include <QString>

#include <atomic>
#include <memory>
#include <span>
#include <vector>

struct SegmentBuffers;

/// One segment being played on a track, from one output sample to another: where its samples come
/// from and what they are multiplied with.
class TrackPlay
{
public:
    /// The normal play from the segment's first sample on. The composition and the buffers outlive
    /// the play.
    [[nodiscard]] static std::unique_ptr<TrackPlay> start(const Composition &composition, int track,
                                                          int index, const SegmentBorders &borders,
                                                          SegmentBuffers &buffers);

    /// The play at the start of the target of what ran past its end.
    [[nodiscard]] static std::unique_ptr<TrackPlay> startWrapped(const Composition &composition,
                                                                 int track, int index,
                                                                 const SegmentBorders &borders,
                                                                 SegmentBuffers &buffers);

    /// Frees the streams' memory.
    ~TrackPlay();
    TrackPlay(const TrackPlay &) = delete;
    TrackPlay &operator=(const TrackPlay &) = delete;

    [[nodiscard]] qint64 last() const { return m_borders.last; } ///< output sample
    [[nodiscard]] bool usesMarkers() const { return m_usesMarkers; }
    [[nodiscard]] double gain() const { return m_gain; }

    /// Reads the next samples, interleaved I and Q. Behind the end of the stream, which a stream of
    /// a lower clock reaches early, is silence; `warned` is set where that is told. False, with the
    /// reason logged, if the streams can't be read.
    [[nodiscard]] bool read(std::span<float> samples, std::atomic<bool> &warned);
    /// Ends the reading; another play of the same segment may follow.
    void close();
    [[nodiscard]] bool readMarkers(std::span<quint8> markers);

    /// The first output sample from `from` on at which a fade starts or ends; beyond the last one
    /// if there is none.
    [[nodiscard]] qint64 nextFadeBorder(qint64 from) const;
    [[nodiscard]] bool isFading(qint64 sample) const;
    /// Gain and fades of the output samples from `first` on.
    void weigh(qint64 first, std::span<double> factors) const;

private:
    struct Fade
    {
        qint64 start = 0;  ///< output sample
        qint64 length = 0; ///< output samples, 0 for none
        int shape = FadeLinear;

        [[nodiscard]] bool contains(qint64 sample) const
        {
            return start <= sample && sample - start < length;
        }
        /// How far the fade has come at a sample, from 0 to below 1.
        [[nodiscard]] double share(qint64 sample) const
        {
            return static_cast<double>(sample - start) / static_cast<double>(length);
        }
    };

    TrackPlay(const Composition &composition, int track, int index, const SegmentBorders &borders,
              qint64 sourceStart, SegmentBuffers &buffers);

    [[nodiscard]] bool open();
    [[nodiscard]] QString place() const;

    int m_track;
    int m_index;
    SegmentBorders m_borders; ///< output samples
    qint64 m_sourceStart;     ///< sample of the streams
    SegmentBuffers &m_buffers;
    bool m_open = false;
    bool m_usesMarkers;
    double m_gain;
    Fade m_fadeIn;
    Fade m_fadeOut;
};
