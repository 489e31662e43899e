// SPDX-License-Identifier: Apache-2.0
#include "BlockReader.h"

#include "Transcript.h"
#include "remotepaths.h"

#include "base/OutputFile.h"
#include "base/ProgressClock.h"
#include "base/WriteBehind.h"
#include "log/Tracer.h"
#include "streams/BufferedIO.h"

#include <QElapsedTimer>

#include <algorithm>
#include <array>
#include <cmath>
#include <span>

namespace {

constexpr qint64 FileBlockBytes = 32768;
constexpr qint64 StreamBlockBytes = 2048;
/// Bytes that go to the disk at once.
constexpr qint64 WriteBytes = 256 * 1024;
/// Short reads in a row that are taken for a slow instrument.
constexpr int MaxRetries = 3;
/// Digits of the byte count; one digit tells their number.
constexpr quint32 MaxDigits = 9;

const char *const queryFailed = "Cannot query file from instrument.";
const char *const localWriteFailed = "Writing data to local file failed.";

void note(const QString &text)
{
    Tracer::Trace(Tracer::Information, text);
}

bool isDigit(char character)
{
    return character >= '0' && character <= '9';
}

quint32 digitValue(char character)
{
    return static_cast<quint32>(character - '0');
}

} // namespace

BlockReader::BlockReader(VisaSession &session, OperationControl &control)
    : m_session(session)
    , m_control(control)
{
}

bool BlockReader::fail(const char *text) const
{
    m_session.clear();
    Tracer::Trace(Tracer::Error, text);
    return false;
}

bool BlockReader::fail(const char *text, ViStatus status) const
{
    (void)fail(text);
    m_session.reportStatus(status);
    return false;
}

bool BlockReader::readFile(const QString &remotePath, const QString &localPath, OutputFile &file)
{
    note("Copying file from instrument to local file system.");
    note("Source   \t: " + remotePath);
    note("Destination \t: " + localPath);
    note(QString("R/W Timeout \t: %1 ms").arg(m_session.timeoutMs().value_or(0)));
    // Before the local file is touched.
    if (!m_session.isOpen()) {
        (void)VisaSession::failNotOpen();
        return Tracer::fail(queryFailed);
    }
    if (!file.open()) {
        return Tracer::fail("Cannot open local file for writing.");
    }
    m_control.report(0);
    if (!m_session.send(":MMEM:DATA? " + commandString(remotePath))) {
        return fail(queryFailed);
    }
    // The data may hold any byte.
    m_session.setAttribute(VI_ATTR_TERMCHAR_EN, VI_FALSE);
    const std::optional<qint64> length = readFileLength();
    if (!length) {
        return false;
    }
    note(QString("Reading %1 bytes.").arg(*length));
    Transcript::received(Transcript::blockText(*length));
    QElapsedTimer rateTimer;
    rateTimer.start();
    WriteBehind behind([&file](std::span<const char> bytes) { return file.write(bytes); },
                       WriteBytes, FileBlockBytes);
    const bool received = receiveFile(behind, *length);
    // After a failure too, so that the file tells how far it came.
    const bool written = behind.finish();
    if (!received) {
        return false;
    }
    if (!written) {
        return fail(localWriteFailed);
    }
    if (!readTerminator(*length)) {
        return false;
    }
    const qint64 elapsedMs = rateTimer.elapsed();
    m_control.report(100);
    if (!m_session.checkErrorQueue()) {
        return false;
    }
    if (!file.commit()) {
        return Tracer::fail(localWriteFailed);
    }
    if (elapsedMs > 0) {
        const double rate =
            static_cast<double>(*length) / 1024 / (static_cast<double>(elapsedMs) / 1000);
        // Shows a tenth of the rate, as this line has always done.
        note(QString::asprintf("Transfer rate was %3.1f kB/s.", std::trunc(rate * 10) * 0.01));
    }
    return true;
}

bool BlockReader::readHead(const QString &remotePath, qint64 maximum, QByteArray &head)
{
    head.clear();
    if (!m_session.send(":MMEM:DATA? " + commandString(remotePath))) {
        return fail(queryFailed);
    }
    m_session.setAttribute(VI_ATTR_TERMCHAR_EN, VI_FALSE);
    const std::optional<qint64> length = readFileLength();
    if (!length) {
        return false;
    }
    const qint64 wanted = std::min(*length, maximum);
    head.resize(wanted);
    qint64 received = 0;
    while (received < wanted) {
        quint32 count = 0;
        const auto room = static_cast<quint32>(std::min(wanted - received, FileBlockBytes));
        const ViStatus status = m_session.read(head.data() + received, room, count);
        if (!VisaSession::isGoodRead(status) || count == 0) {
            return fail("Reading binary data block failed.", status);
        }
        received += count;
    }
    Transcript::received(Transcript::blockText(received));
    if (*length <= maximum) {
        return readTerminator(*length);
    }
    // The rest stays where it is.
    const ViStatus status = m_session.clear();
    (void)m_session.checkErrorQueue();
    return status == VI_SUCCESS;
}

std::optional<qint64> BlockReader::readFileLength() const
{
    std::array<char, MaxDigits> text{};
    quint32 count = 0;
    ViStatus status = m_session.read(text.data(), 2, count);
    if (!VisaSession::isGoodRead(status)) {
        (void)fail("Reading start character failed.", status);
        if (!m_session.isSilent()) {
            // A file that isn't there is told of in the queue alone.
            (void)m_session.checkErrorQueue();
        }
        return std::nullopt;
    }
    if (count == 2 && text[0] == '#' && text[1] == '(') {
        return readBracketLength();
    }
    if (count != 2 || text[0] != '#' || !isDigit(text[1])) {
        (void)fail("Invalid or no character received from instrument. Expected character was '#'.",
                   status);
        return std::nullopt;
    }
    const quint32 digits = digitValue(text[1]);
    status = m_session.read(text.data(), digits, count);
    if (!VisaSession::isGoodRead(status)) {
        (void)fail("Reading length information failed.", status);
        return std::nullopt;
    }
    if (count != digits) {
        (void)fail("Invalid length data received from instrument.");
        return std::nullopt;
    }
    return lengthIn(QByteArray(text.data(), digits));
}

std::optional<qint64> BlockReader::lengthIn(const QByteArray &digits) const
{
    // Without digits the block would end where the message does, wherever that is.
    if (digits.isEmpty() || !std::all_of(digits.begin(), digits.end(), isDigit)) {
        (void)fail("Invalid length information received from instrument.");
        return std::nullopt;
    }
    return digits.toLongLong();
}

/// The form for what nine digits can't tell, as it is written: "#(1000000000)".
std::optional<qint64> BlockReader::readBracketLength() const
{
    constexpr qsizetype MaxBracketDigits = 12;
    QByteArray digits;
    while (digits.size() <= MaxBracketDigits) {
        char character = 0;
        quint32 count = 0;
        const ViStatus status = m_session.read(&character, 1, count);
        if (!VisaSession::isGoodRead(status) || count != 1) {
            (void)fail("Reading length information failed.", status);
            return std::nullopt;
        }
        if (character == ')') {
            return lengthIn(digits);
        }
        digits.append(character);
    }
    (void)fail(qPrintable(QString("The instrument announces a block of '%1...' bytes, which has "
                                  "more than %2 digits.")
                              .arg(QString::fromLatin1(digits))
                              .arg(MaxBracketDigits)));
    return std::nullopt;
}

/// The byte behind the data. False if the block goes on there.
bool BlockReader::readTerminator(qint64 length) const
{
    char terminator = 0;
    quint32 count = 0;
    const ViStatus status = m_session.read(&terminator, 1, count);
    if (!VisaSession::isGoodRead(status)) {
        // All data are there, so this is worth no more than a message.
        (void)fail("No terminating character received.", status);
        return true;
    }
    // A stream has no marks between messages, so that there the byte itself must tell.
    const bool goesOn = m_session.isStream() ? terminator != '\n' : status == VI_SUCCESS_MAX_CNT;
    return !goesOn || fail(qPrintable(QString("The instrument sends more than the %1 bytes that it "
                                              "announced.")
                                          .arg(length)));
}

bool BlockReader::receiveFile(WriteBehind &file, qint64 length)
{
    note(QString("Read block size is %1 bytes.").arg(FileBlockBytes));
    ProgressClock progress(m_control.report, m_control.cancelled);
    int retries = 0;
    for (qint64 remaining = length; remaining > 0;) {
        const auto wanted = static_cast<quint32>(std::min(remaining, FileBlockBytes));
        quint32 count = 0;
        const ViStatus status = m_session.read(file.room(), wanted, count);
        if (!VisaSession::isGoodRead(status)) {
            (void)fail("Reading binary data block failed.");
            Tracer::Trace(Tracer::Error,
                          QString("%1 bytes already received.").arg(length - remaining));
            Tracer::Trace(Tracer::Error, QString("%1 bytes remaining.").arg(remaining));
            m_session.reportStatus(status);
            return false;
        }
        if (count != wanted) {
            if (retries == MaxRetries) {
                const QByteArray block(file.room(), count);
                return failIncomplete(length - remaining, length, block, status);
            }
            Tracer::Trace(Tracer::Debug,
                          "viRead() has returned less bytes than expected. Retrying...");
            ++retries;
        } else {
            retries = 0;
        }
        if (!file.add(count)) {
            return fail(localWriteFailed);
        }
        remaining -= count;
        if (progress.shouldStop(length - remaining, length)) {
            return abandon();
        }
    }
    return true;
}

bool BlockReader::failIncomplete(qint64 total, qint64 length, const QByteArray &lastBlock,
                                 ViStatus status) const
{
    constexpr qsizetype ShownBytes = 6;
    (void)fail("viRead(): Binary data transfer incomplete.");
    Tracer::Trace(
        Tracer::Error,
        QString("viRead(): Received %1 bytes but expected %2 bytes.").arg(total).arg(length));
    Tracer::Trace(Tracer::Error, QString("%1 bytes received.").arg(lastBlock.size()));
    if (lastBlock.size() >= ShownBytes) {
        QString text = "Last received data: ";
        for (const char byte : lastBlock.last(ShownBytes)) {
            text += QString::asprintf("%02X ", static_cast<unsigned char>(byte));
        }
        Tracer::Trace(Tracer::Error, text);
    }
    m_session.reportStatus(status);
    return false;
}

bool BlockReader::abandon()
{
    m_session.clear();
    (void)m_session.checkErrorQueue();
    (void)m_session.send("*CLS");
    note("*** Transfer aborted by user.");
    return false;
}

bool BlockReader::readStream(BufferedIO &stream, qint64 maximum)
{
    const std::optional<qint64> length = readStreamLength();
    if (!length) {
        return false;
    }
    if (*length > maximum) {
        return Tracer::fail("Data buffer too small.");
    }
    if (!stream.restartAtBegining() ||
        !stream.writeBytes(BufferedIO::HeaderSize, BufferedIO::DataHeader)) {
        return Tracer::fail("Cannot initialize temporary data buffer.");
    }
    if (Tracer::isEnabled(Tracer::Debug)) {
        Tracer::Trace(Tracer::Debug,
                      QString("Reading with binary block size of %1 bytes.").arg(StreamBlockBytes));
    }
    ViBoolean usesTerminator = VI_FALSE;
    ViStatus status = m_session.getAttribute(VI_ATTR_TERMCHAR_EN, usesTerminator);
    if (status == VI_SUCCESS) {
        status = m_session.setAttribute(VI_ATTR_TERMCHAR_EN, VI_FALSE);
    }
    if (status != VI_SUCCESS) {
        m_session.reportStatus(status);
        return false;
    }
    const std::optional<qint64> received = receiveStream(stream, *length, maximum);
    if (!received) {
        return false;
    }
    status = m_session.setAttribute(VI_ATTR_TERMCHAR_EN, usesTerminator);
    if (status != VI_SUCCESS) {
        m_session.reportStatus(status);
        return false;
    }
    char terminator = 0;
    quint32 count = 0;
    if (!VisaSession::isGoodRead(m_session.read(&terminator, 1, count))) {
        return Tracer::fail("Cannot read terminating character.");
    }
    m_control.report(100);
    note(QString("Reading of %1 bytes completed.").arg(*received));
    return true;
}

std::optional<qint64> BlockReader::readStreamLength() const
{
    const auto failed = [this](const char *text, ViStatus status) {
        Tracer::Trace(Tracer::Error, text);
        m_session.reportStatus(status);
        return std::nullopt;
    };
    char character = 0;
    quint32 count = 0;
    ViStatus status = m_session.read(&character, 1, count);
    if (!VisaSession::isGoodRead(status)) {
        return failed("Cannot read header length.", status);
    }
    if (count != 1 || character != '#') {
        Tracer::Trace(Tracer::Error, "Invalid character in binary data header. Expected '#'.");
        return std::nullopt;
    }
    status = m_session.read(&character, 1, count);
    if (!VisaSession::isGoodRead(status) || count != 1 || !isDigit(character)) {
        return failed("Cannot read header length.", status);
    }
    const quint32 digits = digitValue(character);
    if (Tracer::isEnabled(Tracer::Debug)) {
        Tracer::Trace(Tracer::Debug, QString("The header length is %1 bytes.").arg(digits));
    }
    std::array<char, MaxDigits> text{};
    status = m_session.read(text.data(), digits, count);
    if (!VisaSession::isGoodRead(status)) {
        return failed("Cannot read binary data length information.", status);
    }
    // Reads as far as there are digits.
    qint64 length = 0;
    for (quint32 i = 0; i < count && isDigit(text[i]); ++i) {
        length = 10 * length + digitValue(text[i]);
    }
    note(QString("Instrument sends %1 bytes.").arg(length));
    Transcript::received(Transcript::blockText(length));
    return length;
}

std::optional<qint64> BlockReader::receiveStream(BufferedIO &stream, qint64 length, qint64 maximum)
{
    WriteBehind behind(
        [&stream](std::span<const char> bytes) {
            return stream.writeBlock(static_cast<int>(bytes.size()), bytes.data());
        },
        WriteBytes, StreamBlockBytes);
    m_control.report(0);
    QElapsedTimer progress;
    progress.start();
    qint64 received = 0;
    while (received < length) {
        const auto wanted = static_cast<quint32>(std::min(length - received, StreamBlockBytes));
        quint32 count = 0;
        if (!VisaSession::isGoodRead(m_session.read(behind.room(), wanted, count))) {
            (void)fail("Reading failed.");
            return std::nullopt;
        }
        if (!behind.add(count)) {
            (void)fail("Cannot write data to temporary buffer.");
            return std::nullopt;
        }
        received += count;
        if (progress.elapsed() > ProgressClock::IntervalMs) {
            m_control.report(static_cast<int>(100 * received / maximum));
            progress.restart();
        }
        if (count < wanted) {
            break;
        }
    }
    if (!behind.finish()) {
        (void)fail("Cannot write data to temporary buffer.");
        return std::nullopt;
    }
    return received;
}
