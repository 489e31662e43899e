// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <QByteArray>
#include <QDeadlineTimer>
#include <QIODevice>

#include <algorithm>
#include <cstring>

/// A file in memory that counts what goes through it and fails where it is told to.
class TestDevice : public QIODevice
{
public:
    QByteArray bytes;
    qint64 bytesRead = 0;
    qint64 bytesWritten = 0;
    qint64 capacity = -1;       ///< writes end here, as on a full disk; -1: no limit
    qint64 unreadableFrom = -1; ///< reads that begin here or later fail; -1: none
    int slowMs = 0;             ///< time that each transfer takes at least
    bool canOpen = true;
    bool canSeek = true;

    bool open(OpenMode mode) override { return canOpen && QIODevice::open(mode); }
    bool seek(qint64 position) override { return canSeek && QIODevice::seek(position); }
    [[nodiscard]] qint64 size() const override { return bytes.size(); }

protected:
    qint64 readData(char *data, qint64 length) override
    {
        letTimePass();
        if (unreadableFrom >= 0 && pos() >= unreadableFrom) {
            return -1;
        }
        const qint64 count = std::clamp<qint64>(bytes.size() - pos(), 0, length);
        if (count > 0) {
            std::memcpy(data, bytes.constData() + pos(), static_cast<size_t>(count));
        }
        bytesRead += count;
        return count;
    }

    qint64 writeData(const char *data, qint64 length) override
    {
        letTimePass();
        const qint64 count =
            capacity < 0 ? length : std::clamp<qint64>(capacity - pos(), 0, length);
        if (bytes.size() < pos() + count) {
            bytes.resize(pos() + count);
        }
        std::memcpy(bytes.data() + pos(), data, static_cast<size_t>(count));
        bytesWritten += count;
        return count;
    }

private:
    void letTimePass() const
    {
        const QDeadlineTimer end(slowMs);
        while (slowMs > 0 && !end.hasExpired()) {
        }
    }
};
