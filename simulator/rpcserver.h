// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "protocols/XdrReader.h"
#include "protocols/XdrWriter.h"

#include <cstddef>
#include <cstdint>
#include <functional>
#include <span>

namespace simulator {

/// How a procedure ended, as ONC RPC (RFC 5531) numbers it.
enum class RpcStatus : std::uint32_t {
    Success = SUCCESS,
    ProgramUnavailable = PROG_UNAVAIL,
    ProgramMismatch = PROG_MISMATCH,
    ProcedureUnavailable = PROC_UNAVAIL,
    GarbageArguments = GARBAGE_ARGS,
    SystemError = SYSTEM_ERR,
};

/// One program that a server offers. The handler reads the arguments and writes the results;
/// what it wrote counts only with Success.
struct RpcProgram
{
    std::uint32_t number = 0;
    std::uint32_t version = 0;
    std::function<RpcStatus(std::uint32_t procedure, protocols::XdrReader &arguments,
                            protocols::XdrWriter &results)>
        handler;
};

/// Answers one call message. The writer then holds the reply, with the record mark of a stream in
/// its first four bytes. False when the message is no call at all; such a peer is not spoken to.
[[nodiscard]] bool answerRpcCall(std::span<const std::uint8_t> call,
                                 std::span<const RpcProgram> programs, protocols::XdrWriter &reply);

/// Serves calls from a stream socket until it ends, `isDropped` says so after a call, or the peer
/// breaks the rules, announces a record of more than `maxRecord` bytes, or leaves one unfinished
/// for half a minute.
void serveRpcStream(int fd, std::size_t maxRecord, std::span<const RpcProgram> programs,
                    const std::function<bool()> &isDropped);

} // namespace simulator
