// SPDX-License-Identifier: Apache-2.0
#include "Session.h"

#include "formattext.h"

#include <cstring>

namespace visa {

namespace {

// All attributes offered are at most 32 bits wide; a caller that declares the state narrower than
// this library leaves the upper half of the register undefined.
ViUInt32 lowWord(ViAttrState state)
{
    return static_cast<ViUInt32>(state);
}

ViStatus setFlag(bool &flag, ViUInt32 state)
{
    if (state > 1) {
        return VI_ERROR_NSUP_ATTR_STATE;
    }
    flag = state == 1;
    return VI_SUCCESS;
}

ViStatus setMode(ViUInt16 &mode, ViUInt32 state, ViUInt16 otherThanOnAccess)
{
    if (state != VI_FLUSH_ON_ACCESS && state != otherThanOnAccess) {
        return VI_ERROR_NSUP_ATTR_STATE;
    }
    mode = static_cast<ViUInt16>(state);
    return VI_SUCCESS;
}

template <typename T>
ViStatus deliver(void *state, T value)
{
    std::memcpy(state, &value, sizeof value);
    return VI_SUCCESS;
}

ViStatus deliverFlag(void *state, bool value)
{
    return deliver<ViBoolean>(state, value ? VI_TRUE : VI_FALSE);
}

ViStatus deliverText(void *state, const std::string &text)
{
    std::memcpy(state, text.c_str(), text.size() + 1);
    return VI_SUCCESS;
}

} // namespace

Session::Session(const ResourceName &name, std::unique_ptr<Transport> transport)
    : m_name(name)
    , m_interfaceType(transport->interfaceType())
    , m_transport(std::move(transport))
    , m_interruptible(m_transport.get())
{
}

Session::Attributes Session::attributes() const
{
    const std::lock_guard lock(m_attributesMutex);
    return m_attributes;
}

ViStatus Session::setAttribute(ViAttr attribute, ViAttrState state)
{
    const ViUInt32 value = lowWord(state);
    const std::lock_guard lock(m_attributesMutex);
    switch (attribute) {
    case VI_ATTR_TMO_VALUE:
        m_attributes.timeoutMs = value;
        return VI_SUCCESS;
    case VI_ATTR_SEND_END_EN:
        return setFlag(m_attributes.sendsEnd, value & 0xFFFFU);
    case VI_ATTR_SUPPRESS_END_EN:
        return setFlag(m_attributes.suppressesEnd, value & 0xFFFFU);
    case VI_ATTR_TERMCHAR_EN:
        return setFlag(m_attributes.hasTerminator, value & 0xFFFFU);
    case VI_ATTR_TERMCHAR:
        if (value > 0xFF) {
            return VI_ERROR_NSUP_ATTR_STATE;
        }
        m_attributes.terminator = static_cast<ViUInt8>(value);
        return VI_SUCCESS;
    case VI_ATTR_RD_BUF_OPER_MODE:
        return setMode(m_attributes.readBufferMode, value & 0xFFFFU, VI_FLUSH_DISABLE);
    case VI_ATTR_WR_BUF_OPER_MODE:
        return setMode(m_attributes.writeBufferMode, value & 0xFFFFU, VI_FLUSH_WHEN_FULL);
    case VI_ATTR_RSRC_CLASS:
    case VI_ATTR_RSRC_NAME:
    case VI_ATTR_RD_BUF_SIZE:
    case VI_ATTR_WR_BUF_SIZE:
    case VI_ATTR_INTF_TYPE:
    case VI_ATTR_INTF_NUM:
        return VI_ERROR_ATTR_READONLY;
    case VI_ATTR_GPIB_PRIMARY_ADDR:
        return m_name.kind == ResourceKind::Gpib ? VI_ERROR_ATTR_READONLY : VI_ERROR_NSUP_ATTR;
    case VI_ATTR_TCPIP_PORT:
        return m_name.kind == ResourceKind::Socket ? VI_ERROR_ATTR_READONLY : VI_ERROR_NSUP_ATTR;
    default:
        return VI_ERROR_NSUP_ATTR;
    }
}

ViStatus Session::getAttribute(ViAttr attribute, void *state) const
{
    const Attributes current = attributes();
    switch (attribute) {
    case VI_ATTR_TMO_VALUE:
        return deliver<ViUInt32>(state, current.timeoutMs);
    case VI_ATTR_SEND_END_EN:
        return deliverFlag(state, current.sendsEnd);
    case VI_ATTR_SUPPRESS_END_EN:
        return deliverFlag(state, current.suppressesEnd);
    case VI_ATTR_TERMCHAR_EN:
        return deliverFlag(state, current.hasTerminator);
    case VI_ATTR_TERMCHAR:
        return deliver<ViUInt8>(state, current.terminator);
    case VI_ATTR_RD_BUF_OPER_MODE:
        return deliver<ViUInt16>(state, current.readBufferMode);
    case VI_ATTR_WR_BUF_OPER_MODE:
        return deliver<ViUInt16>(state, current.writeBufferMode);
    case VI_ATTR_RD_BUF_SIZE:
        return deliver<ViUInt32>(state, current.readBufferSize);
    case VI_ATTR_WR_BUF_SIZE:
        return deliver<ViUInt32>(state, current.writeBufferSize);
    case VI_ATTR_RSRC_CLASS:
        return deliverText(state, m_name.kind == ResourceKind::Socket ? "SOCKET" : "INSTR");
    case VI_ATTR_RSRC_NAME:
        return deliverText(state, resourceText(m_name));
    case VI_ATTR_INTF_TYPE:
        return deliver<ViUInt16>(state, m_interfaceType);
    case VI_ATTR_INTF_NUM:
        return deliver<ViUInt16>(state, m_name.board);
    case VI_ATTR_GPIB_PRIMARY_ADDR:
        if (m_name.kind != ResourceKind::Gpib) {
            return VI_ERROR_NSUP_ATTR;
        }
        return deliver<ViUInt16>(state, m_name.primary);
    case VI_ATTR_TCPIP_PORT:
        if (m_name.kind != ResourceKind::Socket) {
            return VI_ERROR_NSUP_ATTR;
        }
        return deliver<ViUInt16>(state, m_name.port);
    default:
        return VI_ERROR_NSUP_ATTR;
    }
}

ViStatus Session::setBuffer(ViUInt16 mask, ViUInt32 size)
{
    constexpr unsigned ReadMask = VI_READ_BUF | VI_IO_IN_BUF;
    constexpr unsigned WriteMask = VI_WRITE_BUF | VI_IO_OUT_BUF;
    if (mask == 0 || (mask & ~(ReadMask | WriteMask)) != 0) {
        return VI_ERROR_INV_MASK;
    }
    // Data go straight from and to the caller's memory, so the sizes are only kept for asking.
    const std::lock_guard lock(m_attributesMutex);
    if ((mask & VI_READ_BUF) != 0) {
        m_attributes.readBufferSize = size;
    }
    if ((mask & VI_WRITE_BUF) != 0) {
        m_attributes.writeBufferSize = size;
    }
    return VI_SUCCESS;
}

template <typename Transfer>
ViStatus Session::perform(Transfer transfer)
{
    const Attributes current = attributes();
    const Deadline deadline = Deadline::after(current.timeoutMs);
    if (!m_turnstile.enter(deadline)) {
        return VI_ERROR_TMO;
    }
    const Turnstile::Passage passage(m_turnstile);
    if (!m_transport) {
        return VI_ERROR_INV_OBJECT;
    }
    return transfer(*m_transport, current, deadline);
}

ViStatus Session::write(std::span<const std::uint8_t> data, std::size_t &count)
{
    count = 0;
    return perform([&](Transport &transport, const Attributes &current, const Deadline &deadline) {
        if (data.empty()) {
            return ViStatus{VI_SUCCESS};
        }
        return transport.write(data, current.sendsEnd, deadline, count);
    });
}

ViStatus Session::read(std::span<std::uint8_t> buffer, std::size_t &count)
{
    count = 0;
    return perform([&](Transport &transport, const Attributes &current, const Deadline &deadline) {
        if (buffer.empty()) {
            return ViStatus{VI_SUCCESS};
        }
        ReadOptions options;
        if (current.hasTerminator) {
            options.terminator = current.terminator;
        }
        options.stopsAtEnd = !current.suppressesEnd;
        return transport.read(buffer, options, deadline, count);
    });
}

ViStatus Session::print(std::string_view format)
{
    const auto messages = formatMessages(format);
    if (!messages) {
        return VI_ERROR_INV_FMT;
    }
    return perform([&](Transport &transport, const Attributes &current, const Deadline &deadline) {
        for (const std::string &message : *messages) {
            const auto *bytes = reinterpret_cast<const std::uint8_t *>(message.data());
            std::size_t count = 0;
            const ViStatus status = transport.write(std::span(bytes, message.size()),
                                                    current.sendsEnd, deadline, count);
            if (status != VI_SUCCESS) {
                return status;
            }
        }
        return ViStatus{VI_SUCCESS};
    });
}

ViStatus Session::clear()
{
    return perform([](Transport &transport, const Attributes &, const Deadline &deadline) {
        return transport.clear(deadline);
    });
}

ViStatus Session::controlRemote(ViUInt16 mode)
{
    if (mode > VI_GPIB_REN_ADDRESS_GTL) {
        return VI_ERROR_INV_MODE;
    }
    return perform([mode](Transport &transport, const Attributes &, const Deadline &deadline) {
        return transport.controlRemote(mode, deadline);
    });
}

void Session::close()
{
    if (!m_turnstile.enter(Deadline::after(0))) {
        m_interruptible->interrupt();
        (void)m_turnstile.enter(Deadline::after(VI_TMO_INFINITE));
    }
    const Turnstile::Passage passage(m_turnstile);
    m_transport.reset();
}

} // namespace visa
