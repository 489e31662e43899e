// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "FileAccess.h"

class BufferedIO;

/// Header of a RIFF WAVE file with I on the left and Q on the right channel.
struct WavHeader
{
    bool valid = false; ///< all tests passed and both chunks were found
    qint16 formatTag = 0;
    qint16 channels = 0;
    qint32 sampleRate = 0; ///< samples per second
    qint32 byteRate = 0;   ///< as stored
    qint16 blockAlignment = 0;
    qint16 bitsPerSample = 0;
    qint64 dataPosition = 0; ///< file offset of the samples
    quint32 dataLength = 0;  ///< bytes, as stored

    [[nodiscard]] qint64 samples() const { return dataLength / 4; }

    /// Play time in s; 0 for a sample rate that isn't above 0.
    [[nodiscard]] double playTime() const;
};

/// Reads stereo 16-bit PCM WAVE files into sample streams.
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
    void logUnknownChunk(const QByteArray &id, quint32 length) const;

    WavHeader m_header;
};
