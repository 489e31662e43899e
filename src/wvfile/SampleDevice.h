// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "WvTypes.h"

#include <QFile>
#include <QIODevice>

#include <vector>

/// The samples of a waveform file as the content of a data stream, decoded as they are read: the
/// text "IQF", then a record of eight bytes a sample. Any position can be read at once, and nothing
/// is unpacked to the disk.
class SampleDevice : public QIODevice
{
public:
    using QIODevice::QIODevice;

    /// Takes the samples of a file that was read into `info`. False, with the reason logged, if it
    /// can't be opened.
    [[nodiscard]] bool setSource(const WvFileInfo &info);

    [[nodiscard]] qint64 size() const override;

protected:
    qint64 readData(char *data, qint64 maxSize) override;
    qint64 writeData(const char *data, qint64 size) override;

private:
    [[nodiscard]] bool decode(qint64 first, qint64 count);

    QFile m_file;
    SampleCoding m_coding = SampleCoding::A;
    float m_gain = 1;
    qint64 m_blockStart = 0; ///< byte of the file
    qint64 m_samples = 0;
    std::vector<std::byte> m_words;
    std::vector<float> m_values;
};
