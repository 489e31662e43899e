// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <QByteArray>
#include <QIODevice>

#include <algorithm>
#include <cstdint>
#include <cstdlib>
#include <cstring>

/// A file in memory. One that grows past its limit ends the run as a crash: no input of a few
/// kilobytes may fill a disk.
class MemoryDevice : public QIODevice
{
public:
    static constexpr qint64 Limit = 64 * 1024 * 1024;

    QByteArray bytes;

    MemoryDevice() = default;

    /// A file of a run's input, open for reading.
    MemoryDevice(const std::uint8_t *data, std::size_t length)
        : bytes(reinterpret_cast<const char *>(data), static_cast<qsizetype>(length))
    {
        (void)QIODevice::open(QIODevice::ReadOnly);
    }

    [[nodiscard]] qint64 size() const override { return bytes.size(); }

protected:
    qint64 readData(char *data, qint64 length) override
    {
        const qint64 count = std::clamp<qint64>(bytes.size() - pos(), 0, length);
        if (count > 0) {
            std::memcpy(data, bytes.constData() + pos(), static_cast<size_t>(count));
        }
        return count;
    }

    qint64 writeData(const char *data, qint64 length) override
    {
        if (pos() + length > Limit) {
            std::abort();
        }
        bytes.resize(std::max<qint64>(bytes.size(), pos() + length));
        std::memcpy(bytes.data() + pos(), data, static_cast<size_t>(length));
        return length;
    }
};
