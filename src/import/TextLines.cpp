// SPDX-License-Identifier: Apache-2.0
#include "TextLines.h"

#include "log/Tracer.h"

#include <QIODevice>
#include <QString>

#include <algorithm>
#include <cstring>

namespace {

constexpr size_t BlockSize = 1024 * 1024;

} // namespace

TextLines::TextLines(QIODevice &device, ProgressClock &progress)
    : m_device(device)
    , m_progress(progress)
    , m_buffer(BlockSize + MaxLength + 1)
{
}

bool TextLines::fail(const QString &text)
{
    m_failed = true;
    return Tracer::fail(text);
}

/// Puts the begun line to the front of the buffer and fetches more behind it.
bool TextLines::refill()
{
    if (m_progress.shouldStop(m_device.pos(), m_device.size())) {
        return fail("Action aborted by user.");
    }
    std::memmove(m_buffer.data(), m_buffer.data() + m_begin, m_end - m_begin);
    m_end -= m_begin;
    m_begin = 0;
    const qint64 got = m_device.read(m_buffer.data() + m_end, BlockSize);
    if (got < 0) {
        return fail("Error reading input file.");
    }
    m_atEnd = got == 0;
    m_end += static_cast<size_t>(got);
    return true;
}

bool TextLines::next(std::string_view &line)
{
    size_t searched = 0;
    for (;;) {
        const char *begin = m_buffer.data() + m_begin;
        const char *end = m_buffer.data() + m_end;
        const char *stop =
            std::find_if(begin + searched, end, [](char c) { return c == '\n' || c == '\r'; });
        const auto length = static_cast<size_t>(stop - begin);
        if (length > MaxLength) {
            return fail(
                QString("Line %1 exceeds 1024 characters. Aborting.").arg(m_lineNumber + 1));
        }
        if (stop == end && !m_atEnd) {
            searched = length;
            if (!refill()) {
                return false;
            }
            continue;
        }
        const bool isRestOfEnd = length == 0 && m_afterReturn && stop != end && *stop == '\n';
        m_afterReturn = stop != end && *stop == '\r';
        m_begin += length + (stop != end ? 1 : 0);
        if (!isRestOfEnd && (length > 0 || stop != end)) {
            ++m_lineNumber;
        }
        if (length > 0) {
            line = {begin, length};
            return true;
        }
        if (stop == end) {
            return false;
        }
        searched = 0;
    }
}
