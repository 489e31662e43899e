// SPDX-License-Identifier: Apache-2.0
#include "LoopedInput.h"

#include "log/Tracer.h"
#include "streams/samplestream.h"

#include <algorithm>
#include <cstddef>
#include <utility>

namespace {

/// Block of the sliding window that error messages speak of.
constexpr qint64 NominalBlock = 5000;

[[nodiscard]] bool failAt(qint64 sample)
{
    return Tracer::fail(QString("*** Reading failed for sample %1.").arg(sample));
}

} // namespace

LoopedInput::LoopedInput(BufferedIO &stream, int sampleCount, int filterLength)
    : m_stream(stream)
    , m_count(sampleCount)
    , m_filterLength(filterLength)
    , m_block(floatsOf(StreamBlockSamples))
    , m_head(floatsOf(WrapSamples))
    , m_tail(floatsOf(WrapSamples))
{
}

bool LoopedInput::open()
{
    // Each restart reads a whole buffer, so the tail comes first: behind the head the stream is
    // where the window goes on. Failures are told in the order of the stream all the same.
    const int filled = static_cast<int>(std::min<qint64>(m_count, WrapSamples));
    const qint64 tailStart = m_count - filled;
    const bool positioned =
        m_stream.restartAtPosition(BufferedIO::HeaderSize + BufferedIO::RecordSize * tailStart);
    const int tailCount =
        positioned ? readSamples(m_stream, std::span(m_tail).last(floatsOf(filled))) : 0;
    if (!m_stream.checkHeader(BufferedIO::DataHeader)) {
        return Tracer::fail("*** Cannot reset read buffer.");
    }
    Tracer::Trace(Tracer::Information, "Buffering waveform head...");
    const int headCount = readSamples(m_stream, std::span(m_head).first(floatsOf(filled)));
    if (headCount < filled) {
        return failAt(headCount);
    }
    Tracer::Trace(Tracer::Information, "Buffering waveform tail...");
    if (!positioned) {
        return Tracer::fail("*** Cannot set read buffer position.");
    }
    return tailCount == filled || failAt(tailStart + tailCount);
}

bool LoopedInput::failReading(qint64 sample) const
{
    const qint64 stride = NominalBlock - m_filterLength;
    const qint64 moves = sample < NominalBlock ? 0 : (sample - NominalBlock) / stride + 1;
    return Tracer::fail(QString("*** Reading data failed for sample %1 (block %2-%3)")
                            .arg(sample)
                            .arg(moves * stride)
                            .arg(sample));
}

void LoopedInput::copyWrapped(Window &window, qint64 index) const
{
    float inPhase = 0;
    float quadrature = 0;
    if (index < 0 && index > -WrapSamples) {
        const auto entry = 2 * static_cast<std::size_t>(WrapSamples + index);
        inPhase = m_tail[entry];
        quadrature = m_tail[entry + 1];
    } else if (index >= m_count && index < m_count + WrapSamples) {
        const auto entry = 2 * static_cast<std::size_t>(index - m_count);
        inPhase = m_head[entry];
        quadrature = m_head[entry + 1];
    }
    const auto place = static_cast<std::size_t>(index - window.start);
    window.inPhase[place] = inPhase;
    window.quadrature[place] = quadrature;
}

bool LoopedInput::readInner(Window &window, qint64 first, qint64 end)
{
    // The head was read when the stream was opened.
    for (; first < std::min<qint64>(end, WrapSamples); ++first) {
        const auto entry = 2 * static_cast<std::size_t>(first);
        const auto place = static_cast<std::size_t>(first - window.start);
        window.inPhase[place] = m_head[entry];
        window.quadrature[place] = m_head[entry + 1];
    }
    while (first < end) {
        const auto count =
            static_cast<std::size_t>(std::min<qint64>(end - first, StreamBlockSamples));
        const std::span<float> iq = std::span(m_block).first(2 * count);
        const int got = readSamples(m_stream, iq);
        if (got < static_cast<int>(count)) {
            return failReading(first + got);
        }
        const auto place = static_cast<std::size_t>(first - window.start);
        deinterleave(iq, window.inPhase.data() + place, window.quadrature.data() + place);
        first += static_cast<qint64>(count);
    }
    return true;
}

bool LoopedInput::advance(qint64 first, qint64 end, int readAhead)
{
    if (!m_started) {
        m_window.start = first;
        m_window.end = first;
        m_started = true;
    }
    // The stream gives each sample once, so the new window goes on where the last one ended.
    Window &window = m_spare;
    window.start = std::clamp(first, m_window.start, m_window.end);
    window.end = std::max(m_window.end, end);
    const auto used = static_cast<std::size_t>(window.end - window.start);
    const std::size_t size = used + static_cast<std::size_t>(readAhead);
    window.inPhase.resize(std::max(size, window.inPhase.size()));
    window.quadrature.resize(window.inPhase.size());
    const auto keptAt = static_cast<std::ptrdiff_t>(window.start - m_window.start);
    const auto kept = static_cast<std::ptrdiff_t>(m_window.end - window.start);
    std::copy_n(m_window.inPhase.begin() + keptAt, kept, window.inPhase.begin());
    std::copy_n(m_window.quadrature.begin() + keptAt, kept, window.quadrature.begin());

    qint64 index = m_window.end;
    for (; index < std::min<qint64>(window.end, 0); ++index) {
        copyWrapped(window, index);
    }
    const qint64 innerEnd = std::min(window.end, m_count);
    if (index < innerEnd) {
        if (!readInner(window, index, innerEnd)) {
            return false;
        }
        index = innerEnd;
    }
    for (; index < window.end; ++index) {
        copyWrapped(window, index);
    }
    std::fill_n(window.inPhase.begin() + static_cast<std::ptrdiff_t>(used), readAhead, 0.0F);
    std::fill_n(window.quadrature.begin() + static_cast<std::ptrdiff_t>(used), readAhead, 0.0F);
    std::swap(m_window, m_spare);
    return true;
}
