// SPDX-License-Identifier: Apache-2.0
#include "MarkerTrace.h"

#include "ByteSource.h"
#include "streams/BufferedIO.h"

#include "base/ProgressClock.h"
#include "log/Tracer.h"

#include <algorithm>
#include <charconv>
#include <vector>

namespace {

constexpr qint64 BlockSize = 262'144;

/// A file can repeat its lists at will; each costs a pass over the bytes. This many passes over
/// the longest possible stream are far beyond any honest file and still proportional to its size.
constexpr qint64 MaxPasses = 64;

/// Transitions between two looks at the clock.
constexpr int TransitionsPerTick = 1024;

constexpr const char *AbortText = "Action aborted by user.";

} // namespace

MarkerTrace::MarkerTrace(BufferedIO &stream, qint64 fileLimit, ProgressClock &progress)
    : m_stream(stream)
    , m_progress(progress)
    , m_store(stream, progress)
    , m_fileLimit(fileLimit)
    , m_workLeft(MaxPasses * std::max<qint64>(fileLimit, BufferedIO::BufferSize / MaxPasses))
{
    m_cutAt.fill(-1);
}

bool MarkerTrace::spendWork(qint64 bytes)
{
    m_workLeft -= bytes;
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
    if (!spendWork(m_store.passCost())) {
        return false;
    }
    if (!m_store.restart()) {
        return Tracer::fail("Restarting marker data stream failed.");
    }
    List list;
    list.name = name;
    list.bit = static_cast<quint8>(1U << (marker - 1));
    Transition transition;
    TagText token;
    for (int count = 1; !transition.endedOnBrace; ++count) {
        if (count % TransitionsPerTick == 0 && m_progress.shouldStop(0)) {
            return Tracer::fail(AbortText);
        }
        if (!takeTransition(source, transition)) {
            if (!source.readText(';', token)) {
                return Tracer::fail("Error in MARKER LIST tag.");
            }
            if (token.text.isEmpty()) {
                break;
            }
            if (!parseToken(list, token.text, transition)) {
                return false;
            }
            transition.endedOnBrace = token.endedOnBrace;
        }
        if (!applyTransition(list, transition)) {
            return false;
        }
    }
    return completeList(list);
}

/// Takes a transition in its plain form, "12:1;" or "12:1}", straight from the buffer; that is what
/// long lists consist of. False, and nothing taken, for whatever else stands there.
bool MarkerTrace::takeTransition(ByteSource &source, Transition &transition)
{
    const std::span<const char> bytes = source.buffered();
    const char *const end = bytes.data() + bytes.size();
    const auto number = [end](const char *begin, auto &value) -> const char * {
        // A sign is left to the general form.
        if (begin == end || *begin < '0' || *begin > '9') {
            return nullptr;
        }
        const auto [behind, error] = std::from_chars(begin, end, value);
        return error == std::errc() && behind != end ? behind : nullptr;
    };
    const char *at = bytes.data();
    while (at != end && *at == ' ') {
        ++at;
    }
    at = number(at, transition.position);
    if (at == nullptr || *at != ':') {
        return false;
    }
    at = number(at + 1, transition.state);
    if (at == nullptr || (*at != ';' && *at != '}')) {
        return false;
    }
    transition.endedOnBrace = *at == '}';
    source.take(static_cast<size_t>(at + 1 - bytes.data()));
    return true;
}

bool MarkerTrace::parseToken(const List &list, const QString &token, Transition &transition)
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
    transition.position = token.section(':', 0, 0).simplified().toLongLong(&isPosition);
    transition.state = token.section(':', 1, 1).simplified().toInt(&isState);
    return (isPosition && isState) || failWithToken("Invalid MARKER LIST tag data.");
}

bool MarkerTrace::applyTransition(List &list, const Transition &transition)
{
    const qint64 position = transition.position;
    const quint8 next = transition.state == 1 ? list.bit : quint8(0);
    if (!positionIsValid(list, position, next)) {
        return false;
    }
    if (position == list.pos - 1) {
        // The same position once more, with the same state: the byte handled last goes out again
        // at the next position.
        if (!spendWork(1)) {
            return false;
        }
    } else {
        if (!walkTo(list, position)) {
            return false;
        }
        list.current = next;
        list.byte |= next;
        list.pos = position;
    }
    if (!report(m_store.write(1, list.byte), Part::Walk, position)) {
        return false;
    }
    ++list.pos;
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
    if (!report(m_store.copy(rewriteEnd - list.pos, list.current), Part::Walk, position)) {
        return false;
    }
    const auto carried = static_cast<quint8>(m_lastByte & ~list.bit);
    if (rewriteEnd < position) {
        noteCutByExtension(list);
        if (!report(m_store.write(position - rewriteEnd, carried | list.current), Part::Walk,
                    position)) {
            return false;
        }
    }
    list.byte = carried;
    return position >= m_written || report(m_store.read(list.byte), Part::Walk, position);
}

bool MarkerTrace::report(MarkerStore::Result result, Part part, qint64 target) const
{
    const qint64 position = m_store.failedAt();
    switch (result) {
    case MarkerStore::Result::Done:
        return true;
    case MarkerStore::Result::Cancelled:
        return Tracer::fail(AbortText);
    case MarkerStore::Result::CannotWrite:
        return Tracer::fail((part == Part::LowCompletion
                                 ? QString("Writing marker stream failed at position %1")
                                 : QString(" Cannot write to marker file at position %1"))
                                .arg(position));
    case MarkerStore::Result::CannotRead:
        break;
    }
    if (part == Part::LowCompletion) {
        return Tracer::fail(QString("Reading marker stream failed at position %1").arg(position));
    }
    const QString text = QString(" Cannot read from marker file at position %1").arg(position);
    if (part == Part::HighCompletion) {
        return Tracer::fail(text);
    }
    Tracer::Trace(Tracer::Error, text);
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
        const bool high = list.current != 0;
        if (debug && high) {
            Tracer::Trace(Tracer::Debug,
                          QString("Completing marker trace up to pos. %1").arg(m_written));
        }
        if (!spendWork(m_written - list.pos) ||
            !report(m_store.copy(m_written - list.pos, list.current),
                    high ? Part::HighCompletion : Part::LowCompletion, m_written)) {
            return false;
        }
    }
    const auto marker = static_cast<size_t>(qCountTrailingZeroBits(list.bit));
    if (list.current != 0) {
        m_cutAt[marker] = (m_lastByte & list.bit) == 0 ? m_written : -1;
    }
    return true;
}

bool MarkerTrace::finishLists()
{
    return report(m_store.finish(), Part::Walk, m_written);
}

bool MarkerTrace::extendTo(qint64 length)
{
    if (m_written >= length) {
        return true;
    }
    const std::vector<quint8> block(static_cast<size_t>(std::min(length - m_written, BlockSize)),
                                    m_lastByte);
    while (m_written < length) {
        const int size = static_cast<int>(std::min(length - m_written, BlockSize));
        if (m_progress.shouldStop(0)) {
            return Tracer::fail(AbortText);
        }
        if (!m_stream.writeBytes(size, block.data())) {
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
    const std::vector<quint8> block(static_cast<size_t>(std::min(count, BlockSize)), m_lastByte);
    for (qint64 done = 0; done < count;) {
        const int size = static_cast<int>(std::min(count - done, BlockSize));
        if (!m_stream.writeBytes(size, block.data())) {
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
