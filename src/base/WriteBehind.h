// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "SideWorker.h"

#include <QByteArray>

#include <functional>
#include <span>

/// Writes what comes in pieces in larger blocks, each on a thread of its own while the caller waits
/// for the next pieces: a peer that is asked piece by piece must not wait for the disk. Belongs to
/// one thread.
class WriteBehind
{
public:
    using Sink = std::function<bool(std::span<const char>)>;

    /// `write` puts a block behind those before and tells whether that worked. It is called on
    /// another thread, one call at a time, and must stay valid until finish() or the end of the
    /// object. `blockBytes` go to it at once; no piece is larger than `pieceBytes`.
    WriteBehind(Sink write, qint64 blockBytes, qint64 pieceBytes);

    /// Room for the next piece; valid until add().
    [[nodiscard]] char *room() { return m_filling.data() + m_pending; }

    /// Takes the first `count` bytes of room(). False once a block couldn't be written.
    [[nodiscard]] bool add(qint64 count);

    /// Returns when all is written; false if that failed.
    [[nodiscard]] bool finish();

private:
    void handOver();

    Sink m_write;
    qint64 m_blockBytes;
    QByteArray m_filling;
    QByteArray m_writing;
    qint64 m_pending = 0; ///< bytes at the front of m_filling
    bool m_isGood = true; ///< the worker's while it works, read after its end
    SideWorker m_worker;  // last: it uses the others
};
