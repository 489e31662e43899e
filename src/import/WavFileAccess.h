// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <QFile>
#include <QObject>
#include <QString>

#include <atomic>

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

/// Reads stereo 16-bit PCM WAVE files into sample streams. One file at a time; calls are
/// synchronous and let the event loop run every 100 ms.
class WavFileAccess : public QObject
{
    Q_OBJECT

public:
    explicit WavFileAccess(QObject *parent = nullptr);

    /// Closes an open file, then opens this one, with an empty name the one before, for reading.
    /// Only regular files are opened.
    [[nodiscard]] bool open(const QString &fileName);
    void close();

    /// Checks the open file and fills the header. False with the reason logged if a test fails; a
    /// file that lacks a chunk gives true with a header that isn't valid.
    [[nodiscard]] bool readHeader();

    [[nodiscard]] const WavHeader &header() const { return m_header; }

    /// Writes "IQF" and the samples, at most `limit` if that is above 0, into the stream.
    [[nodiscard]] bool readSamples(BufferedIO *stream, qint64 limit);

public slots:
    void cancel();

signals:
    void ProgressUpdate(int iPercentage);

private:
    [[nodiscard]] bool checkHeader();
    [[nodiscard]] bool checkFormatChunk(quint32 length);
    void logUnknownChunk(const QByteArray &id, quint32 length) const;

    QFile m_file;
    WavHeader m_header;
    std::atomic<bool> m_cancelled{false};
};
