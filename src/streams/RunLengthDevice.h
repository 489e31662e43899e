// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <QIODevice>
#include <QTemporaryFile>

#include <array>
#include <span>
#include <vector>

/// Bytes of which long stretches are equal, such as marker traces, as a device of any position. A
/// stretch costs four bytes of memory; only pages with very many changes go to a temporary file,
/// so that the markers of the longest waveforms take no room on the disk.
class RunLengthDevice : public QIODevice
{
public:
    using QIODevice::QIODevice;

    [[nodiscard]] qint64 size() const override { return m_size; }

    /// Makes the device end at `length`; what it lacks is filled with its last byte, or with 0.
    void extendTo(qint64 length);

protected:
    qint64 readData(char *data, qint64 maxSize) override;
    qint64 writeData(const char *data, qint64 size) override;

private:
    static constexpr qint64 PageBytes = 64 * 1024;

    struct Run
    {
        quint16 last = 0; ///< position of its last byte in the page
        quint8 byte = 0;
    };
    struct Page
    {
        std::vector<Run> runs; ///< none: all bytes are `filler`
        quint8 filler = 0;
        bool isOnDisk = false;
    };
    using PageContent = std::array<char, PageBytes>;

    [[nodiscard]] bool load(const Page &page, qint64 index);
    [[nodiscard]] bool store(Page &page, qint64 index, std::span<const char> bytes);

    std::vector<Page> m_pages;
    qint64 m_size = 0;
    PageContent m_content{};
    QTemporaryFile m_file;
};
