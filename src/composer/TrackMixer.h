// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "SegmentBuffers.h"
#include "TrackPlay.h"

#include <optional>
#include <vector>

/// Sums the enabled tracks of a composition, block by block and in the order of time.
///
/// The document says for each output sample anew what is played, so all that changes only at the
/// borders of segments is settled there: see plan(). What is left is done by the processors, which
/// doesn't change the sums.
class TrackMixer
{
public:
    /// Samples of a block.
    static constexpr int BlockSamples = 32 * 1024;

    /// Both outlive the mixer.
    TrackMixer(const Composition &composition, SegmentBufferMap &buffers);

    /// The next `samples` samples, at most BlockSamples. False, with the reason logged, on failure.
    [[nodiscard]] bool mix(int samples);

    /// The sum of the last block: I and Q in turn, and a marker byte for each sample.
    [[nodiscard]] std::span<const float> samples() const;
    [[nodiscard]] std::span<const quint8> markers() const;

private:
    /// Samples of a block that follow each other in one play.
    struct Piece
    {
        TrackPlay *play = nullptr;
        int offset = 0; ///< in the block
        int count = 0;
    };

    /// A part of a piece with the same factor throughout, or with one for each sample.
    struct Run
    {
        int offset = 0;
        int count = 0;
        double factor = 1;
        bool weighted = false;
    };

    struct Track
    {
        int number = 0;
        std::vector<SegmentBorders> borders;           ///< of all segments
        std::vector<std::unique_ptr<TrackPlay>> ended; ///< in this block
        std::unique_ptr<TrackPlay> play;               ///< null in a gap
        qint64 nextChange = 0; ///< output sample at which the play ends or another may begin
        std::vector<Piece> pieces;
        std::vector<Run> runs;
        std::vector<float> samples;
        std::vector<double> factors;
        std::vector<quint8> markers;
        bool ok = true;
    };

    [[nodiscard]] bool takeBorders();
    void plan(qint64 begin, qint64 end);
    void choose(Track &track, qint64 sample);
    [[nodiscard]] bool fetch(Track &track, qint64 begin);
    void sum(int offset, int count);

    const Composition &m_composition;
    SegmentBufferMap &m_buffers;
    std::vector<Track> m_tracks;
    qint64 m_position = 0; ///< output sample behind the last block
    bool m_started = false;
    std::vector<float> m_samples;
    std::vector<quint8> m_markers;
    std::atomic<bool> m_warned{false};
};
