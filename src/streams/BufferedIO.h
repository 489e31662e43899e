// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <QString>
#include <QtGlobal>

#include <memory>

class QIODevice;

/// A byte stream with one large read buffer and one large write buffer over a QIODevice.
///
/// All work on waveforms goes through such streams on temporary files. Three kinds exist, told
/// apart only by their use:
/// - data stream: the three ASCII bytes "IQF", then one record of 8 bytes a sample, I and Q as
///   32-bit floats in the byte order of the machine, full scale 1.0; sample n lies at byte 3 + 8 n;
/// - marker stream: one byte a sample, bit 0 is marker 1, bit 3 marker 4;
/// - tags stream: plain bytes, the verbatim text of unknown tags.
///
/// The read side sees only what has reached the device, and only a restart flushes. The read and
/// the write side have positions of their own, so a marker stream may be read and rewritten in
/// place in one pass. A stream belongs to one thread at a time. After a failed write the contents
/// are undefined.
class BufferedIO
{
public:
    enum Mode {
        Read = 1,
        Write = 2,
        ReadWrite = Read | Write,
    };

    static constexpr int BufferSize = 16 * 1024 * 1024; ///< bytes of each side's buffer by default
    static constexpr char DataHeader[] = "IQF";
    static constexpr int HeaderSize = 3; ///< bytes of DataHeader
    static constexpr int RecordSize = 8; ///< bytes of one sample in a data stream

    /// `bufferSize` in bytes, at least 1, is that of the read buffer and of the write buffer; many
    /// streams at once take smaller ones to stay within the memory of a job.
    explicit BufferedIO(int bufferSize = BufferSize);
    ~BufferedIO();
    BufferedIO(const BufferedIO &) = delete;
    BufferedIO &operator=(const BufferedIO &) = delete;

    /// Binds the stream to a device, which isn't owned and must outlive the stream's use, opens it
    /// and allocates the buffers. False if already initialised, if the mode is neither read nor
    /// write, or if memory or the device fail.
    [[nodiscard]] bool initBuf(QIODevice *device, int mode);

    /// initBuf with the stored device and mode, for a released stream that is to be used again.
    [[nodiscard]] bool reinitBuf();

    /// Flushes, frees the buffers and closes the device.
    bool releaseBuf();

    [[nodiscard]] bool isInitialised() const { return m_initialised; }
    [[nodiscard]] int bufferSize() const { return m_bufferSize; } ///< bytes

    /// Copies the next `len` bytes. A read that gets at least one byte succeeds even where it meets
    /// the end of the stream, and leaves the rest of the buffer untouched: the end is told by the
    /// count of samples, or by readBlock.
    [[nodiscard]] bool readBytes(int len, void *buffer);

    /// As readBytes, but returns how many of the `len` bytes came: 0 at the end of the stream, -1
    /// on failure.
    [[nodiscard]] int readBlock(int len, void *buffer);

    /// Appends `len` bytes.
    [[nodiscard]] bool writeBytes(int len, const void *buffer);

    /// Appends `len` bytes as writeBytes does, but hands them to the device at once: for blocks
    /// large enough that the copy through the buffer costs more than the transfer. Reads may see
    /// them before a restart.
    [[nodiscard]] bool writeBlock(int len, const void *buffer);

    /// Flushes what was written and goes to the start for reading and writing.
    [[nodiscard]] bool restartAtBegining();

    /// As restartAtBegining, then moves the read side to a byte position; writes go to the start.
    [[nodiscard]] bool restartAtPosition(qint64 position);

    /// Restarts and tells whether the stream begins with this text of three characters; the read
    /// side is then at the first sample.
    [[nodiscard]] bool checkHeader(const QString &text);

    /// Restarts and writes the text as ASCII; the write side is then behind it.
    [[nodiscard]] bool writeHeader(const QString &text);

    /// Bytes that have reached the device; the whole content directly after a restart.
    [[nodiscard]] qint64 deviceSize() const;

    /// Switches the stream's own messages on (off after construction).
    void setDebug(bool on) { m_debug = on; }

private:
    [[nodiscard]] bool firstFill();
    void noteDirectRead(qint64 count);
    [[nodiscard]] bool completeWindow();
    [[nodiscard]] bool restart();
    [[nodiscard]] bool flush();
    [[nodiscard]] bool writeToDevice(const char *bytes, int count);
    [[nodiscard]] bool seekForWrite();
    [[nodiscard]] bool put(const char *bytes, int count);
    [[nodiscard]] bool isUsable() const;
    void debug(int level, const QString &text) const;

    const int m_bufferSize;
    bool m_debug = false;
    bool m_initialised = false;
    QIODevice *m_device = nullptr;
    int m_mode = 0;
    bool m_failureTold = false;
    std::unique_ptr<char[]> m_readBuffer;
    std::unique_ptr<char[]> m_writeBuffer;
    int m_readIndex = 0;
    int m_writeFill = 0;
    qint64 m_readPosition = -1; ///< file position behind the bytes in the read buffer, -1 unset
    /// Up to here reads see the file as it was before later writes, as if each had taken a whole
    /// buffer; behind m_readPosition after reads past the buffer.
    qint64 m_windowEnd = -1;
    qint64 m_writePosition = -1; ///< where the write buffer goes, -1 while nothing was written
    int m_bytesInReadBuffer = 0;
};
