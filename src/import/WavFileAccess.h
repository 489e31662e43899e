// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "FileAccess.h"

class BufferedIO;

/// Header of a WAVE file with I on the left or the only channel, and Q on the right one.
struct WavHeader
{
    bool valid = false;    ///< all tests passed and both chunks were found
    quint16 formatTag = 0; ///< as stored; that of the sub-format in an extensible header
    bool isFloat = false;
    qint16 channels = 0;
    qint32 sampleRate = 0; ///< samples per second
    qint32 byteRate = 0;   ///< as stored
    qint16 blockAlignment = 0;
    qint16 bitsPerSample = 0;
    qint64 dataPosition = 0; ///< file offset of the samples
    qint64 dataLength = 0;   ///< bytes, as stored

    [[nodiscard]] qint64 samples() const
    {
        return blockAlignment > 0 ? dataLength / blockAlignment : 0;
    }

    /// Play time in s; 0 for a sample rate that isn't above 0.
    [[nodiscard]] double playTime() const;
};

/// Reads WAVE files of one or two channels into sample streams: PCM of 8, 16, 24 or 32 bits and
/// 32-bit float, with plain and extensible headers, as RIFF or RF64 (EBU Tech 3306).
class WavFileAccess : public FileAccess
{
    Q_OBJECT

public:
    explicit WavFileAccess(QObject *parent = nullptr);

    /// Checks the open file and fills the header. False with the reason logged if a test fails; a
    /// file that lacks a chunk gives true with a header that isn't valid.
    [[nodiscard]] bool readHeader();

    [[nodiscard]] const WavHeader &header() const { return m_header; }

    /// Writes "IQF" and the samples, at most `limit` if that is above 0, into the stream.
    [[nodiscard]] bool readSamples(BufferedIO *stream, qint64 limit);

protected:
    void forget() override;

private:
    [[nodiscard]] bool checkHeader();
    [[nodiscard]] bool checkFormatChunk(quint32 length);
    [[nodiscard]] bool readSubFormat();
    [[nodiscard]] qint64 longDataLength();
    void logUnknownChunk(const QByteArray &id, quint32 length) const;

    WavHeader m_header;
    qint64 m_longDataLength = -1; ///< of an RF64 file
};
