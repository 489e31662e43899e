// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "Xdr.h"

#include <cstddef>
#include <cstdint>
#include <functional>
#include <optional>
#include <span>
#include <vector>

namespace simulator {

/// How a procedure ended, as ONC RPC (RFC 5531) numbers it.
enum class RpcStatus : std::uint32_t {
    Success = 0,
    ProgramUnavailable = 1,
    ProgramMismatch = 2,
    ProcedureUnavailable = 3,
    GarbageArguments = 4,
    SystemError = 5,
};

/// One program that a server offers. The handler reads the arguments and writes the results;
/// what it wrote counts only with Success.
struct RpcProgram
{
    std::uint32_t number = 0;
    std::uint32_t version = 0;
    std::function<RpcStatus(std::uint32_t procedure, XdrReader &arguments, XdrWriter &results)>
        handler;
};

/// Answers one call message. The writer then holds the reply, with the record mark of a stream in
/// its first four bytes. False when the message is no call at all; such a peer is not spoken to.
[[nodiscard]] bool answerRpcCall(std::span<const char> call, std::span<const RpcProgram> programs,
                                 XdrWriter &reply);

/// Bytes of the record mark that a reply over a datagram goes without.
inline constexpr std::size_t RecordMarkSize = 4;

/// Reads records with the record marking of RFC 5531, 11, from a stream socket.
class RecordReader
{
public:
    /// A record of more than `maxRecord` bytes ends the connection before memory is taken for it.
    RecordReader(int fd, std::size_t maxRecord);

    /// The next record, valid until the next call; nothing when the connection ended, or the peer
    /// broke the rules or left a record unfinished for half a minute.
    [[nodiscard]] std::optional<std::span<const char>> next();

private:
    [[nodiscard]] bool fill(std::size_t size);

    int m_fd;
    std::size_t m_maxRecord;
    std::vector<char> m_buffer;
    std::size_t m_begin = 0;
    std::size_t m_end = 0;
    std::vector<char> m_record; ///< a record that came in several fragments
    bool m_inRecord = false;
};

/// Serves calls from a stream socket until it ends or `isDropped` says so after a call.
void serveRpcStream(int fd, std::size_t maxRecord, std::span<const RpcProgram> programs,
                    const std::function<bool()> &isDropped);

} // namespace simulator
