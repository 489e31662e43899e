// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <QtEndian>

#include <zlib.h>

#include <array>
#include <functional>
#include <vector>

class QIODevice;

/// Bytes of a MATLAB file in the order in which they stand: those of the file itself, or those that
/// a compressed element of it holds.
class MatSource
{
public:
    virtual ~MatSource() = default;
    MatSource() = default;
    MatSource(const MatSource &) = delete;
    MatSource &operator=(const MatSource &) = delete;

    /// Reads as many bytes as there are, `size` at most.
    [[nodiscard]] virtual qint64 read(char *bytes, qint64 size) = 0;

    /// Moves on to a position, to their end and with the result false if the bytes end before it.
    /// Inflated bytes can't be gone back to.
    [[nodiscard]] virtual bool seek(qint64 position) = 0;

    [[nodiscard]] virtual qint64 position() const = 0;

    /// Reads a number, least significant byte first unless told otherwise.
    template <typename T>
    [[nodiscard]] bool readNumber(T &value)
    {
        std::array<char, sizeof(T)> bytes{};
        if (read(bytes.data(), sizeof(T)) < qint64(sizeof(T))) {
            return false;
        }
        value = m_bigEndian ? qFromBigEndian<T>(bytes.data()) : qFromLittleEndian<T>(bytes.data());
        return true;
    }

    void setBigEndian(bool bigEndian) { m_bigEndian = bigEndian; }

private:
    bool m_bigEndian = false;
};

/// The bytes of the file.
class MatFileSource : public MatSource
{
public:
    explicit MatFileSource(QIODevice &device);

    [[nodiscard]] qint64 read(char *bytes, qint64 size) override;
    [[nodiscard]] bool seek(qint64 position) override;
    [[nodiscard]] qint64 position() const override;

private:
    QIODevice &m_device;
};

/// The bytes of a compressed element, inflated block by block as they are asked for: nothing of
/// them is stored.
class InflateSource : public MatSource
{
public:
    /// Inflates the next `size` bytes of the device. `shouldStop` is asked before each block.
    InflateSource(QIODevice &device, qint64 size, std::function<bool()> shouldStop);
    ~InflateSource() override;

    [[nodiscard]] qint64 read(char *bytes, qint64 size) override;
    [[nodiscard]] bool seek(qint64 position) override;
    [[nodiscard]] qint64 position() const override { return m_position; }

    /// Sets the most bytes that may come; more of them make reading fail.
    void setBound(qint64 bytes) { m_bound = bytes; }

    /// Inflates what remains, without keeping it.
    [[nodiscard]] bool finish();

    /// Whether reading has failed, for the reason in the log, and not just come to the end.
    [[nodiscard]] bool hasFailed() const { return m_failed; }

private:
    [[nodiscard]] bool feed();
    bool fail();

    QIODevice &m_device;
    qint64 m_missing; ///< compressed bytes not yet read
    std::function<bool()> m_shouldStop;
    std::vector<char> m_input;
    std::vector<char> m_skipped;
    z_stream m_stream{};
    qint64 m_position = 0;
    qint64 m_bound;
    bool m_ended = false;
    bool m_failed = false;
};
