// SPDX-License-Identifier: Apache-2.0
#include "Link.h"

#include "ErrorQueue.h"
#include "FileWriter.h"
#include "Instrument.h"
#include "Log.h"
#include "ProgramUnit.h"

#include <algorithm>
#include <iterator>
#include <utility>

namespace simulator {
namespace {

// A message may hold any number of queries; answers beyond this are not worth their memory.
constexpr std::size_t MaxResponseSegments = 1000;

// A count of more than nine digits does not fit the definite form and goes into brackets.
std::string blockHead(std::uint64_t size)
{
    constexpr std::size_t MaxDigits = 9;
    const std::string count = std::to_string(size);
    std::string head = "#";
    if (count.size() > MaxDigits) {
        return head.append("(").append(count).append(")");
    }
    return head.append(std::to_string(count.size())).append(count);
}

// What the log shows of a block.
std::string sizeMark(std::optional<std::uint64_t> size)
{
    return size ? std::string("<").append(std::to_string(*size)).append(" bytes>")
                : std::string("<bytes until END>");
}

} // namespace

Link::Link(Instrument &instrument, Transport transport, std::string name)
    : m_instrument(instrument)
    , m_transport(transport)
    , m_name(std::move(name))
    , m_parser(*this, transport == Transport::Vxi11)
{
}

Link::~Link() = default;

std::size_t Link::feed(std::span<const char> bytes, bool end)
{
    m_parser.setLineFeedEndsMessage(m_transport == Transport::Raw || !m_instrument.endsOnEoiOnly());
    return m_parser.feed(bytes, end);
}

OutputQueue::ReadResult Link::read(std::span<char> buffer, std::optional<char> termChar)
{
    const OutputQueue::ReadResult result = m_output.read(buffer, termChar);
    if (result.blockBytes > 0) {
        countBlockBytes(result.blockBytes);
    }
    if (result.messageEnd) {
        m_blockBytes = 0;
    }
    return result;
}

void Link::noteUnterminated()
{
    if (!std::exchange(m_silenceWanted, false) && m_output.isEmpty()) {
        m_instrument.reportError(QueryUnterminated);
    }
}

void Link::clear()
{
    m_parser.clear();
    m_output.clear();
    m_response.clear();
    m_path.clear();
    m_writer.reset();
    m_blockBytes = 0;
    m_inMessage = false;
    m_awaitsOperation = false;
    m_held = false;
    m_withoutTerminator = false;
    m_silenceWanted = false;
}

void Link::respond(std::string text)
{
    beginAnswer();
    m_response.push_back({.text = std::move(text)});
}

void Link::respondBlock(std::unique_ptr<DataSource> source, std::uint64_t size)
{
    constexpr std::int64_t WrongBytes = 8;
    const Faults &faults = m_instrument.faults();
    beginAnswer();
    std::uint64_t surplus = 0;
    if (faults.has("small-block")) {
        const std::int64_t missing = faults.number("small-block").value_or(WrongBytes);
        size -= std::min(static_cast<std::uint64_t>(missing), size);
    } else if (faults.has("long-block")) {
        const std::int64_t more = faults.number("long-block").value_or(WrongBytes);
        surplus = static_cast<std::uint64_t>(more);
    }
    m_response.push_back({.text = blockHead(size + surplus)});
    std::uint64_t sent = size;
    if (faults.has("short-block")) {
        const auto missing = static_cast<std::uint64_t>(
            faults.number("short-block").value_or(static_cast<std::int64_t>((size + 1) / 2)));
        sent -= std::min(missing, size);
        m_withoutTerminator = true;
    }
    if (faults.has("no-terminator")) {
        m_withoutTerminator = true;
    }
    m_response.push_back({.text = {}, .source = std::move(source), .size = sent, .isBlock = true});
    if (surplus > 0) {
        m_response.push_back({.text = std::string(static_cast<std::size_t>(surplus), '\0'),
                              .size = surplus,
                              .isBlock = true});
    }
    m_blockBytes = 0;
    countBlockBytes(0);
}

void Link::beginMessage()
{
    if (std::exchange(m_inMessage, true)) {
        return;
    }
    m_silenceWanted = false;
    // IEEE 488.2, 6.3.2.3: a controller that sends a new message instead of reading the answer to
    // the last one loses that answer. Raw sockets have no such rule.
    if (m_transport == Transport::Vxi11 && !m_output.isEmpty()) {
        m_output.clear();
        m_instrument.reportError(QueryInterrupted);
    }
}

void Link::beginAnswer()
{
    if (!m_response.empty()) {
        m_response.push_back({.text = ";"});
    }
    m_held = m_held && m_instrument.isOperationPending(Clock::now());
    m_awaitsOperation = m_awaitsOperation || m_held;
}

void Link::countBlockBytes(std::uint64_t count)
{
    m_blockBytes += count;
    const std::optional<std::int64_t> limit = m_instrument.faults().number("drop-after");
    if (limit && m_blockBytes >= static_cast<std::uint64_t>(*limit)) {
        m_dropDue = true;
    }
}

// SCPI-99, volume 1, 6.2.4: a header without a colon in front continues where the last one of the
// same message stood; common commands leave that place alone.
std::vector<std::string> Link::fullHeader(bool common, bool absolute,
                                          const std::vector<std::string> &nodes)
{
    if (common) {
        return nodes;
    }
    std::vector<std::string> full;
    // No header of this instrument goes deeper; a message of relative ones must not pile them up.
    constexpr std::size_t DeepestPath = 16;
    if (!absolute && m_path.size() < DeepestPath) {
        full = m_path;
    }
    full.insert(full.end(), nodes.begin(), nodes.end());
    m_path.assign(full.begin(), std::prev(full.end()));
    return full;
}

void Link::onUnit(std::string_view text, bool hasBlock)
{
    beginMessage();
    if (!hasBlock) {
        Log::conversation(m_name, ">>", text);
    }
    ProgramUnit unit;
    if (const int error = unit.parse(text); error != NoError) {
        m_instrument.reportError(error);
    } else if (m_response.size() >= MaxResponseSegments) {
        m_instrument.reportError(OutOfMemory);
    } else {
        unit.nodes = fullHeader(unit.common, unit.absolute, unit.nodes);
        m_instrument.execute(*this, unit);
    }
    m_hasTransfer = false;
}

void Link::onBlockBegin(std::string_view text, std::optional<std::uint64_t> size)
{
    beginMessage();
    if (Log::isVerbose()) {
        Log::conversation(m_name, ">>", std::string(text) + sizeMark(size));
    }
    ProgramUnit unit;
    m_hasTransfer = false;
    m_transferError = NoError;
    m_blockBytes = 0;
    if (unit.parse(std::string(text) + '#') != NoError) {
        return;
    }
    // The unit is resolved again when it is complete; the path must be the same then.
    const std::vector<std::string> path = m_path;
    unit.nodes = fullHeader(unit.common, unit.absolute, unit.nodes);
    m_path = path;
    if (!m_instrument.takesFile(unit)) {
        return;
    }
    m_hasTransfer = true;
    m_transferError = m_instrument.openTransfer(unit, m_writer);
    countBlockBytes(0);
}

void Link::onBlockData(std::span<const char> bytes)
{
    if (!m_writer || m_dropDue) {
        return;
    }
    const std::optional<std::int64_t> limit = m_instrument.faults().number("drop-after");
    if (limit) {
        const auto most = static_cast<std::uint64_t>(*limit);
        const std::uint64_t left = most - std::min(m_blockBytes, most);
        bytes = bytes.first(static_cast<std::size_t>(std::min<std::uint64_t>(bytes.size(), left)));
    }
    m_writer->write(bytes);
    countBlockBytes(bytes.size());
}

void Link::onBlockEnd(bool complete)
{
    if (m_writer) {
        const int error = m_writer->finish();
        m_writer.reset();
        if (complete) {
            m_transferError = error;
        }
    }
    m_blockBytes = 0;
}

void Link::onError(int number)
{
    beginMessage();
    m_instrument.reportError(number);
}

void Link::onMessageEnd()
{
    if (!m_response.empty()) {
        if (m_withoutTerminator) {
            m_silenceWanted = true;
        } else {
            m_response.push_back({.text = "\n"});
        }
        if (Log::isVerbose()) {
            std::string answer;
            for (const OutputSegment &segment : m_response) {
                answer += segment.isBlock ? sizeMark(segment.size) : segment.text;
            }
            Log::conversation(m_name, "<<", answer);
        }
        const auto delay =
            std::chrono::milliseconds(m_instrument.faults().number("slow-answer").value_or(0));
        m_output.push(std::exchange(m_response, {}), Clock::now() + delay, m_awaitsOperation);
    }
    m_path.clear();
    m_inMessage = false;
    m_awaitsOperation = false;
    m_withoutTerminator = false;
}

} // namespace simulator
