// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "UniqueFd.h"

#include <chrono>
#include <cstddef>
#include <cstdint>
#include <deque>
#include <memory>
#include <optional>
#include <span>
#include <string>

namespace simulator {

using Clock = std::chrono::steady_clock;
using TimePoint = Clock::time_point;

/// Bytes of an answer that are made or read when they are fetched, so that an answer of any size
/// costs no memory.
class DataSource
{
public:
    virtual ~DataSource() = default;

    /// Fills the buffer with the bytes from `offset` on; fewer than asked, or 0, when the source
    /// ends before its announced size.
    [[nodiscard]] virtual std::size_t read(std::uint64_t offset, std::span<char> buffer) = 0;
};

/// The content of an open file.
class FileSource final : public DataSource
{
public:
    explicit FileSource(UniqueFd fd)
        : m_fd(std::move(fd))
    {
    }
    [[nodiscard]] std::size_t read(std::uint64_t offset, std::span<char> buffer) override;

private:
    UniqueFd m_fd;
};

/// One piece of an answer: text, or a block of data.
struct OutputSegment
{
    std::string text{};
    std::unique_ptr<DataSource> source{}; ///< null for text
    std::uint64_t size = 0;               ///< bytes that the source gives
    bool isBlock = false;                 ///< a binary block's data, without its head
};

/// The answers of one link, waiting to be read.
class OutputQueue
{
public:
    struct ReadResult
    {
        std::size_t count = 0;
        std::uint64_t blockBytes = 0; ///< of them, bytes of binary blocks
        bool messageEnd = false;      ///< the last byte is the last of its answer
        bool termChar = false;        ///< the last byte is the terminating character
    };

    /// Adds an answer that can be read from `notBefore` on and, with `awaitsOperation`, not before
    /// the instrument's pending operation is complete.
    void push(std::deque<OutputSegment> segments, TimePoint notBefore, bool awaitsOperation);

    [[nodiscard]] bool isEmpty() const { return m_messages.empty(); }
    void clear() { m_messages.clear(); }

    /// When the next bytes can be read, regardless of pending operations; never, when there are
    /// none.
    [[nodiscard]] TimePoint readyTime() const;
    [[nodiscard]] bool awaitsOperation() const;

    /// Takes bytes of one answer: until the buffer is full, the answer ends, or the terminating
    /// character was taken.
    [[nodiscard]] ReadResult read(std::span<char> buffer, std::optional<char> termChar);

private:
    struct Message
    {
        std::deque<OutputSegment> segments;
        TimePoint notBefore;
        bool awaitsOperation = false;
    };

    std::deque<Message> m_messages;
    std::uint64_t m_offset = 0; ///< bytes that were taken of the first segment
};

} // namespace simulator
