// SPDX-License-Identifier: Apache-2.0
#include "simulator/ErrorQueue.h"
#include "simulator/ProgramUnit.h"
#include "simulator/ScpiParser.h"
#include "support/require.h"

#include <algorithm>
#include <cmath>
#include <utility>

using namespace simulator;

namespace {

void parseUnit(std::string_view text)
{
    ProgramUnit unit;
    if (unit.parse(text) != NoError) {
        return;
    }
    require(!unit.nodes.empty());
    for (const std::string &node : unit.nodes) {
        require(!node.empty() && matchesMnemonic(node, upperCase(node)));
    }
    for (const Parameter &parameter : unit.parameters) {
        require(std::isfinite(parameter.value) &&
                std::isfinite(suffixFactor(parameter.suffix, "HZ")));
    }
}

// Writes down what the parser tells, and that it keeps its own rules.
class Recorder final : public ScpiParser::Handler
{
public:
    std::string events;

    [[nodiscard]] bool isInBlock() const { return m_inBlock; }

private:
    void onUnit(std::string_view text, bool hasBlock) override
    {
        require(!m_inBlock && text.size() <= ScpiParser::MaxUnitLength + 1);
        parseUnit(text);
        events.append(hasBlock ? "B" : "U").append(text).push_back('\0');
    }
    void onBlockBegin(std::string_view text, std::optional<std::uint64_t> size) override
    {
        require(!std::exchange(m_inBlock, true));
        m_size = size;
        m_received = 0;
        events.append("b").append(text).append(size ? std::to_string(*size) : "?").push_back('\0');
    }
    void onBlockData(std::span<const char> bytes) override
    {
        require(m_inBlock);
        m_received += bytes.size();
        events.append(bytes.data(), bytes.size());
    }
    void onBlockEnd(bool complete) override
    {
        require(std::exchange(m_inBlock, false) &&
                (!m_size || complete == (m_received == *m_size)));
        events.append(complete ? "e" : "i");
    }
    void onError(int number) override { events.append("E").append(std::to_string(number)); }
    void onMessageEnd() override
    {
        require(!m_inBlock);
        events.append("M");
    }

    bool m_inBlock = false;
    std::optional<std::uint64_t> m_size;
    std::uint64_t m_received = 0;
};

std::string eventsOf(std::span<const char> bytes, std::size_t pieceSize, bool hasEnd,
                     bool lineFeedEnds)
{
    Recorder recorder;
    ScpiParser parser(recorder, hasEnd);
    parser.setLineFeedEndsMessage(lineFeedEnds);
    while (!bytes.empty()) {
        const std::span<const char> piece = bytes.first(std::min(bytes.size(), pieceSize));
        const std::size_t taken = parser.feed(piece, hasEnd && piece.size() == bytes.size());
        require(taken > 0 && taken <= piece.size());
        bytes = bytes.subspan(taken);
    }
    require(!hasEnd || parser.isIdle());
    parser.clear();
    require(parser.isIdle() && !recorder.isInBlock());
    return recorder.events;
}

} // namespace

/// The first byte tells the size of the pieces, the second how the transport ends a message. The
/// pieces must not matter.
extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t *data, std::size_t size)
{
    if (size < 2) {
        return 0;
    }
    const std::size_t pieceSize = std::size_t{data[0]} + 1;
    const bool hasEnd = (data[1] & 1U) != 0;
    const bool lineFeedEnds = (data[1] & 2U) == 0 || !hasEnd;
    const std::span<const char> bytes(reinterpret_cast<const char *>(data) + 2, size - 2);
    require(eventsOf(bytes, bytes.size() + 1, hasEnd, lineFeedEnds) ==
            eventsOf(bytes, pieceSize, hasEnd, lineFeedEnds));
    return 0;
}
