// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <QtGlobal>

#include <vector>

class BufferedIO;
class ProgressClock;

/// The marker bytes of one file while its lists are merged: a read side and a write side that both
/// go through the bytes once per pass, as those of a stream do.
///
/// The bytes are held as runs of equal ones, which costs little even for very long waveforms. When
/// the runs become too many they move to the marker stream, where each pass reads and rewrites all
/// bytes. Either way the read side of a pass sees what the pass before it wrote.
class MarkerStore
{
public:
    enum class Result { Done, CannotRead, CannotWrite, Cancelled };

    /// The stream isn't owned and has been restarted; `progress` says when to stop.
    MarkerStore(BufferedIO &stream, ProgressClock &progress);

    /// Begins a pass: both sides go to the start. False when the stream can't be restarted.
    [[nodiscard]] bool restart();

    /// Reads `count` bytes and writes them with `mask` ORed in.
    [[nodiscard]] Result copy(qint64 count, quint8 mask);

    /// Reads one byte.
    [[nodiscard]] Result read(quint8 &byte);

    /// Writes `count` times the same byte.
    [[nodiscard]] Result write(qint64 count, quint8 byte);

    /// Ends the last pass: the stream holds all bytes, and its write side stands behind them.
    [[nodiscard]] Result finish();

    /// Position of the write side at the failure of the last call.
    [[nodiscard]] qint64 failedAt() const { return m_failedAt; }

    /// What the begin of a pass costs, in steps of about one byte of a stream.
    [[nodiscard]] qint64 passCost() const;

private:
    /// Bytes of one value, packed: long lists make many.
    class Run
    {
    public:
        Run(qint64 end, quint8 byte)
            : m_packed(static_cast<quint64>(end) << 8 | byte)
        {
        }

        /// Position behind the run.
        [[nodiscard]] qint64 end() const { return static_cast<qint64>(m_packed >> 8); }

        [[nodiscard]] quint8 byte() const { return static_cast<quint8>(m_packed); }

    private:
        quint64 m_packed;
    };
    using Runs = std::vector<Run>;

    void append(qint64 count, quint8 byte);
    [[nodiscard]] Result moveToStream();
    [[nodiscard]] Result copyInStream(qint64 count, quint8 mask);
    [[nodiscard]] Result writeToStream(qint64 position, qint64 count, quint8 byte);
    [[nodiscard]] Result failed(Result reason, qint64 position);
    [[nodiscard]] Result writeRuns(const Runs &runs);

    BufferedIO &m_stream;
    ProgressClock &m_progress;
    bool m_inStream = false;
    Runs m_old;           ///< what the pass before wrote
    Runs m_new;           ///< what this pass has written
    size_t m_readRun = 0; ///< run of m_old that the read side stands in
    qint64 m_readPos = 0;
    qint64 m_writePos = 0;
    qint64 m_failedAt = 0;
    std::vector<quint8> m_block;
};
