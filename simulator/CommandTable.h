// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <span>
#include <string>
#include <string_view>
#include <vector>

namespace simulator {

struct CommandContext;
using CommandHandler = void (*)(CommandContext &context);

/// The kinds of instruments that know a command; bits.
enum Applies : unsigned {
    ToGenerator = 1,      ///< a generator whose baseband coder has the node BB
    ToPlainGenerator = 2, ///< a generator without one
    ToAnalyzer = 4,
    ToGenerators = ToGenerator | ToPlainGenerator,
    ToAll = ToGenerators | ToAnalyzer,
};

/// One command of the instrument.
struct Command
{
    /// As manuals print it: capitals are the short form, brackets hold what may be left out, `#`
    /// stands behind a mnemonic that may carry the number 1.
    std::string_view pattern;
    unsigned applies = ToAll;
    CommandHandler set = nullptr;   ///< none: there is only a query
    CommandHandler query = nullptr; ///< none: there is no query
    unsigned minParameters = 0;     ///< of the command form
    unsigned maxParameters = 0;
    unsigned maxQueryParameters = 0;
};

/// Finds the command of a header.
class CommandTable
{
public:
    struct Result
    {
        const Command *command = nullptr;
        int error = 0; ///< why there is none
    };

    /// Adds those of the commands that the kind of instrument knows. The commands must outlive the
    /// table.
    void add(std::span<const Command> commands, Applies kind);

    /// Looks a whole header up, its nodes from the root on.
    [[nodiscard]] Result find(std::span<const std::string> nodes, bool common) const;

private:
    struct Node
    {
        std::string_view mnemonic;
        bool optional = false;
        bool suffix = false;
    };
    struct Entry
    {
        const Command *command = nullptr;
        std::vector<Node> nodes;
        bool common = false;
    };
    enum class Match { No, Yes, WrongSuffix };

    [[nodiscard]] static std::vector<Node> compile(std::string_view pattern);
    [[nodiscard]] static Match matchNode(std::string_view typed, const Node &node);
    [[nodiscard]] static Match match(std::span<const std::string> typed,
                                     std::span<const Node> nodes);

    std::vector<Entry> m_entries;
};

} // namespace simulator
