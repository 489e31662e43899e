// SPDX-License-Identifier: Apache-2.0
#include "BufferedIO.h"

#include "log/Tracer.h"

#include <QDir>
#include <QTemporaryFile>

#include <algorithm>
#include <array>
#include <cstring>
#include <new>
#include <utility>

namespace {

/// Reads of this size and above go past the read buffer: the copy would cost more than the call.
constexpr int DirectReadSize = 256 * 1024;

QIODevice::OpenMode openModeOf(int mode)
{
    QIODevice::OpenMode openMode = QIODevice::NotOpen;
    openMode.setFlag(QIODevice::ReadOnly, (mode & BufferedIO::Read) != 0);
    openMode.setFlag(QIODevice::WriteOnly, (mode & BufferedIO::Write) != 0);
    return openMode;
}

} // namespace

BufferedIO::BufferedIO(int bufferSize)
    : m_bufferSize(std::max(bufferSize, 1))
{
}

BufferedIO::~BufferedIO()
{
    if (m_initialised) {
        releaseBuf();
    }
}

void BufferedIO::debug(int level, const QString &text) const
{
    Tracer::Trace(level, text);
}

bool BufferedIO::isUsable() const
{
    if (!m_initialised) {
        Tracer::Trace(Tracer::Error, "Library not initialized.");
    }
    return m_initialised;
}

bool BufferedIO::initBuf(QIODevice *device, int mode)
{
    if (m_initialised) {
        if (m_debug) {
            debug(Tracer::Error, "Buffered IO class is already initialized.");
        }
        return false;
    }
    m_device = device;
    m_mode = mode;
    m_failureTold = false;
    const QIODevice::OpenMode openMode = openModeOf(mode);
    if (openMode == QIODevice::NotOpen || device == nullptr) {
        if (m_debug) {
            debug(Tracer::Error, "Buffered IO must be read, write, or both.");
        }
        return false;
    }
    if (!device->isOpen()) {
        // A QTemporaryFile creates its file here; the second open below tells whether it worked.
        device->open(openMode);
    }
    auto size = static_cast<std::size_t>(m_bufferSize);
    if ((mode & Read) != 0) {
        m_readBuffer.reset(new (std::nothrow) char[size]);
    }
    if ((mode & Write) != 0) {
        m_writeBuffer.reset(new (std::nothrow) char[size]);
    }
    const bool readMissing = (mode & Read) != 0 && !m_readBuffer;
    if (readMissing || ((mode & Write) != 0 && !m_writeBuffer)) {
        if (m_debug) {
            debug(Tracer::Error,
                  readMissing ? "Cannot allocate read buffer." : "Cannot allocate write buffer.");
        }
        m_readBuffer.reset();
        m_writeBuffer.reset();
        return false;
    }
    if (device->isOpen()) {
        device->close();
    }
    m_readPosition = -1;
    m_windowEnd = -1;
    const bool opened = device->open(QIODevice::Unbuffered | openMode);
    if (!opened || (m_readBuffer && !firstFill())) {
        m_readBuffer.reset();
        m_writeBuffer.reset();
        return false;
    }
    m_readIndex = 0;
    m_writeFill = 0;
    m_writePosition = -1;
    m_initialised = true;
    if (m_debug) {
        debug(Tracer::Debug, QString::asprintf("initBuf() : R indata=%d, rpointer=%lld",
                                               m_bytesInReadBuffer, m_readPosition));
    }
    return true;
}

bool BufferedIO::reinitBuf()
{
    return m_device != nullptr && initBuf(m_device, m_mode);
}

bool BufferedIO::releaseBuf()
{
    if (m_debug) {
        debug(Tracer::Debug, "releaseBuf()");
    }
    if (!m_initialised) {
        Tracer::Trace(Tracer::Error, "Buffer not initialized.");
        return false;
    }
    if (m_writeBuffer) {
        if (!flush()) {
            return false;
        }
        m_writeBuffer.reset();
        m_writeFill = 0;
        m_writePosition = -1;
    }
    m_readBuffer.reset();
    m_bytesInReadBuffer = 0;
    m_readIndex = 0;
    m_readPosition = -1;
    m_windowEnd = -1;
    m_device->close();
    m_initialised = false;
    return true;
}

bool BufferedIO::firstFill()
{
    m_readPosition = 0;
    const qint64 count = m_device->read(m_readBuffer.get(), m_bufferSize);
    if (count < 0) {
        return false;
    }
    m_readPosition += count;
    m_windowEnd = m_readPosition;
    m_bytesInReadBuffer = static_cast<int>(count);
    return true;
}

void BufferedIO::noteDirectRead(qint64 count)
{
    const qint64 beyond = m_readPosition + count - std::max(m_windowEnd, m_readPosition);
    if (beyond > 0) {
        const qint64 windows = (beyond + m_bufferSize - 1) / m_bufferSize;
        m_windowEnd = std::max(m_windowEnd, m_readPosition) + windows * m_bufferSize;
    }
}

bool BufferedIO::completeWindow()
{
    if (!m_readBuffer || m_readPosition >= m_windowEnd) {
        return true;
    }
    const qint64 got = m_device->read(m_readBuffer.get(), m_windowEnd - m_readPosition);
    if (got < 0) {
        return false;
    }
    m_readIndex = 0;
    m_bytesInReadBuffer = static_cast<int>(got);
    m_readPosition += got;
    m_windowEnd = m_readPosition;
    return true;
}

bool BufferedIO::readBytes(int len, void *buffer)
{
    // The common way of sample loops: a test and a copy.
    if (m_readBuffer && buffer != nullptr && len > 0 && len <= m_bytesInReadBuffer - m_readIndex) {
        std::memcpy(buffer, m_readBuffer.get() + m_readIndex, static_cast<size_t>(len));
        m_readIndex += len;
        return true;
    }
    return readBlock(len, buffer) > 0;
}

int BufferedIO::readBlock(int len, void *buffer)
{
    if (!isUsable() || !m_readBuffer || buffer == nullptr) {
        return -1;
    }
    char *target = static_cast<char *>(buffer);
    int missing = len;
    while (missing > 0) {
        const int available = m_bytesInReadBuffer - m_readIndex;
        const int count = std::min(available, missing);
        std::memcpy(target, m_readBuffer.get() + m_readIndex, static_cast<size_t>(count));
        m_readIndex += count;
        target += count;
        missing -= count;
        if (missing == 0) {
            break;
        }
        if (m_debug) {
            debug(Tracer::Debug,
                  QString("readBytes() : R remaining len=%1, acquiring again").arg(missing));
        }
        if (m_writePosition != -1 && !m_device->seek(m_readPosition)) {
            return -1;
        }
        // Only while nothing is being written: then it doesn't matter how far reads look ahead.
        const bool direct = missing >= DirectReadSize && m_writePosition == -1 && m_writeFill == 0;
        const qint64 window =
            m_readPosition < m_windowEnd ? m_windowEnd - m_readPosition : m_bufferSize;
        const qint64 got =
            direct ? m_device->read(target, missing) : m_device->read(m_readBuffer.get(), window);
        m_readIndex = 0;
        m_bytesInReadBuffer = direct ? 0 : static_cast<int>(std::max<qint64>(got, 0));
        if (got < 0) {
            return -1;
        }
        if (got == 0) {
            if (m_debug) {
                debug(Tracer::Debug, "readBytes() : R no more data available");
            }
            break;
        }
        if (direct) {
            noteDirectRead(got);
        } else {
            m_windowEnd = m_readPosition + got;
        }
        m_readPosition += got;
        if (direct) {
            target += got;
            missing -= static_cast<int>(got);
        }
        if (m_debug) {
            debug(Tracer::Debug, QString::asprintf("readBytes() : R indata=%d, rpointer=%lld",
                                                   m_bytesInReadBuffer, m_readPosition));
        }
    }
    return len - missing;
}

bool BufferedIO::seekForWrite()
{
    if (m_writePosition == -1) {
        m_writePosition = 0;
    }
    return m_readPosition == -1 || m_device->seek(m_writePosition);
}

/// Writes all bytes, or names the folder and the system's reason: callers know just what they
/// wanted to write.
bool BufferedIO::put(const char *bytes, int count)
{
    const auto *file = qobject_cast<const QTemporaryFile *>(m_device);
    int done = 0;
    while (done < count) {
        const auto written = static_cast<int>(m_device->write(bytes + done, count - done));
        if (written <= 0) {
            // Buffered bytes are tried again when the stream goes.
            if (file != nullptr && !std::exchange(m_failureTold, true)) {
                // Asking for its own name would give it one, and it might stay after a crash.
                Tracer::Trace(Tracer::Error,
                              QString("Cannot write to the temporary folder '%1': %2")
                                  .arg(QDir::tempPath(), file->errorString()));
            }
            return false;
        }
        done += written;
        if (file == nullptr) {
            break;
        }
        // A file on a full disk takes what still fits; the next write tells the reason.
    }
    return done == count;
}

bool BufferedIO::writeToDevice(const char *bytes, int count)
{
    if (!completeWindow() || !seekForWrite()) {
        return false;
    }
    if (!put(bytes, count)) {
        if (m_debug) {
            debug(Tracer::Error, "writeBytes() : W Incorrect number of bytes written.");
        }
        return false;
    }
    m_writePosition += count;
    m_writeFill = 0;
    if (m_debug) {
        debug(Tracer::Debug, QString::asprintf("writeBytes() : W newpos=%lld", m_writePosition));
    }
    return true;
}

bool BufferedIO::writeBlock(int len, const void *buffer)
{
    if (!isUsable() || !m_writeBuffer || buffer == nullptr || len < 1) {
        return false;
    }
    return (m_writeFill == 0 || writeToDevice(m_writeBuffer.get(), m_writeFill)) &&
           writeToDevice(static_cast<const char *>(buffer), len);
}

bool BufferedIO::writeBytes(int len, const void *buffer)
{
    if (!isUsable() || !m_writeBuffer || buffer == nullptr || len < 0) {
        return false;
    }
    const char *source = static_cast<const char *>(buffer);
    int missing = len;
    while (missing > m_bufferSize - m_writeFill) {
        const int room = m_bufferSize - m_writeFill;
        std::memcpy(m_writeBuffer.get() + m_writeFill, source, static_cast<size_t>(room));
        source += room;
        missing -= room;
        m_writeFill = m_bufferSize;
        if (!writeToDevice(m_writeBuffer.get(), m_bufferSize)) {
            return false;
        }
    }
    std::memcpy(m_writeBuffer.get() + m_writeFill, source, static_cast<size_t>(missing));
    m_writeFill += missing;
    return len != 0;
}

bool BufferedIO::flush()
{
    if (m_writeFill < 1) {
        return true;
    }
    if (m_debug) {
        debug(Tracer::Debug, QString("flush() : W len=%1").arg(m_writeFill));
    }
    return seekForWrite() && put(m_writeBuffer.get(), m_writeFill);
}

bool BufferedIO::restartAtBegining()
{
    if (m_debug) {
        debug(Tracer::Debug, "restartAtBegining()");
    }
    return restart() && (!m_readBuffer || firstFill());
}

bool BufferedIO::restart()
{
    if (!isUsable() || (m_writeBuffer && !flush()) || !m_device->seek(0)) {
        return false;
    }
    m_readPosition = -1;
    m_windowEnd = -1;
    m_bytesInReadBuffer = 0;
    m_readIndex = 0;
    m_writeFill = 0;
    m_writePosition = -1;
    return true;
}

bool BufferedIO::restartAtPosition(qint64 position)
{
    if (m_debug) {
        debug(Tracer::Debug, "restartAtPosition()");
    }
    // The first block isn't read: jumps through long streams would read it each time for nothing.
    if (!restart() || !m_device->seek(position)) {
        return false;
    }
    m_readPosition = position;
    m_windowEnd = position;
    return true;
}

bool BufferedIO::checkHeader(const QString &text)
{
    std::array<char, HeaderSize> header{};
    return restartAtBegining() && readBlock(HeaderSize, header.data()) == HeaderSize &&
           QLatin1String(header.data(), HeaderSize) == text;
}

bool BufferedIO::writeHeader(const QString &text)
{
    const QByteArray bytes = text.toLatin1();
    return restartAtBegining() && writeBytes(static_cast<int>(bytes.size()), bytes.constData());
}

qint64 BufferedIO::deviceSize() const
{
    return m_device != nullptr ? m_device->size() : 0;
}
