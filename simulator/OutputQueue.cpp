// SPDX-License-Identifier: Apache-2.0
#include "OutputQueue.h"

#include <algorithm>
#include <cerrno>
#include <cstring>

namespace simulator {

std::size_t FileSource::read(std::uint64_t offset, std::span<char> buffer)
{
    std::size_t count = 0;
    while (count < buffer.size()) {
        const ssize_t got = ::pread(m_fd.get(), buffer.data() + count, buffer.size() - count,
                                    static_cast<off_t>(offset + count));
        if (got < 0 && errno == EINTR) {
            continue;
        }
        if (got <= 0) {
            break;
        }
        count += static_cast<std::size_t>(got);
    }
    return count;
}

void OutputQueue::push(std::deque<OutputSegment> segments, TimePoint notBefore,
                       bool awaitsOperation)
{
    if (segments.empty()) {
        return;
    }
    if (m_messages.empty()) {
        m_offset = 0;
    }
    m_messages.push_back({std::move(segments), notBefore, awaitsOperation});
}

TimePoint OutputQueue::readyTime() const
{
    return m_messages.empty() ? TimePoint::max() : m_messages.front().notBefore;
}

bool OutputQueue::awaitsOperation() const
{
    return !m_messages.empty() && m_messages.front().awaitsOperation;
}

OutputQueue::ReadResult OutputQueue::read(std::span<char> buffer, std::optional<char> termChar)
{
    ReadResult result;
    if (m_messages.empty()) {
        return result;
    }
    std::deque<OutputSegment> &segments = m_messages.front().segments;
    while (result.count < buffer.size() && !segments.empty()) {
        OutputSegment &segment = segments.front();
        const std::uint64_t size = segment.source ? segment.size : segment.text.size();
        std::span<char> target = buffer.subspan(result.count);
        target = target.first(
            static_cast<std::size_t>(std::min<std::uint64_t>(target.size(), size - m_offset)));
        std::size_t count = target.size();
        bool cut = false;
        if (segment.source) {
            count = segment.source->read(m_offset, target);
            cut = count < target.size();
        } else {
            std::memcpy(target.data(), segment.text.data() + m_offset, count);
        }
        if (termChar) {
            const void *found = std::memchr(target.data(), *termChar, count);
            if (found != nullptr) {
                count =
                    static_cast<std::size_t>(static_cast<const char *>(found) - target.data()) + 1;
                result.termChar = true;
                cut = false;
            }
        }
        result.count += count;
        m_offset += count;
        if (segment.isBlock) {
            result.blockBytes += count;
        }
        // A file that shrank since it was opened ends its segment; nobody waits for the rest.
        if (m_offset == size || cut) {
            segments.pop_front();
            m_offset = 0;
        }
        if (result.termChar) {
            break;
        }
    }
    if (segments.empty()) {
        m_messages.pop_front();
        result.messageEnd = true;
    }
    return result;
}

} // namespace simulator
