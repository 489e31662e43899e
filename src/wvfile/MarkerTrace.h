// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "MarkerStore.h"
#include "WvTypes.h"

#include <QString>
#include <QtGlobal>

#include <array>

class BufferedIO;
class ByteSource;
class ProgressClock;

/// Merges the marker lists of a file into a marker stream, one pass a list.
///
/// Each list ORs its own bit into the bytes that are there already and appends behind them. A list
/// shorter than the ones before it doesn't change the byte that is carried on at the end, so its
/// marker falls there even if it ended high; such a cut is reported by warnAboutCuts.
class MarkerTrace
{
public:
    /// `fileLimit` is the largest position that a list of this file may name. The stream isn't
    /// owned and has been restarted; `progress` says when to stop, and outlives the trace.
    MarkerTrace(BufferedIO &stream, qint64 fileLimit, ProgressClock &progress);

    /// Reads the list of the tag `name` up to its end and merges it. Logs and returns false on
    /// malformed lists, on stream failures and on a cancel.
    [[nodiscard]] bool mergeList(ByteSource &source, const QString &name);

    /// To be called behind the last list: the stream holds what they have made. Logs and returns
    /// false on a stream failure.
    [[nodiscard]] bool finishLists();

    /// Appends the carried byte until `length` bytes stand; false on a stream failure.
    [[nodiscard]] bool extendTo(qint64 length);

    /// Appends `count` carried bytes without counting them; false on a stream failure.
    [[nodiscard]] bool pad(qint64 count);

    /// One warning for each marker that ends high but falls before sample `samples`.
    void warnAboutCuts(qint64 samples) const;

    [[nodiscard]] qint64 written() const { return m_written; }
    [[nodiscard]] quint8 lastByte() const { return m_lastByte; }

private:
    struct List
    {
        QString name;
        quint8 bit = 0;
        qint64 pos = 0;     ///< next position that the list hasn't handled
        quint8 current = 0; ///< the bit, or 0 while the marker is low
        quint8 byte = 0;    ///< the byte handled last
    };

    struct Transition
    {
        qint64 position = 0;
        int state = 0;
        bool endedOnBrace = false;
    };

    /// What a pass over standing bytes belongs to; it decides the words of a failure.
    enum class Part { Walk, HighCompletion, LowCompletion };

    [[nodiscard]] static bool takeTransition(ByteSource &source, Transition &transition);
    [[nodiscard]] bool parseToken(const List &list, const QString &token, Transition &transition);
    [[nodiscard]] bool applyTransition(List &list, const Transition &transition);
    [[nodiscard]] bool positionIsValid(const List &list, qint64 position, quint8 state) const;
    [[nodiscard]] bool walkTo(List &list, qint64 position);
    [[nodiscard]] bool completeList(List &list);
    [[nodiscard]] bool report(MarkerStore::Result result, Part part, qint64 target) const;
    [[nodiscard]] bool spendWork(qint64 bytes);
    void noteCutByExtension(const List &list);

    BufferedIO &m_stream;
    ProgressClock &m_progress;
    MarkerStore m_store;
    qint64 m_fileLimit = 0;
    qint64 m_workLeft = 0; ///< bytes and runs that may still be handled
    qint64 m_written = 0;  ///< bytes that the trace holds
    quint8 m_lastByte = 0; ///< the byte appended last, carried on behind the lists
    std::array<qint64, MarkerCount> m_cutAt;
};
