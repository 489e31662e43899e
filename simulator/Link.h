// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "OutputQueue.h"
#include "ScpiParser.h"

#include <atomic>
#include <cstddef>
#include <cstdint>
#include <deque>
#include <memory>
#include <span>
#include <string>
#include <vector>

namespace simulator {

class FileWriter;
class Instrument;

/// One controller's conversation with an instrument: its half-received message, its answers.
///
/// All functions but `abort` are called with the instrument's mutex held.
class Link final : private ScpiParser::Handler
{
public:
    enum class Transport {
        Vxi11, ///< messages end with END; an unread answer is dropped by the next message
        Raw,   ///< messages end with a line feed; answers leave as a stream
    };

    /// `name` stands in the log. The instrument must outlive the link.
    Link(Instrument &instrument, Transport transport, std::string name);
    ~Link() override;
    Link(const Link &) = delete;
    Link &operator=(const Link &) = delete;

    /// Takes bytes up to the end of one message, or all, and carries the commands out; returns how
    /// many it took. `end`: the last byte is marked as the end of a message.
    [[nodiscard]] std::size_t feed(std::span<const char> bytes, bool end);

    [[nodiscard]] const OutputQueue &output() const { return m_output; }

    /// Takes bytes of the next answer.
    [[nodiscard]] OutputQueue::ReadResult read(std::span<char> buffer,
                                               std::optional<char> termChar);

    /// A reader gave up waiting for an answer: a query error, unless the lack is a wanted fault.
    void noteUnterminated();

    /// Device clear: input and output are emptied.
    void clear();

    /// Adds an answer to the message that is being carried out.
    void respond(std::string text);

    /// As above, a definite-length block of `size` bytes.
    void respondBlock(std::unique_ptr<DataSource> source, std::uint64_t size);

    /// The answer comes when the pending operation is complete.
    void awaitOperation() { m_awaitsOperation = true; }

    /// *WAI: what follows is answered after the operation that is pending now.
    void holdForOperation() { m_held = true; }

    /// The connection is to be closed because of a fault.
    [[nodiscard]] bool isDropDue() const { return m_dropDue; }

    /// Wakes a waiting reader; any thread may call it.
    void abort() { m_aborted = true; }
    [[nodiscard]] bool takeAbort() { return m_aborted.exchange(false); }

    /// The error of the file that came with the block of the current unit, and whether there was
    /// such a file at all.
    [[nodiscard]] bool hasTransfer() const { return m_hasTransfer; }
    [[nodiscard]] int transferError() const { return m_transferError; }

    [[nodiscard]] const std::string &name() const { return m_name; }

private:
    void onUnit(std::string_view text, bool hasBlock) override;
    void onBlockBegin(std::string_view text, std::optional<std::uint64_t> size) override;
    void onBlockData(std::span<const char> bytes) override;
    void onBlockEnd(bool complete) override;
    void onError(int number) override;
    void onMessageEnd() override;

    void beginMessage();
    void beginAnswer();
    void countBlockBytes(std::uint64_t count);
    [[nodiscard]] std::vector<std::string> fullHeader(bool common, bool absolute,
                                                      const std::vector<std::string> &nodes);

    Instrument &m_instrument;
    Transport m_transport;
    std::string m_name;
    ScpiParser m_parser;
    OutputQueue m_output;
    std::deque<OutputSegment> m_response; ///< of the current message
    std::vector<std::string> m_path;      ///< where a header without a colon begins
    std::unique_ptr<FileWriter> m_writer;
    std::uint64_t m_blockBytes = 0; ///< of the current block, in either direction
    int m_transferError = 0;
    bool m_hasTransfer = false;
    bool m_inMessage = false;
    bool m_awaitsOperation = false;
    bool m_held = false;
    bool m_withoutTerminator = false;
    bool m_silenceWanted = false; ///< a fault holds the rest of the last answer back
    bool m_dropDue = false;
    std::atomic<bool> m_aborted{false};
};

} // namespace simulator
