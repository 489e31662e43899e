// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "log/Tracer.h"
#include "streams/TempStream.h"

#include <QIODevice>
#include <QStringList>

#include <algorithm>
#include <cmath>
#include <complex>
#include <cstring>
#include <limits>
#include <random>
#include <vector>

using Samples = std::vector<std::complex<float>>;

/// Samples spread evenly over the unit square, the same for a seed on every machine.
inline Samples randomSamples(int count, unsigned seed = 1)
{
    std::mt19937 generator(seed);
    Samples samples(static_cast<size_t>(count));
    for (std::complex<float> &sample : samples) {
        const auto draw = [&generator] {
            return static_cast<float>(generator()) / 2147483648.0F - 1.0F;
        };
        const float inPhase = draw();
        sample = {inPhase, draw()};
    }
    return samples;
}

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

/// The messages since the last call, without their time stamps, of the levels in the mask.
[[nodiscard]] inline QStringList takeMessages(int levels = Tracer::Error | Tracer::Warning)
{
    QStringList texts;
    for (const Tracer::Entry &entry : Tracer::takeEntries()) {
        if ((entry.second & levels) != 0) {
            texts << entry.first.mid(entry.first.indexOf("  ") + 2);
        }
    }
    return texts;
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
