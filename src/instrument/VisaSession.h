// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "VisaLibrary.h"

#include <QByteArray>
#include <QString>

#include <algorithm>
#include <optional>
#include <utility>

/// How an exchange with an instrument ended. The reason of a failure is in the log as well.
struct [[nodiscard]] Exchange
{
    enum class Outcome {
        Done,
        NotOpen,    ///< there is no session, or for open() there is one already
        NoLibrary,  ///< the VISA library is missing or lacks a function
        Unsendable, ///< the text can't be sent, or its addressee be reached
        Failed,     ///< the library answered with `status`
        Refused,    ///< the instrument answered, but with an error
    };

    Outcome outcome = Outcome::Done;
    ViStatus status = VI_SUCCESS; ///< of Outcome::Failed

    [[nodiscard]] explicit operator bool() const { return outcome == Outcome::Done; }
};

/// One session with an instrument: opening and closing, commands and queries, the error queue, and
/// the calls of the library for those who move blocks. What the instrument itself reports gathers
/// until takeErrors().
class VisaSession
{
public:
    /// Opens and configures; a session that is open is left alone.
    Exchange open(const QString &resource);
    /// Also done when nothing is open.
    Exchange close();
    [[nodiscard]] bool isOpen() const { return m_isOpen; }

    /// See VisaDevice::sendCommand.
    Exchange send(const QString &command);
    /// See VisaDevice::queryText.
    Exchange query(const QString &command, QString &answer);
    /// See VisaDevice::checkErrorQueue.
    Exchange checkErrorQueue();
    [[nodiscard]] QString takeErrors() { return std::exchange(m_errors, {}); }
    /// Puts errors in place of those gathered by now.
    void setErrors(const QString &errors) { m_errors = errors; }

    Exchange setTimeoutMs(quint32 milliseconds);
    /// Nothing if it can't be told.
    [[nodiscard]] std::optional<quint32> timeoutMs() const;
    /// VI_ATTR_INTF_TYPE. Nothing, with the reason logged, if it can't be told.
    [[nodiscard]] std::optional<quint16> interfaceType() const;

    /// Logs the library's words for a status.
    void reportStatus(ViStatus status) const;

    /// Logs that there is no session.
    static bool failNotOpen();

    // The calls of the library. The caller has made sure that it has the functions for them.

    /// Reads up to `size` bytes; never believes in more than that.
    [[nodiscard]] ViStatus read(char *buffer, quint32 size, quint32 &count) const
    {
        ViUInt32 received = 0;
        const ViStatus status =
            visa().viRead(m_handle, reinterpret_cast<ViByte *>(buffer), size, &received);
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
        return visa().viWrite(m_handle, reinterpret_cast<const ViByte *>(bytes), size, &count);
    }

    ViStatus clear() const { return visa().viClear(m_handle); }

    ViStatus setAttribute(ViAttr attribute, ViAttrState value) const
    {
        return visa().viSetAttribute(m_handle, attribute, value);
    }

    /// The type of `value` is that which VISA publishes for the attribute.
    template <typename Value>
    [[nodiscard]] ViStatus getAttribute(ViAttr attribute, Value &value) const
    {
        return visa().viGetAttribute(m_handle, attribute, &value);
    }

    /// Whether a read delivered what it could: complete, up to the termination character, or as
    /// much as was asked for.
    [[nodiscard]] static bool isGoodRead(ViStatus status)
    {
        return status == VI_SUCCESS || status == VI_SUCCESS_TERM_CHAR ||
               status == VI_SUCCESS_MAX_CNT;
    }

private:
    [[nodiscard]] static const VisaFunctions &visa() { return VisaLibrary::instance().all(); }
    [[nodiscard]] ViStatus configure() const;
    Exchange failWith(ViStatus status) const;

    ViSession m_handle = VI_NULL; ///< 0 when closed
    bool m_isOpen = false;
    QString m_errors; ///< of the instrument, one a line
};
