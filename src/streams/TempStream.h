// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "BufferedIO.h"

#include "base/freespace.h"

#include <QTemporaryFile>

/// A temporary file and the stream over it. Jobs hold their streams by value, so that the file and
/// its space are gone on every way out.
class TempStream
{
public:
    /// `bufferSize` as for BufferedIO.
    explicit TempStream(int bufferSize = BufferedIO::BufferSize)
        : m_stream(bufferSize)
    {
    }

    /// Creates the file and its buffers for reading and writing. False if either fails, without a
    /// message: the caller says what the stream was meant for.
    [[nodiscard]] bool open() { return m_stream.initBuf(&m_file, BufferedIO::ReadWrite); }

    /// As open(), for a data stream of so many samples; false, with the reason logged, too where
    /// the temporary folder has no room for them.
    [[nodiscard]] bool openFor(qint64 samples)
    {
        return hasTemporaryRoomFor(BufferedIO::HeaderSize + samples * BufferedIO::RecordSize) &&
               open();
    }

    [[nodiscard]] BufferedIO *stream() { return &m_stream; }
    BufferedIO *operator->() { return &m_stream; }

private:
    QTemporaryFile m_file;
    BufferedIO m_stream; // destroyed before its file
};
