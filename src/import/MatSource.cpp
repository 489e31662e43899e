// SPDX-License-Identifier: Apache-2.0
#include "MatSource.h"

#include "log/Tracer.h"

#include <QIODevice>
#include <QString>

#include <algorithm>
#include <limits>

namespace {

constexpr qint64 BlockSize = 256 * 1024;

} // namespace

MatFileSource::MatFileSource(QIODevice &device)
    : m_device(device)
{
}

qint64 MatFileSource::read(char *bytes, qint64 size)
{
    return std::max<qint64>(m_device.read(bytes, size), 0);
}

bool MatFileSource::seek(qint64 position)
{
    const qint64 size = m_device.size();
    return m_device.seek(std::min(position, size)) && position <= size;
}

qint64 MatFileSource::position() const
{
    return m_device.pos();
}

InflateSource::InflateSource(QIODevice &device, qint64 size, std::function<bool()> shouldStop)
    : m_device(device)
    , m_missing(size)
    , m_shouldStop(std::move(shouldStop))
    , m_input(static_cast<size_t>(std::min(size, BlockSize)))
    , m_bound(std::numeric_limits<qint64>::max())
{
    m_failed = inflateInit(&m_stream) != Z_OK && !fail();
}

InflateSource::~InflateSource()
{
    inflateEnd(&m_stream);
}

bool InflateSource::fail()
{
    m_failed = true;
    return Tracer::fail("Decompression: zlib inflate() returned error.");
}

/// Reads the next compressed block. False at their end or on a failure.
bool InflateSource::feed()
{
    const qint64 wanted = std::min(m_missing, BlockSize);
    if (wanted == 0) {
        return false;
    }
    if (m_shouldStop()) {
        m_failed = true;
        return Tracer::fail("Action aborted by user.");
    }
    const qint64 got = m_device.read(m_input.data(), wanted);
    if (got < wanted) {
        m_failed = true;
        Tracer::Trace(Tracer::Error, "Decompression: Not enough data available from input stream.");
        Tracer::Trace(Tracer::Error, QString("Decompression: Bytes requested: %1").arg(wanted));
        return Tracer::fail(QString("Decompression: Bytes received: %1").arg(got));
    }
    m_missing -= got;
    m_stream.next_in = reinterpret_cast<Bytef *>(m_input.data());
    m_stream.avail_in = static_cast<uInt>(got);
    return true;
}

qint64 InflateSource::read(char *bytes, qint64 size)
{
    qint64 done = 0;
    while (done < size && !m_ended && !m_failed) {
        if (m_stream.avail_in == 0 && !feed()) {
            break;
        }
        const auto room =
            static_cast<uInt>(std::min<qint64>(size - done, std::numeric_limits<int>::max()));
        m_stream.next_out = reinterpret_cast<Bytef *>(bytes + done);
        m_stream.avail_out = room;
        const int result = inflate(&m_stream, Z_NO_FLUSH);
        done += room - m_stream.avail_out;
        if (result == Z_STREAM_ERROR || result == Z_DATA_ERROR || result == Z_MEM_ERROR ||
            result == Z_NEED_DICT) {
            fail();
        }
        m_ended = result == Z_STREAM_END;
    }
    m_position += done;
    if (m_position > m_bound && !m_failed) {
        m_failed = true;
        Tracer::Trace(Tracer::Error,
                      QString("Decompression: More data than the %1 bytes that the element "
                              "declares.")
                          .arg(m_bound));
    }
    return m_failed ? 0 : done;
}

bool InflateSource::seek(qint64 position)
{
    m_skipped.resize(BlockSize);
    while (m_position < position) {
        if (read(m_skipped.data(), std::min(BlockSize, position - m_position)) == 0) {
            return false;
        }
    }
    return m_position == position;
}

bool InflateSource::finish()
{
    m_skipped.resize(BlockSize);
    while (read(m_skipped.data(), BlockSize) > 0) {
    }
    return !m_failed;
}
