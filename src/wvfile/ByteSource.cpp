// SPDX-License-Identifier: Apache-2.0
#include "ByteSource.h"

#include "log/Tracer.h"

#include <QIODevice>

#include <algorithm>
#include <cstring>

namespace {

/// Small enough that a scan, which looks at tags only, reads little; large enough for marker lists.
constexpr int BufferSize = 32 * 1024;

/// Text is what lies between the blank and the closing brace of ASCII.
bool isText(int byte)
{
    return byte >= 0x20 && byte <= 0x7D;
}

} // namespace

ByteSource::ByteSource(QIODevice &device)
    : m_device(device)
    , m_buffer(BufferSize, Qt::Uninitialized)
    , m_size(device.size())
{
}

bool ByteSource::fill()
{
    m_bufferStart += m_fill;
    m_index = 0;
    m_fill = 0;
    const qint64 got = m_device.read(m_buffer.data(), BufferSize);
    m_failed = m_failed || got < 0;
    m_fill = static_cast<int>(std::max<qint64>(got, 0));
    return m_fill > 0;
}

bool ByteSource::seek(qint64 position)
{
    const qint64 target = std::clamp<qint64>(position, 0, m_size);
    if (target >= m_bufferStart && target <= m_bufferStart + m_fill) {
        m_index = static_cast<int>(target - m_bufferStart);
        return true;
    }
    m_bufferStart = target;
    m_index = 0;
    m_fill = 0;
    return m_device.seek(target);
}

size_t ByteSource::read(std::span<std::byte> target)
{
    const size_t buffered = std::min(target.size(), static_cast<size_t>(m_fill - m_index));
    std::memcpy(target.data(), m_buffer.constData() + m_index, buffered);
    m_index += static_cast<int>(buffered);
    size_t done = buffered;
    while (done < target.size()) {
        // The buffer is used up: large blocks go past it.
        const qint64 got = m_device.read(reinterpret_cast<char *>(target.data()) + done,
                                         static_cast<qint64>(target.size() - done));
        m_failed = m_failed || got < 0;
        if (got <= 0) {
            break;
        }
        m_bufferStart += m_fill + got;
        m_index = 0;
        m_fill = 0;
        done += static_cast<size_t>(got);
    }
    return done;
}

bool ByteSource::skipPast(char mark)
{
    while (m_index < m_fill || fill()) {
        const char *start = m_buffer.constData() + m_index;
        const void *found = std::memchr(start, mark, static_cast<size_t>(m_fill - m_index));
        if (found != nullptr) {
            m_index += static_cast<int>(static_cast<const char *>(found) - start) + 1;
            return true;
        }
        m_index = m_fill;
    }
    return false;
}

bool ByteSource::readText(char delimiter, TagText &result, int maxLength)
{
    result = TagText();
    int byte = next();
    while (byte == ' ') {
        byte = next();
    }
    QByteArray text;
    for (; byte != NoByte; byte = next()) {
        ++result.consumed;
        result.endedOnBrace = byte == '}';
        result.endedOnDelimiter = byte == delimiter;
        if (result.endedOnBrace || result.endedOnDelimiter || !isText(byte)) {
            break;
        }
        if (text.size() >= maxLength) {
            Tracer::Trace(Tracer::Error, "Tag content exceeds limit.");
            return false;
        }
        text.append(static_cast<char>(byte));
    }
    result.text = QString::fromLatin1(text);
    return !m_failed;
}
