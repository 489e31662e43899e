// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "streams/TempStream.h"
#include "support/logreader.h"
#include "support/seed.h"

#include <QIODevice>

#include <algorithm>
#include <complex>
#include <cstring>
#include <limits>
#include <vector>

using Samples = std::vector<std::complex<float>>;

[[nodiscard]] inline bool writeStream(BufferedIO &stream, const Samples &samples)
{
    return stream.writeHeader("IQF") &&
           stream.writeBytes(static_cast<int>(samples.size() * 8), samples.data()) &&
           stream.restartAtBegining();
}

/// The samples behind the header; empty if it isn't there.
[[nodiscard]] inline Samples readStream(BufferedIO &stream)
{
    if (!stream.checkHeader("IQF")) {
        return {};
    }
    Samples samples(static_cast<size_t>((stream.deviceSize() - 3) / 8));
    const int bytes = static_cast<int>(samples.size() * 8);
    return stream.readBlock(bytes, samples.data()) == bytes ? samples : Samples{};
}

/// The 16-bit word of a file for a sample of a stream.
[[nodiscard]] inline int fileWord(float value)
{
    return static_cast<int>(value * 32767.0F + 0.5F);
}

/// Stands for a file of any length without one: holds "IQF" and zeros, and swallows what is
/// written until `capacity` bytes, where the disk is full.
class EndlessDevice : public QIODevice
{
public:
    explicit EndlessDevice(qint64 capacity = std::numeric_limits<qint64>::max())
        : m_capacity(capacity)
    {
    }

    [[nodiscard]] qint64 size() const override { return std::numeric_limits<qint64>::max() / 2; }

protected:
    qint64 readData(char *data, qint64 maxSize) override
    {
        std::memset(data, 0, static_cast<size_t>(maxSize));
        if (pos() == 0) {
            std::memcpy(data, "IQF", static_cast<size_t>(std::min<qint64>(maxSize, 3)));
        }
        return maxSize;
    }

    qint64 writeData(const char *, qint64 maxSize) override
    {
        return std::min(maxSize, std::max<qint64>(m_capacity - pos(), 0));
    }

private:
    qint64 m_capacity;
};
