// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "Deadline.h"
#include "RpcReply.h"
#include "TcpSocket.h"
#include "protocols/RpcRecord.h"
#include "protocols/XdrValue.h"
#include "protocols/XdrWriter.h"

#include <cstdint>
#include <span>
#include <vector>

namespace visa {

/// One procedure of an RPC program.
struct RpcProcedure
{
    std::uint32_t program = 0;
    std::uint32_t version = 0;
    std::uint32_t number = 0;
};

/// An RPC client over one TCP connection. libtirpc does the XDR coding; the stream is handled here,
/// because each call has to end by its deadline and no length on the wire may be believed, whatever
/// the peer does.
///
/// Statuses of a call: VI_SUCCESS, those of TcpSocket, VI_ERROR_NSUP_OPER (no such program or
/// procedure), VI_ERROR_IO (refused or nonsense). After nonsense, or after a call that could only
/// be sent in part, the connection is closed; after a time-out it stays usable, and the late reply
/// is dropped when it comes.
class RpcConnection
{
public:
    explicit RpcConnection(const Waker &waker);

    [[nodiscard]] ViStatus connect(const std::vector<HostAddress> &addresses, std::uint16_t port,
                                   const Deadline &deadline);
    void close() { m_socket.close(); }
    [[nodiscard]] bool isOpen() const { return m_socket.isOpen(); }

    /// `dataSize` is the number of bytes of variable size in the arguments.
    template <typename Arguments, typename Results>
    [[nodiscard]] ViStatus
    call(const RpcProcedure &procedure, protocols::XdrCode<Arguments> *encode, Arguments arguments,
         std::size_t dataSize, protocols::XdrValue<Results> &results, const Deadline &deadline)
    {
        const std::size_t headerSize = beginCall(procedure);
        const std::size_t room = LargestFixedArguments + dataSize;
        m_call.resize(headerSize + room);
        const auto size =
            protocols::encodeXdr(encode, arguments, std::span(m_call).subspan(headerSize));
        if (!size) {
            return VI_ERROR_IO;
        }
        m_call.resize(headerSize + *size);
        if (const ViStatus status = exchange(deadline); status != VI_SUCCESS) {
            return status;
        }
        if (results.decode(m_results)) {
            return VI_SUCCESS;
        }
        close();
        return VI_ERROR_IO;
    }

private:
    static constexpr std::size_t LargestFixedArguments = 64;

    [[nodiscard]] std::size_t beginCall(const RpcProcedure &procedure);
    [[nodiscard]] ViStatus exchange(const Deadline &deadline);
    [[nodiscard]] ViStatus receiveRecord(const Deadline &deadline);

    TcpSocket m_socket;
    protocols::RpcRecordReader m_reader;
    std::uint32_t m_transaction;
    protocols::XdrWriter m_head;
    std::vector<std::uint8_t> m_call;
    std::vector<std::uint8_t> m_input; // received bytes from m_inputBegin on are not yet fed
    std::size_t m_inputBegin = 0;
    std::size_t m_inputEnd = 0;
    std::span<const std::uint8_t> m_results; // of the last exchange, inside the reader's record
};

} // namespace visa
