// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "VisaLibrary.h"

#include <QByteArray>
#include <QString>

#include <algorithm>
#include <optional>
#include <utility>

struct OperationControl;

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
    /// Opens and configures; a session that is open is left alone. A cancel by `control` ends the
    /// wait for a host.
    Exchange open(const QString &resource, const OperationControl &control);
    /// Also done when nothing is open. A silent instrument holds it up for less than a second.
    Exchange close();
    [[nodiscard]] bool isOpen() const { return m_isOpen; }

    /// Makes a lost connection anew, with nothing said to the instrument. On a failure the session
    /// is closed.
    Exchange reopen();

    /// Whether the instrument let time run out and took no notice of being cleared either. Every
    /// call fails at once then, until the session is opened anew.
    [[nodiscard]] bool isSilent() const { return m_isSilent; }

    /// See VisaDevice::sendCommand.
    Exchange send(const QString &command);
    /// What becomes of the white space in an answer.
    enum class Blanks { Collapsed, Kept };

    /// See VisaDevice::queryText. Of an answer above 64 MiB nothing is delivered.
    Exchange query(const QString &command, QString &answer, Blanks blanks = Blanks::Collapsed);
    /// The answer to a query that the instrument may not know; nothing if none comes in time.
    [[nodiscard]] std::optional<QString> ask(const QString &query, quint32 milliseconds);
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
    [[nodiscard]] ViStatus read(char *buffer, quint32 size, quint32 &count);

    [[nodiscard]] ViStatus write(const QByteArray &bytes, quint32 &count)
    {
        return write(bytes.constData(), static_cast<quint32>(bytes.size()), count);
    }

    [[nodiscard]] ViStatus write(const char *bytes, quint32 size, quint32 &count);

    /// Drops what is on its way in both directions, so that no late answer is taken for that of
    /// another command.
    ViStatus clear();

    /// Whether a byte stream without marks of its own carries the session, so that only the bytes
    /// tell where an answer ends.
    [[nodiscard]] bool isStream() const { return m_isStream; }

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
    class Patience;

    [[nodiscard]] static const VisaFunctions &visa() { return VisaLibrary::instance().all(); }
    [[nodiscard]] ViStatus openHandle();
    [[nodiscard]] ViStatus configure();
    [[nodiscard]] ViStatus readAll(QByteArray &bytes);
    [[nodiscard]] ViStatus readError(QString &answer);
    [[nodiscard]] ViStatus noted(ViStatus status);
    void fallSilent();
    Exchange failWith(ViStatus status) const;
    /// For a read that left the session between two messages.
    Exchange failRead(ViStatus status);

    ViSession m_handle = VI_NULL; ///< 0 when closed
    QByteArray m_name;            ///< of the resource
    quint32 m_timeoutMs = 0;
    bool m_isOpen = false;
    bool m_isStream = false;
    bool m_isLate = false; ///< the last call ran out of time and nothing was answered since
    bool m_isSilent = false;
    QString m_errors; ///< of the instrument, one a line
};
