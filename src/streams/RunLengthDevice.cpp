// SPDX-License-Identifier: Apache-2.0
#include "RunLengthDevice.h"

#include <algorithm>
#include <cstring>

namespace {

/// Runs that one page may have; more go to the temporary file.
constexpr size_t MaxRuns = 1024;

/// Index behind the run that begins at `from`. Compares the bytes with their neighbours, many at a
/// time.
size_t endOfRun(std::span<const char> bytes, size_t from)
{
    constexpr size_t Step = 256;
    size_t end = from + 1;
    while (end + Step <= bytes.size() &&
           std::memcmp(bytes.data() + end - 1, bytes.data() + end, Step) == 0) {
        end += Step;
    }
    while (end < bytes.size() && bytes[end] == bytes[from]) {
        ++end;
    }
    return end;
}

} // namespace

void RunLengthDevice::extendTo(qint64 length)
{
    if (length <= m_size) {
        return;
    }
    char last = 0;
    if (m_size > 0 && load(m_pages.back(), (m_size - 1) / PageBytes)) {
        last = m_content[static_cast<size_t>((m_size - 1) % PageBytes)];
        // The bytes of the last page behind the end are those that come now.
        const auto rest = std::span(m_content).subspan(static_cast<size_t>(m_size % PageBytes));
        if (m_size % PageBytes != 0) {
            std::ranges::fill(rest, last);
            static_cast<void>(store(m_pages.back(), m_size / PageBytes, m_content));
        }
    }
    Page filled;
    filled.filler = static_cast<quint8>(last);
    m_pages.resize(static_cast<size_t>((length + PageBytes - 1) / PageBytes), filled);
    m_size = length;
}

qint64 RunLengthDevice::readData(char *data, qint64 maxSize)
{
    const qint64 begin = pos();
    const qint64 wanted = std::clamp<qint64>(m_size - begin, 0, maxSize);
    for (qint64 done = 0; done < wanted;) {
        const qint64 index = (begin + done) / PageBytes;
        const qint64 offset = (begin + done) % PageBytes;
        const qint64 count = std::min(wanted - done, PageBytes - offset);
        const Page &page = m_pages[static_cast<size_t>(index)];
        if (page.runs.empty() && !page.isOnDisk) {
            std::memset(data + done, page.filler, static_cast<size_t>(count));
        } else if (load(page, index)) {
            std::memcpy(data + done, m_content.data() + offset, static_cast<size_t>(count));
        } else {
            return -1;
        }
        done += count;
    }
    return wanted;
}

qint64 RunLengthDevice::writeData(const char *data, qint64 size)
{
    const qint64 begin = pos();
    extendTo(begin);
    for (qint64 done = 0; done < size;) {
        const qint64 index = (begin + done) / PageBytes;
        const qint64 offset = (begin + done) % PageBytes;
        const qint64 count = std::min(size - done, PageBytes - offset);
        if (static_cast<size_t>(index) == m_pages.size()) {
            m_pages.emplace_back();
        }
        Page &page = m_pages[static_cast<size_t>(index)];
        const auto part = std::span(data + done, static_cast<size_t>(count));
        if (count == PageBytes) {
            if (!store(page, index, part)) {
                return -1;
            }
        } else {
            if (!load(page, index)) {
                return -1;
            }
            std::memcpy(m_content.data() + offset, part.data(), part.size());
            if (!store(page, index, m_content)) {
                return -1;
            }
        }
        done += count;
        m_size = std::max(m_size, begin + done);
    }
    return size;
}

bool RunLengthDevice::load(const Page &page, qint64 index)
{
    if (page.isOnDisk) {
        return m_file.seek(index * PageBytes) &&
               m_file.read(m_content.data(), PageBytes) == PageBytes;
    }
    size_t position = 0;
    for (const Run &run : page.runs) {
        const size_t count = run.last + 1 - position;
        std::memset(m_content.data() + position, run.byte, count);
        position += count;
    }
    std::memset(m_content.data() + position, page.filler, m_content.size() - position);
    return true;
}

bool RunLengthDevice::store(Page &page, qint64 index, std::span<const char> bytes)
{
    page.runs.clear();
    page.isOnDisk = false;
    size_t begin = 0;
    while (page.runs.size() <= MaxRuns) {
        const size_t end = endOfRun(bytes, begin);
        if (end == bytes.size()) {
            page.filler = static_cast<quint8>(bytes[begin]);
            return true;
        }
        page.runs.push_back({static_cast<quint16>(end - 1), static_cast<quint8>(bytes[begin])});
        begin = end;
    }
    page.runs = {};
    page.isOnDisk = true;
    if (!m_file.isOpen() && !m_file.open()) {
        setErrorString(m_file.errorString());
        return false;
    }
    const bool written = m_file.seek(index * PageBytes) &&
                         m_file.write(bytes.data(), PageBytes) == PageBytes && m_file.flush();
    if (!written) {
        setErrorString(m_file.errorString());
    }
    return written;
}
