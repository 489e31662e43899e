// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <rpc/rpc.h>

#include <cstdint>
#include <span>

namespace visa {

/// The results of device_read (Device_ReadResp), with the data decoded straight into the reader's
/// memory.
struct ReadReply
{
    int error = 0; ///< Device_ErrorCode
    int reason = 0;
    std::span<std::uint8_t> target{}; ///< what was asked for; set before decoding
    unsigned size = 0;                ///< if larger than the target, nothing was stored there
};

/// Decodes as the functions of rpcgen do; there is nothing to free.
bool_t decodeReadReply(XDR *stream, ReadReply *reply);

} // namespace visa
