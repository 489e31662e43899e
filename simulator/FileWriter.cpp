// SPDX-License-Identifier: Apache-2.0
#include "FileWriter.h"

#include "ErrorQueue.h"

#include <algorithm>
#include <cerrno>
#include <cstring>
#include <utility>

namespace simulator {
namespace {

// Controllers send files in pieces of a kilobyte or so; the disk gets bigger ones.
constexpr std::size_t BufferSize = 262'144;

} // namespace

FileWriter::FileWriter(UniqueFd fd)
    : m_fd(std::move(fd))
    , m_buffer(BufferSize)
{
}

FileWriter::~FileWriter()
{
    // A transfer that broke off leaves what came, as it does on an instrument.
    writeOut(std::span(m_buffer).first(m_used));
}

void FileWriter::write(std::span<const char> bytes)
{
    if (bytes.size() > m_buffer.size() - m_used) {
        writeOut(std::span(m_buffer).first(std::exchange(m_used, 0)));
        if (bytes.size() >= m_buffer.size()) {
            writeOut(bytes);
            return;
        }
    }
    if (!bytes.empty()) {
        std::memcpy(m_buffer.data() + m_used, bytes.data(), bytes.size());
    }
    m_used += bytes.size();
}

int FileWriter::finish()
{
    writeOut(std::span(m_buffer).first(std::exchange(m_used, 0)));
    return m_error;
}

void FileWriter::writeOut(std::span<const char> bytes)
{
    while (m_error == NoError && !bytes.empty()) {
        const ssize_t count = ::write(m_fd.get(), bytes.data(), bytes.size());
        if (count > 0) {
            bytes = bytes.subspan(static_cast<std::size_t>(count));
        } else if (count == 0 || errno != EINTR) {
            m_error = errno == ENOSPC || errno == EDQUOT ? MediaFull : MassStorageError;
        }
    }
}

} // namespace simulator
