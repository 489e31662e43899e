// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "ObjectTable.h"
#include "ResourceName.h"
#include "Transport.h"
#include "Turnstile.h"

#include <memory>
#include <mutex>
#include <span>
#include <string>
#include <string_view>
#include <vector>

namespace visa {

/// An open session to one instrument: its attributes and, one at a time, its transfers. Any thread.
class Session : public Object
{
public:
    Session(const ResourceName &name, std::unique_ptr<Transport> transport);

    [[nodiscard]] ViStatus setAttribute(ViAttr attribute, ViAttrState state);
    /// `state` points to a variable of the attribute's type, as visa.h tells.
    [[nodiscard]] ViStatus getAttribute(ViAttr attribute, void *state) const;
    [[nodiscard]] ViStatus setBuffer(ViUInt16 mask, ViUInt32 size);

    [[nodiscard]] ViStatus write(std::span<const std::uint8_t> data, std::size_t &count);
    [[nodiscard]] ViStatus read(std::span<std::uint8_t> buffer, std::size_t &count);
    [[nodiscard]] ViStatus print(std::string_view format);
    [[nodiscard]] ViStatus clear();
    [[nodiscard]] ViStatus controlRemote(ViUInt16 mode);

    void close() override;

private:
    struct Attributes
    {
        ViUInt32 timeoutMs = 2000;
        bool sendsEnd = true;
        bool suppressesEnd = false;
        bool hasTerminator = false;
        ViUInt8 terminator = '\n';
        ViUInt16 readBufferMode = VI_FLUSH_DISABLE;
        ViUInt16 writeBufferMode = VI_FLUSH_WHEN_FULL;
        ViUInt32 readBufferSize = 4096;
        ViUInt32 writeBufferSize = 4096;
    };

    [[nodiscard]] Attributes attributes() const;

    /// Calls `transfer(Transport &, const Attributes &, const Deadline &)` when it is this call's
    /// turn, or fails by the deadline.
    template <typename Transfer>
    [[nodiscard]] ViStatus perform(Transfer transfer);

    const ResourceName m_name;
    const ViUInt16 m_interfaceType;

    mutable std::mutex m_attributesMutex; // never held during a transfer
    Attributes m_attributes;

    Turnstile m_turnstile;                  // entered during a transfer
    std::unique_ptr<Transport> m_transport; // null when closed
    Transport *const m_interruptible;       // the same, for close()
};

} // namespace visa
