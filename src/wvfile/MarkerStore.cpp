// SPDX-License-Identifier: Apache-2.0
#include "MarkerStore.h"

#include "streams/BufferedIO.h"

#include "base/ProgressClock.h"

#include <algorithm>
#include <utility>

namespace {

constexpr qint64 BlockSize = 262'144;

/// Some 4 MiB for each side: little beside the buffers of the streams.
constexpr size_t MaxRuns = 524'288;

} // namespace

MarkerStore::MarkerStore(BufferedIO &stream, ProgressClock &progress)
    : m_stream(stream)
    , m_progress(progress)
{
}

qint64 MarkerStore::passCost() const
{
    // A restart of the stream reads its first block; going through a run costs a few times as much
    // as a byte of a block.
    return m_inStream ? std::min<qint64>(m_writePos, BufferedIO::BufferSize)
                      : 4 * static_cast<qint64>(m_new.size());
}

MarkerStore::Result MarkerStore::failed(Result reason, qint64 position)
{
    m_failedAt = position;
    return reason;
}

bool MarkerStore::restart()
{
    m_writePos = 0;
    if (m_inStream) {
        return m_stream.restartAtBegining();
    }
    m_old = std::exchange(m_new, {});
    m_readRun = 0;
    m_readPos = 0;
    return true;
}

void MarkerStore::append(qint64 count, quint8 byte)
{
    m_writePos += count;
    if (!m_new.empty() && m_new.back().byte() == byte) {
        m_new.pop_back();
    }
    m_new.emplace_back(m_writePos, byte);
}

MarkerStore::Result MarkerStore::copy(qint64 count, quint8 mask)
{
    qint64 left = count;
    while (left > 0 && !m_inStream) {
        if (m_readRun >= m_old.size()) {
            return failed(Result::CannotRead, m_writePos);
        }
        const Run run = m_old[m_readRun];
        const qint64 size = std::min(run.end() - m_readPos, left);
        append(size, run.byte() | mask);
        m_readPos += size;
        if (m_readPos == run.end()) {
            ++m_readRun;
        }
        left -= size;
        if (m_new.size() > MaxRuns) {
            const Result moved = moveToStream();
            if (moved != Result::Done) {
                return moved;
            }
        }
    }
    return copyInStream(left, mask);
}

MarkerStore::Result MarkerStore::read(quint8 &byte)
{
    if (m_inStream) {
        return m_stream.readBytes(1, &byte) ? Result::Done : failed(Result::CannotRead, m_writePos);
    }
    if (m_readRun >= m_old.size()) {
        return failed(Result::CannotRead, m_writePos);
    }
    byte = m_old[m_readRun].byte();
    ++m_readPos;
    if (m_readPos == m_old[m_readRun].end()) {
        ++m_readRun;
    }
    return Result::Done;
}

MarkerStore::Result MarkerStore::write(qint64 count, quint8 byte)
{
    if (m_inStream) {
        const Result result = writeToStream(m_writePos, count, byte);
        m_writePos += count;
        return result;
    }
    append(count, byte);
    return m_new.size() > MaxRuns ? moveToStream() : Result::Done;
}

MarkerStore::Result MarkerStore::finish()
{
    if (m_inStream) {
        return Result::Done;
    }
    m_inStream = true;
    m_old = {};
    return writeRuns(std::exchange(m_new, {}));
}

/// Goes on in the stream from where both sides stand.
MarkerStore::Result MarkerStore::moveToStream()
{
    m_inStream = true;
    const Result result = writeRuns(std::exchange(m_old, {}));
    if (result != Result::Done) {
        return result;
    }
    if (!m_stream.restartAtPosition(m_readPos)) {
        return failed(Result::CannotWrite, m_writePos);
    }
    return writeRuns(std::exchange(m_new, {}));
}

MarkerStore::Result MarkerStore::writeRuns(const Runs &runs)
{
    qint64 position = 0;
    for (const Run &run : runs) {
        const Result result = writeToStream(position, run.end() - position, run.byte());
        if (result != Result::Done) {
            return result;
        }
        position = run.end();
    }
    return Result::Done;
}

MarkerStore::Result MarkerStore::copyInStream(qint64 count, quint8 mask)
{
    m_block.resize(std::max(m_block.size(), static_cast<size_t>(std::min(count, BlockSize))));
    while (count > 0) {
        if (count >= BlockSize && m_progress.shouldStop(0)) {
            return failed(Result::Cancelled, m_writePos);
        }
        const int wanted = static_cast<int>(std::min(count, BlockSize));
        const int got = m_stream.readBlock(wanted, m_block.data());
        if (got < wanted) {
            return failed(Result::CannotRead, m_writePos + std::max(got, 0));
        }
        for (int i = 0; i < got; ++i) {
            m_block[static_cast<size_t>(i)] |= mask;
        }
        if (!m_stream.writeBytes(got, m_block.data())) {
            return failed(Result::CannotWrite, m_writePos);
        }
        m_writePos += got;
        count -= got;
    }
    return Result::Done;
}

MarkerStore::Result MarkerStore::writeToStream(qint64 position, qint64 count, quint8 byte)
{
    const auto size = static_cast<size_t>(std::min(count, BlockSize));
    m_block.resize(std::max(m_block.size(), size));
    std::fill_n(m_block.begin(), size, byte);
    const qint64 end = position + count;
    while (position < end) {
        if (end - position >= BlockSize && m_progress.shouldStop(0)) {
            return failed(Result::Cancelled, position);
        }
        const int part = static_cast<int>(std::min(end - position, BlockSize));
        if (!m_stream.writeBytes(part, m_block.data())) {
            return failed(Result::CannotWrite, position);
        }
        position += part;
    }
    return Result::Done;
}
