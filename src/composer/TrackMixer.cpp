// SPDX-License-Identifier: Apache-2.0
#include "TrackMixer.h"

#include "mixkernels.h"

#include "base/parallel.h"
#include "log/Tracer.h"
#include "streams/samplestream.h"

#include <algorithm>
#include <limits>

namespace {

/// Samples that one processor sums at a time.
constexpr int PartSamples = 4 * 1024;

[[nodiscard]] std::size_t at(int index)
{
    return static_cast<std::size_t>(index);
}

} // namespace

TrackMixer::TrackMixer(const Composition &composition, SegmentBufferMap &buffers)
    : m_composition(composition)
    , m_buffers(buffers)
{
}

std::span<const float> TrackMixer::samples() const
{
    return m_samples;
}

std::span<const quint8> TrackMixer::markers() const
{
    return m_markers;
}

bool TrackMixer::takeBorders()
{
    for (int number = 0; number < m_composition.trackCount(); ++number) {
        if (!m_composition.tracks()[at(number)].bEnable) {
            continue;
        }
        Track track;
        track.number = number;
        for (int i = 0; i < m_composition.segmentCount(number); ++i) {
            const auto borders = m_composition.segmentBorders(*m_composition.segment(number, i));
            // An empty segment ends before it starts, at the very beginning even before sample 0.
            if (!borders || borders->first < 0 || borders->last < -1) {
                return Tracer::fail(QStringLiteral("Track %1, segment %2 has no valid place in the "
                                                   "target.")
                                        .arg(number + 1)
                                        .arg(i + 1));
            }
            track.borders.push_back(*borders);
        }
        m_tracks.push_back(std::move(track));
    }
    return true;
}

void TrackMixer::choose(Track &track, qint64 sample)
{
    if (track.play) {
        track.ended.push_back(std::move(track.play));
    }
    const qint64 length = m_composition.target.lSamples;
    track.nextChange = std::numeric_limits<qint64>::max();
    const auto note = [&](qint64 start) {
        track.nextChange = start > sample ? std::min(track.nextChange, start) : track.nextChange;
    };
    for (int i = 0; i < static_cast<int>(track.borders.size()); ++i) {
        const SegmentBorders &borders = track.borders[at(i)];
        SegmentBuffers &buffers = m_buffers[sampleKey(track.number, i)];
        const bool wraps = m_composition.segment(track.number, i)->bWrap;
        const char *words = nullptr;
        if (borders.contains(sample)) {
            words = "Starting Track %1, Segment %2 for OUT-Sample %3";
            track.play = TrackPlay::start(m_composition, track.number, i, borders, buffers);
        } else if (wraps &&
                   SegmentBorders{borders.first - length, borders.last - length}.contains(sample)) {
            words = "  Starting Wrap-Around Track %1, Segment %2 for OUT-Sample %3";
            track.play = TrackPlay::startWrapped(m_composition, track.number, i, borders, buffers);
        }
        if (track.play) {
            Tracer::Trace(Tracer::Debug,
                          QString(words).arg(track.number + 1).arg(i + 1).arg(sample));
            track.nextChange = track.play->last() + 1;
            return;
        }
        note(borders.first);
        if (wraps) {
            note(borders.first - length);
        }
    }
}

void TrackMixer::plan(qint64 begin, qint64 end)
{
    for (Track &track : m_tracks) {
        track.pieces.clear();
        track.runs.clear();
        track.ended.clear();
    }
    for (qint64 sample = begin; sample < end;) {
        qint64 next = end;
        for (Track &track : m_tracks) {
            if (sample >= track.nextChange) {
                choose(track, sample);
            }
            next = std::min(next, track.nextChange);
        }
        for (Track &track : m_tracks) {
            if (!track.play) {
                continue;
            }
            const auto count = static_cast<int>(next - sample);
            if (!track.pieces.empty() && track.pieces.back().play == track.play.get()) {
                track.pieces.back().count += count;
            } else {
                track.pieces.push_back({track.play.get(), static_cast<int>(sample - begin), count});
            }
        }
        sample = next;
    }
}

bool TrackMixer::fetch(Track &track, qint64 begin)
{
    track.samples.resize(floatsOf(BlockSamples));
    for (const Piece &piece : track.pieces) {
        const auto samples =
            std::span(track.samples).subspan(floatsOf(piece.offset), floatsOf(piece.count));
        if (!piece.play->read(samples, m_warned)) {
            return false;
        }
        if (piece.play->usesMarkers()) {
            track.markers.resize(BlockSamples);
            if (!piece.play->readMarkers(
                    std::span(track.markers).subspan(at(piece.offset), at(piece.count)))) {
                return false;
            }
        }
        for (int done = 0; done < piece.count;) {
            const qint64 sample = begin + piece.offset + done;
            const qint64 left = piece.play->nextFadeBorder(sample) - sample;
            const auto count = static_cast<int>(std::min<qint64>(left, piece.count - done));
            const Run run{piece.offset + done, count, piece.play->gain(),
                          piece.play->isFading(sample)};
            if (run.weighted) {
                track.factors.resize(BlockSamples);
                piece.play->weigh(sample,
                                  std::span(track.factors).subspan(at(run.offset), at(count)));
            }
            track.runs.push_back(run);
            done += count;
        }
        if (piece.play != track.play.get()) {
            piece.play->close();
        }
    }
    return true;
}

void TrackMixer::sum(int offset, int count)
{
    const auto sums = std::span(m_samples).subspan(floatsOf(offset), floatsOf(count));
    const auto markers = std::span(m_markers).subspan(at(offset), at(count));
    std::fill(sums.begin(), sums.end(), 0.0F);
    std::fill(markers.begin(), markers.end(), quint8{0});
    const auto overlap = [&](int first, int length, const auto &work) {
        const int from = std::max(first, offset);
        const int to = std::min(first + length, offset + count);
        if (from < to) {
            work(from, to - from);
        }
    };
    for (const Track &track : m_tracks) {
        for (const Run &run : track.runs) {
            overlap(run.offset, run.count, [&](int from, int length) {
                const auto part = sums.subspan(floatsOf(from - offset), floatsOf(length));
                const auto values =
                    std::span(track.samples).subspan(floatsOf(from), floatsOf(length));
                if (run.weighted) {
                    addWeighted(part, values,
                                std::span(track.factors).subspan(at(from), at(length)));
                } else {
                    addScaled(part, values, run.factor);
                }
            });
        }
        for (const Piece &piece : track.pieces) {
            if (piece.play->usesMarkers()) {
                overlap(piece.offset, piece.count, [&](int from, int length) {
                    addMarkers(markers.subspan(at(from - offset), at(length)),
                               std::span(track.markers).subspan(at(from), at(length)));
                });
            }
        }
    }
}

bool TrackMixer::mix(int samples)
{
    if (!m_started && !takeBorders()) {
        return false;
    }
    m_started = true;
    const qint64 begin = m_position;
    plan(begin, begin + samples);
    m_position += samples;
    m_samples.resize(floatsOf(samples));
    m_markers.resize(at(samples));
    parallelFor(m_tracks.size(),
                [&](std::size_t i) { m_tracks[i].ok = fetch(m_tracks[i], begin); });
    if (!std::all_of(m_tracks.begin(), m_tracks.end(),
                     [](const Track &track) { return track.ok; })) {
        return false;
    }
    const int parts = (samples + PartSamples - 1) / PartSamples;
    parallelFor(at(parts), [&](std::size_t part) {
        const int offset = static_cast<int>(part) * PartSamples;
        sum(offset, std::min(PartSamples, samples - offset));
    });
    return true;
}
