// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <bitset>
#include <optional>
#include <string_view>
#include <vector>

namespace visa {

/// A regular expression of viFindRsrc, matched against whole resource strings without regard to
/// case: `?` any character, `\c` the character itself, `[list]` and `[^list]` with ranges, `*` and
/// `+` for zero or one and more of what stands before, `a|b`, `(group)`.
///
/// The walk keeps the set of reachable places instead of trying one way after the other, so that
/// nested repetitions don't take exponential time.
class FindExpression
{
public:
    /// Nothing for a text that breaks the grammar. Attribute conditions in braces are not offered.
    [[nodiscard]] static std::optional<FindExpression> parse(std::string_view text);

    [[nodiscard]] bool matches(std::string_view text) const;

private:
    friend class FindExpressionParser;

    enum class Kind { Characters, Sequence, Alternatives, Repeat };

    struct Node
    {
        Kind kind = Kind::Sequence;
        std::bitset<256> characters;
        bool mayBeAbsent = false; // of Repeat: true for `*`
        std::vector<Node> children;
    };

    // For each place in the text, whether a match may stand there.
    using Places = std::vector<bool>;

    static Places advance(const Node &node, const Places &from, std::string_view text);

    Node m_root;
};

} // namespace visa
