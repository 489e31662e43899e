// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <QByteArray>
#include <QString>
#include <QtGlobal>

#include <cstddef>
#include <span>

class QIODevice;

/// Text content of a tag, or of one item of its list.
struct TagText
{
    QString text;
    bool endedOnBrace = false;
    bool endedOnDelimiter = false;
    qint64 consumed = 0; ///< bytes taken, the delimiter counted, leading blanks not
};

/// Buffered reading of the bytes of a .wv file, with the few lexical steps that the reader and the
/// scan share. The device isn't owned; it is read from its start.
class ByteSource
{
public:
    static constexpr int NoByte = -1;
    static constexpr int MaxTextLength = 1024;

    explicit ByteSource(QIODevice &device);

    [[nodiscard]] qint64 size() const { return m_size; }
    [[nodiscard]] qint64 position() const { return m_bufferStart + m_index; }
    [[nodiscard]] bool hasFailed() const { return m_failed; }

    /// The next byte, or NoByte at the end of the file or on a read error.
    [[nodiscard]] int next()
    {
        return m_index < m_fill || fill() ? static_cast<unsigned char>(m_buffer[m_index++])
                                          : NoByte;
    }

    /// The next bytes as far as they are at hand; may be empty before the end of the file.
    [[nodiscard]] std::span<const char> buffered() const
    {
        return {m_buffer.constData() + m_index, static_cast<size_t>(m_fill - m_index)};
    }

    /// Steps over the first `count` of the buffered bytes.
    void take(size_t count) { m_index += static_cast<int>(count); }

    /// Moves to a byte position, which is held within the file.
    [[nodiscard]] bool seek(qint64 position);

    /// Reads up to target.size() bytes; fewer come only at the end of the file or on an error.
    [[nodiscard]] size_t read(std::span<std::byte> target);

    /// Skips bytes up to and including `mark`; false if the file ends before.
    [[nodiscard]] bool skipPast(char mark);

    /// Skips blanks, then collects up to the delimiter, a closing brace, the end of the file, or a
    /// byte that is no text; that byte is taken too. Logs and returns false if the text passes
    /// MaxTextLength; false too if the device has failed.
    [[nodiscard]] bool readText(char delimiter, TagText &result, int maxLength = MaxTextLength);

private:
    [[nodiscard]] bool fill();

    QIODevice &m_device;
    QByteArray m_buffer;
    qint64 m_size = 0;
    qint64 m_bufferStart = 0; ///< file position of the buffer's first byte
    int m_index = 0;
    int m_fill = 0;
    bool m_failed = false;
};
