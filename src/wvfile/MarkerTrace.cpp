// SPDX-License-Identifier: Apache-2.0
#include "MarkerTrace.h"

#include "BufferedIO.h"
#include "ByteSource.h"

#include "base/ProgressClock.h"
#include "log/Tracer.h"

#include <algorithm>

namespace {

constexpr qint64 blockSize = 256 * 1024;

/// A file can repeat its lists at will; each costs a pass over the stream. This many passes over
/// the longest possible stream are far beyond any honest file and still proportional to its size.
constexpr qint64 maxPasses = 64;

} // namespace

MarkerTrace::MarkerTrace(BufferedIO &stream, qint64 fileLimit, ProgressClock &progress)
    : m_stream(stream)
    , m_progress(progress)
    , m_fileLimit(fileLimit)
    , m_workLeft(maxPasses * std::max<qint64>(fileLimit, BufferedIO::BufferSize / maxPasses))
{
    m_cutAt.fill(-1);
}

bool MarkerTrace::spendWork(qint64 bytes)
{
    m_workLeft -= bytes;
    if (m_progress.shouldStop(0)) {
        return Tracer::fail("Action aborted by user.");
    }
    return m_workLeft >= 0 ||
           Tracer::fail(
               "Too many MARKER LIST tags: their positions exceed what a file of this size can "
               "hold.");
}

bool MarkerTrace::mergeList(ByteSource &source, const QString &name)
{
    bool isNumber = false;
    const int marker = name.section("LIST", 1, 1).simplified().toInt(&isNumber);
    if (!isNumber || marker < 1 || marker > MarkerCount) {
        return Tracer::fail("Invalid MARKER LIST tag. Index range is 1-4.");
    }
    // A restart reads the stream's first block again.
    if (!spendWork(std::min<qint64>(m_written, BufferedIO::BufferSize))) {
        return false;
    }
    if (!m_stream.restartAtBegining()) {
        return Tracer::fail("Restarting marker data stream failed.");
    }
    List list;
    list.name = name;
    list.bit = static_cast<quint8>(1U << (marker - 1));
    TagText token;
    do {
        if (!source.readText(';', token)) {
            return Tracer::fail("Error in MARKER LIST tag.");
        }
        if (token.text.isEmpty()) {
            break;
        }
        if (!applyTransition(list, token.text)) {
            return false;
        }
    } while (!token.endedOnBrace);
    return completeList(list);
}

bool MarkerTrace::applyTransition(List &list, const QString &token)
{
    const auto failWithToken = [&](const char *reason) {
        Tracer::Trace(Tracer::Error, reason);
        return Tracer::fail("'" + list.name + "' -> '" + token + "'");
    };
    if (!token.contains(':')) {
        return failWithToken("Unsupported MARKER LIST format. Use transition format.");
    }
    bool isPosition = false;
    bool isState = false;
    const qint64 position = token.section(':', 0, 0).simplified().toLongLong(&isPosition);
    const int state = token.section(':', 1, 1).simplified().toInt(&isState);
    if (!isPosition || !isState) {
        return failWithToken("Invalid MARKER LIST tag data.");
    }
    const quint8 next = state == 1 ? list.bit : quint8(0);
    if (!positionIsValid(list, position, next)) {
        return false;
    }
    if (position == list.pos - 1) {
        // The same position once more, with the same state: the byte handled last goes out again
        // at the next position.
        if (!spendWork(1) || !appendRun(list.pos, 1, list.byte)) {
            return false;
        }
        ++list.pos;
    } else {
        if (!walkTo(list, position)) {
            return false;
        }
        list.current = next;
        list.byte |= next;
        if (!appendRun(position, 1, list.byte)) {
            return false;
        }
        list.pos = position + 1;
    }
    if (list.pos > m_written) {
        m_written = list.pos;
        m_lastByte = list.byte;
    }
    return true;
}

bool MarkerTrace::positionIsValid(const List &list, qint64 position, quint8 state) const
{
    if (position < 0) {
        return Tracer::fail("Marker position cannot be zero.");
    }
    if (position < list.pos - 1) {
        Tracer::Trace(Tracer::Error, "Marker positions seem to go backwards.");
        return Tracer::fail(QString(" old pos. = %1, new pos. = %2").arg(list.pos).arg(position));
    }
    if (position > m_fileLimit) {
        return Tracer::fail(" Marker position value is too large.");
    }
    if (position == list.pos - 1 && state != list.current) {
        Tracer::Trace(Tracer::Error, " Same Marker position used with two states.");
        return Tracer::fail(QString(" pos. = %1").arg(position));
    }
    return true;
}

/// Handles all positions before `position` and fetches the old byte of `position` itself.
bool MarkerTrace::walkTo(List &list, qint64 position)
{
    if (!spendWork(position - list.pos + 1)) {
        return false;
    }
    const qint64 rewriteEnd = std::clamp(m_written, list.pos, position);
    if (!rewriteRun(list.pos, rewriteEnd, list.current, Run::Walk, position)) {
        return false;
    }
    if (rewriteEnd < position) {
        noteCutByExtension(list);
        const auto carried = static_cast<quint8>((m_lastByte & ~list.bit) | list.current);
        if (!appendRun(rewriteEnd, position - rewriteEnd, carried)) {
            return false;
        }
    }
    return takeOldByte(list, position, list.byte);
}

bool MarkerTrace::takeOldByte(const List &list, qint64 position, quint8 &byte)
{
    if (position >= m_written) {
        byte = static_cast<quint8>(m_lastByte & ~list.bit);
        return true;
    }
    return m_stream.readBytes(1, &byte) || failToRead(position, position);
}

bool MarkerTrace::failToRead(qint64 position, qint64 target) const
{
    Tracer::Trace(Tracer::Error,
                  QString(" Cannot read from marker file at position %1").arg(position));
    Tracer::Trace(Tracer::Error, QString("       Previously written bytes: %1").arg(m_written));
    return Tracer::fail(QString("       Target position: %1").arg(target));
}

/// A list that appends with its marker low clears what an earlier list of the same marker left
/// high.
void MarkerTrace::noteCutByExtension(const List &list)
{
    if ((m_lastByte & list.bit) != 0 && list.current == 0) {
        m_cutAt[static_cast<size_t>(qCountTrailingZeroBits(list.bit))] = m_written;
    }
}

bool MarkerTrace::completeList(List &list)
{
    const bool debug = Tracer::isEnabled(Tracer::Debug);
    if (debug) {
        Tracer::Trace(Tracer::Debug, QString("Marker section finished with value 0x%1 at pos. %2")
                                         .arg(list.byte, 0, 16)
                                         .arg(list.pos));
    }
    if (list.pos < m_written) {
        if (debug && list.current != 0) {
            Tracer::Trace(Tracer::Debug,
                          QString("Completing marker trace up to pos. %1").arg(m_written));
        }
        if (!spendWork(m_written - list.pos) ||
            !rewriteRun(list.pos, m_written, list.current,
                        list.current != 0 ? Run::HighCompletion : Run::LowCompletion, m_written)) {
            return false;
        }
    }
    const auto marker = static_cast<size_t>(qCountTrailingZeroBits(list.bit));
    if (list.current != 0) {
        m_cutAt[marker] = (m_lastByte & list.bit) == 0 ? m_written : -1;
    }
    return true;
}

bool MarkerTrace::rewriteRun(qint64 begin, qint64 end, quint8 mask, Run run, qint64 target)
{
    m_block.resize(static_cast<size_t>(std::min(std::max<qint64>(end - begin, 1), blockSize)));
    for (qint64 pos = begin; pos < end;) {
        if (m_progress.shouldStop(0)) {
            return Tracer::fail("Action aborted by user.");
        }
        const int wanted = static_cast<int>(std::min(end - pos, blockSize));
        const int got = m_stream.readBlock(wanted, m_block.data());
        if (got < wanted) {
            const qint64 position = pos + std::max(got, 0);
            switch (run) {
            case Run::Walk:
                return failToRead(position, target);
            case Run::HighCompletion:
                return Tracer::fail(
                    QString(" Cannot read from marker file at position %1").arg(position));
            case Run::LowCompletion:
                return Tracer::fail(
                    QString("Reading marker stream failed at position %1").arg(position));
            }
        }
        for (int i = 0; i < got; ++i) {
            m_block[static_cast<size_t>(i)] |= mask;
        }
        if (!m_stream.writeBytes(got, m_block.data())) {
            return Tracer::fail((run == Run::LowCompletion
                                     ? QString("Writing marker stream failed at position %1")
                                     : QString(" Cannot write to marker file at position %1"))
                                    .arg(pos));
        }
        pos += got;
    }
    return true;
}

bool MarkerTrace::appendRun(qint64 begin, qint64 count, quint8 byte)
{
    m_block.assign(static_cast<size_t>(std::min(count, blockSize)), byte);
    for (qint64 done = 0; done < count;) {
        const int size = static_cast<int>(std::min(count - done, blockSize));
        if (!m_stream.writeBytes(size, m_block.data())) {
            return Tracer::fail(
                QString(" Cannot write to marker file at position %1").arg(begin + done));
        }
        done += size;
    }
    return true;
}

bool MarkerTrace::extendTo(qint64 length)
{
    if (m_written >= length) {
        return true;
    }
    const qint64 missing = length - m_written;
    m_block.assign(static_cast<size_t>(std::min(missing, blockSize)), m_lastByte);
    while (m_written < length) {
        const int size = static_cast<int>(std::min(length - m_written, blockSize));
        if (!m_stream.writeBytes(size, m_block.data())) {
            return Tracer::fail(
                QString("Writing marker stream failed at position %1").arg(m_written));
        }
        m_written += size;
    }
    return true;
}

bool MarkerTrace::pad(qint64 count)
{
    if (count <= 0) {
        return true;
    }
    m_block.assign(static_cast<size_t>(std::min(count, blockSize)), m_lastByte);
    for (qint64 done = 0; done < count;) {
        const int size = static_cast<int>(std::min(count - done, blockSize));
        if (!m_stream.writeBytes(size, m_block.data())) {
            return Tracer::fail("Cannot write to marker file!");
        }
        done += size;
    }
    return true;
}

void MarkerTrace::warnAboutCuts(qint64 samples) const
{
    for (size_t marker = 0; marker < m_cutAt.size(); ++marker) {
        const qint64 position = m_cutAt[marker];
        if (position >= 0 && position < samples) {
            Tracer::Trace(Tracer::Warning,
                          QString("The list of marker %1 ends high, but the marker "
                                  "falls at position %2, where the other lists end.")
                              .arg(marker + 1)
                              .arg(position));
        }
    }
}
