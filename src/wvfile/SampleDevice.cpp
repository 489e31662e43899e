// SPDX-License-Identifier: Apache-2.0
#include "SampleDevice.h"

#include "SampleCoding.h"

#include "log/Tracer.h"
#include "streams/BufferedIO.h"

#include <algorithm>
#include <cmath>
#include <cstring>

namespace {

constexpr qint64 BlockSamples = 64 * 1024;
constexpr qint64 FileBytesPerSample = 4;

} // namespace

bool SampleDevice::setSource(const WvFileInfo &info)
{
    m_coding = info.coding;
    m_gain = static_cast<float>(std::pow(10.0, info.gainDb / 20));
    m_blockStart = info.blockStart;
    m_samples = info.samples;
    m_file.close();
    m_file.setFileName(info.fileName);
    return m_file.open(QIODevice::ReadOnly | QIODevice::Unbuffered) ||
           Tracer::fail("Cannot open waveform input file.");
}

qint64 SampleDevice::size() const
{
    return BufferedIO::HeaderSize + m_samples * BufferedIO::RecordSize;
}

bool SampleDevice::decode(qint64 first, qint64 count)
{
    m_words.resize(static_cast<size_t>(count * FileBytesPerSample));
    m_values.resize(2 * static_cast<size_t>(count));
    if (!m_file.seek(m_blockStart + first * FileBytesPerSample)) {
        return false;
    }
    const auto wanted = static_cast<qint64>(m_words.size());
    if (m_file.read(reinterpret_cast<char *>(m_words.data()), wanted) != wanted) {
        return false;
    }
    decodeWords(m_coding, m_words, m_gain, m_values);
    return true;
}

qint64 SampleDevice::readData(char *data, qint64 maxSize)
{
    const qint64 begin = pos();
    const qint64 wanted = std::clamp<qint64>(size() - begin, 0, maxSize);
    qint64 done = 0;
    while (done < wanted && begin + done < BufferedIO::HeaderSize) {
        data[done] = BufferedIO::DataHeader[begin + done];
        ++done;
    }
    while (done < wanted) {
        const qint64 position = begin + done - BufferedIO::HeaderSize;
        const qint64 first = position / BufferedIO::RecordSize;
        const qint64 offset = position % BufferedIO::RecordSize;
        const qint64 records =
            (wanted - done + offset + BufferedIO::RecordSize - 1) / BufferedIO::RecordSize;
        const qint64 count = std::min(records, BlockSamples);
        if (!decode(first, count)) {
            setErrorString(m_file.errorString());
            return done > 0 ? done : -1;
        }
        const qint64 bytes = std::min(wanted - done, count * BufferedIO::RecordSize - offset);
        std::memcpy(data + done, reinterpret_cast<const char *>(m_values.data()) + offset,
                    static_cast<size_t>(bytes));
        done += bytes;
    }
    return wanted;
}

qint64 SampleDevice::writeData(const char * /*data*/, qint64 /*size*/)
{
    return -1;
}
