// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "ReadControl.h"
#include "sigmfmetadata.h"
#include "wvfile/SampleCoding.h"

#include <QFile>

class BufferedIO;

/// Reads a SigMF recording into sample streams: two files beside each other, or an archive of them.
class SigmfFileAccess : public ReadControl
{
    Q_OBJECT

public:
    explicit SigmfFileAccess(QObject *parent = nullptr);

    /// Opens a recording by its metadata (.sigmf-meta), its data (.sigmf-data) or as an archive
    /// (.sigmf), and reads the metadata. False, with the reason logged, if that fails.
    [[nodiscard]] bool open(const QString &fileName);

    [[nodiscard]] const SigmfMetadata &metadata() const { return m_metadata; }

    /// Samples of each channel that the data hold.
    [[nodiscard]] qint64 samples() const { return m_samples; }

    /// Writes "IQF" and the samples of a channel, counted from 1, at most `limit` if that is above
    /// 0, into the stream. Words of 16 bits are taken as those of a waveform file stand; other
    /// integers have a full scale of 1.
    [[nodiscard]] bool readSamples(BufferedIO &stream, int channel, qint64 limit);

    /// Values among those read that no word of a waveform file can hold.
    [[nodiscard]] const ClipCount &clipped() const { return m_clipped; }

    /// Writes a marker byte for each of so many samples into the stream.
    [[nodiscard]] bool writeMarkers(BufferedIO &stream, qint64 samples) const;

private:
    [[nodiscard]] bool openArchive(const QString &fileName);
    [[nodiscard]] bool openPair(const QString &fileName);
    [[nodiscard]] bool readMetadata(QIODevice &device, qint64 size);
    [[nodiscard]] bool locateSamples();
    [[nodiscard]] qint64 frameBytes() const;
    void checkHash(const QByteArray &hash) const;

    QFile m_file;
    SigmfMetadata m_metadata;
    qint64 m_dataStart = 0; ///< byte of the file
    qint64 m_dataBytes = 0;
    qint64 m_samples = 0;
    ClipCount m_clipped;
};
