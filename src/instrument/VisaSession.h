// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "VisaLibrary.h"

#include <QByteArray>

#include <algorithm>

/// The calls on one open session, with the status of the library as result. The caller has made
/// sure that the library has the functions behind them.
class VisaSession
{
public:
    VisaSession(const VisaFunctions &visa, ViSession handle)
        : m_visa(visa)
        , m_handle(handle)
    {
    }

    /// Reads up to `size` bytes; never believes in more than that.
    [[nodiscard]] ViStatus read(char *buffer, quint32 size, quint32 &count) const
    {
        ViUInt32 received = 0;
        const ViStatus status =
            m_visa.viRead(m_handle, reinterpret_cast<ViByte *>(buffer), size, &received);
        count = std::min<quint32>(received, size);
        return status;
    }

    [[nodiscard]] ViStatus write(const QByteArray &bytes, quint32 &count) const
    {
        return write(bytes.constData(), static_cast<quint32>(bytes.size()), count);
    }

    [[nodiscard]] ViStatus write(const char *bytes, quint32 size, quint32 &count) const
    {
        count = 0;
        return m_visa.viWrite(m_handle, reinterpret_cast<const ViByte *>(bytes), size, &count);
    }

    ViStatus clear() const { return m_visa.viClear(m_handle); }

    ViStatus setAttribute(ViAttr attribute, ViAttrState value) const
    {
        return m_visa.viSetAttribute(m_handle, attribute, value);
    }

    /// The type of `value` is that which VISA publishes for the attribute.
    template <typename Value>
    [[nodiscard]] ViStatus getAttribute(ViAttr attribute, Value &value) const
    {
        return m_visa.viGetAttribute(m_handle, attribute, &value);
    }

    /// Whether a read delivered what it could: complete, up to the termination character, or as
    /// much as was asked for.
    [[nodiscard]] static bool isGoodRead(ViStatus status)
    {
        return status == VI_SUCCESS || status == VI_SUCCESS_TERM_CHAR ||
               status == VI_SUCCESS_MAX_CNT;
    }

private:
    const VisaFunctions &m_visa;
    ViSession m_handle;
};
