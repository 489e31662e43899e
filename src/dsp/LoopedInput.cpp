// SPDX-License-Identifier: Apache-2.0
#include "LoopedInput.h"

#include "log/Tracer.h"
#include "samplestream.h"

#include <algorithm>
#include <cstddef>

namespace {

/// Block of the sliding window that error messages speak of.
constexpr qint64 NominalBlock = 5000;

[[nodiscard]] bool fail(const QString &text)
{
    Tracer::Trace(Tracer::Error, text);
    return false;
}

} // namespace

LoopedInput::LoopedInput(BufferedIO &stream, int sampleCount, int filterLength)
    : m_stream(stream)
    , m_count(sampleCount)
    , m_filterLength(filterLength)
    , m_block(2 * StreamBlockSamples)
    , m_head(2 * WrapSamples)
    , m_tail(2 * WrapSamples)
{
}

bool LoopedInput::open()
{
    if (!m_stream.checkHeader("IQF")) {
        return fail("*** Cannot reset read buffer.");
    }
    Tracer::Trace(Tracer::Information, "Buffering waveform head...");
    const auto filled = static_cast<std::size_t>(std::min<qint64>(m_count, WrapSamples));
    if (!readEnd(0, std::span(m_head).first(2 * filled))) {
        return false;
    }
    Tracer::Trace(Tracer::Information, "Buffering waveform tail...");
    const qint64 tailStart = std::max<qint64>(m_count - WrapSamples, 0);
    if (!m_stream.restartAtPosition(BufferedIO::HeaderSize + BufferedIO::RecordSize * tailStart)) {
        return fail("*** Cannot set read buffer position.");
    }
    if (!readEnd(tailStart, std::span(m_tail).last(2 * filled))) {
        return false;
    }
    if (!m_stream.checkHeader("IQF")) {
        return fail("*** Cannot validate data stream header.");
    }
    return true;
}

bool LoopedInput::readEnd(qint64 first, std::span<float> target)
{
    const int got = readSamples(m_stream, target);
    if (got < static_cast<int>(target.size() / 2)) {
        return fail(QString("*** Reading failed for sample %1.").arg(first + got));
    }
    return true;
}

bool LoopedInput::failReading(qint64 sample) const
{
    const qint64 stride = NominalBlock - m_filterLength;
    const qint64 moves = sample < NominalBlock ? 0 : (sample - NominalBlock) / stride + 1;
    return fail(QString("*** Reading data failed for sample %1 (block %2-%3)")
                    .arg(sample)
                    .arg(moves * stride)
                    .arg(sample));
}

void LoopedInput::copyWrapped(qint64 index)
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
    const auto place = static_cast<std::size_t>(index - m_start);
    m_inPhase[place] = inPhase;
    m_quadrature[place] = quadrature;
}

bool LoopedInput::readInner(qint64 first, qint64 end)
{
    while (first < end) {
        const auto count =
            static_cast<std::size_t>(std::min<qint64>(end - first, StreamBlockSamples));
        const std::span<float> iq = std::span(m_block).first(2 * count);
        const int got = readSamples(m_stream, iq);
        if (got < static_cast<int>(count)) {
            return failReading(first + got);
        }
        const auto place = static_cast<std::size_t>(first - m_start);
        deinterleave(iq, m_inPhase.data() + place, m_quadrature.data() + place);
        first += static_cast<qint64>(count);
    }
    return true;
}

bool LoopedInput::advance(qint64 first, qint64 end, int readAhead)
{
    if (!m_filled) {
        m_start = first;
        m_end = first;
        m_filled = true;
    }
    // Samples before the stream's place were read; they are in the window or not needed.
    const qint64 kept = std::max<qint64>(m_end - first, 0);
    const auto drop = static_cast<std::ptrdiff_t>(m_end - kept - m_start);
    std::copy(m_inPhase.begin() + drop, m_inPhase.begin() + drop + kept, m_inPhase.begin());
    std::copy(m_quadrature.begin() + drop, m_quadrature.begin() + drop + kept,
              m_quadrature.begin());
    m_start = m_end - kept;
    const qint64 newEnd = std::max(m_end, end);
    const auto size = static_cast<std::size_t>(newEnd - m_start + readAhead);
    m_inPhase.resize(std::max(size, m_inPhase.size()));
    m_quadrature.resize(m_inPhase.size());

    qint64 index = m_end;
    for (; index < std::min<qint64>(newEnd, 0); ++index) {
        copyWrapped(index);
    }
    const qint64 innerEnd = std::min(newEnd, m_count);
    if (index < innerEnd) {
        if (!readInner(index, innerEnd)) {
            return false;
        }
        index = innerEnd;
    }
    for (; index < newEnd; ++index) {
        copyWrapped(index);
    }
    m_end = newEnd;
    const auto used = static_cast<std::ptrdiff_t>(newEnd - m_start);
    std::fill_n(m_inPhase.begin() + used, readAhead, 0.0F);
    std::fill_n(m_quadrature.begin() + used, readAhead, 0.0F);
    return true;
}
