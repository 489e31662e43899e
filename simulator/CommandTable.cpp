// SPDX-License-Identifier: Apache-2.0
#include "CommandTable.h"

#include "ErrorQueue.h"
#include "ProgramUnit.h"

#include <algorithm>

namespace simulator {

void CommandTable::add(std::span<const Command> commands, Applies kind)
{
    for (const Command &command : commands) {
        if ((command.applies & kind) != 0) {
            m_entries.push_back(
                {&command, compile(command.pattern), command.pattern.starts_with('*')});
        }
    }
}

CommandTable::Result CommandTable::find(std::span<const std::string> nodes, bool common) const
{
    Result result{nullptr, UndefinedHeader};
    for (const Entry &entry : m_entries) {
        if (entry.common != common) {
            continue;
        }
        switch (match(nodes, entry.nodes)) {
        case Match::Yes:
            return {entry.command, NoError};
        case Match::WrongSuffix:
            result.error = HeaderSuffixOutOfRange;
            break;
        case Match::No:
            break;
        }
    }
    return result;
}

std::vector<CommandTable::Node> CommandTable::compile(std::string_view pattern)
{
    std::vector<Node> nodes;
    bool optional = false;
    std::size_t begin = 0;
    const auto isMark = [](char byte) {
        return byte == '[' || byte == ']' || byte == ':' || byte == '*' || byte == '#';
    };
    while (begin < pattern.size()) {
        const char mark = pattern[begin];
        if (isMark(mark)) {
            if (mark == '[' || mark == ']') {
                optional = mark == '[';
            }
            if (mark == '#') {
                nodes.back().suffix = true;
            }
            ++begin;
            continue;
        }
        std::size_t end = begin;
        while (end < pattern.size() && !isMark(pattern[end])) {
            ++end;
        }
        nodes.push_back({pattern.substr(begin, end - begin), optional, false});
        begin = end;
    }
    return nodes;
}

CommandTable::Match CommandTable::matchNode(std::string_view typed, const Node &node)
{
    if (matchesMnemonic(typed, node.mnemonic)) {
        return Match::Yes;
    }
    const std::size_t last = typed.find_last_not_of("0123456789");
    const std::size_t length = last == std::string_view::npos ? 0 : last + 1;
    if (length == typed.size() || !matchesMnemonic(typed.substr(0, length), node.mnemonic)) {
        return Match::No;
    }
    return node.suffix && typed.substr(length) == "1" ? Match::Yes : Match::WrongSuffix;
}

CommandTable::Match CommandTable::match(std::span<const std::string> typed,
                                        std::span<const Node> nodes)
{
    if (nodes.empty()) {
        return typed.empty() ? Match::Yes : Match::No;
    }
    Match best = Match::No;
    if (!typed.empty()) {
        const Match here = matchNode(typed.front(), nodes.front());
        if (here != Match::No) {
            const Match rest = match(typed.subspan(1), nodes.subspan(1));
            if (rest != Match::No) {
                best = here == Match::Yes ? rest : here;
            }
        }
    }
    if (best != Match::Yes && nodes.front().optional) {
        const Match without = match(typed, nodes.subspan(1));
        if (without != Match::No) {
            best = without;
        }
    }
    return best;
}

} // namespace simulator
