// SPDX-License-Identifier: Apache-2.0
#include "FindExpression.h"

#include <cstddef>

namespace visa {

namespace {

constexpr int DeepestGroup = 8;
constexpr std::size_t LongestExpression = 1024;

char otherCase(char c)
{
    if (c >= 'a' && c <= 'z') {
        return static_cast<char>(c - 'a' + 'A');
    }
    if (c >= 'A' && c <= 'Z') {
        return static_cast<char>(c - 'A' + 'a');
    }
    return c;
}

void include(std::bitset<256> &set, char c)
{
    set.set(static_cast<unsigned char>(c));
    set.set(static_cast<unsigned char>(otherCase(c)));
}

} // namespace

// Recursive descent: alternatives of sequences of repeated atoms.
class FindExpressionParser
{
public:
    explicit FindExpressionParser(std::string_view text)
        : m_text(text)
    {
    }

    std::optional<FindExpression> parse()
    {
        FindExpression expression;
        if (!alternatives(expression.m_root, 0) || !m_text.empty()) {
            return std::nullopt;
        }
        return expression;
    }

private:
    using Node = FindExpression::Node;
    using Kind = FindExpression::Kind;

    bool alternatives(Node &node, int depth)
    {
        node.kind = Kind::Alternatives;
        for (;;) {
            if (!sequence(node.children.emplace_back(), depth)) {
                return false;
            }
            if (m_text.empty() || m_text.front() != '|') {
                return true;
            }
            m_text.remove_prefix(1);
        }
    }

    bool sequence(Node &node, int depth)
    {
        node.kind = Kind::Sequence;
        while (!m_text.empty() && m_text.front() != '|' && m_text.front() != ')') {
            Node next;
            if (!atom(next, depth)) {
                return false;
            }
            while (!m_text.empty() && (m_text.front() == '*' || m_text.front() == '+')) {
                Node repeat;
                repeat.kind = Kind::Repeat;
                repeat.mayBeAbsent = take() == '*';
                // A repetition of a repetition adds nothing but depth.
                if (next.kind == Kind::Repeat) {
                    next.mayBeAbsent = next.mayBeAbsent || repeat.mayBeAbsent;
                } else {
                    repeat.children.push_back(std::move(next));
                    next = std::move(repeat);
                }
            }
            node.children.push_back(std::move(next));
        }
        return !node.children.empty();
    }

    bool atom(Node &node, int depth)
    {
        node.kind = Kind::Characters;
        const char c = take();
        switch (c) {
        case '?':
            node.characters.set();
            return true;
        case '[':
            return list(node);
        case '(':
            if (depth == DeepestGroup || !alternatives(node, depth + 1) || m_text.empty()) {
                return false;
            }
            return take() == ')';
        case '\\':
            if (m_text.empty()) {
                return false;
            }
            include(node.characters, take());
            return true;
        case '*':
        case '+':
        case ']':
        case '{':
        case '}':
            return false;
        default:
            include(node.characters, c);
            return true;
        }
    }

    bool list(Node &node)
    {
        const bool isNegated = !m_text.empty() && m_text.front() == '^';
        if (isNegated) {
            m_text.remove_prefix(1);
        }
        bool isEmpty = true;
        while (!m_text.empty() && m_text.front() != ']') {
            const auto first = listMember();
            if (!first) {
                return false;
            }
            char last = *first;
            if (m_text.size() >= 2 && m_text[0] == '-' && m_text[1] != ']') {
                m_text.remove_prefix(1);
                const auto end = listMember();
                if (!end) {
                    return false;
                }
                last = *end;
            }
            if (static_cast<unsigned char>(*first) > static_cast<unsigned char>(last)) {
                return false;
            }
            for (int c = static_cast<unsigned char>(*first); c <= static_cast<unsigned char>(last);
                 ++c) {
                include(node.characters, static_cast<char>(c));
            }
            isEmpty = false;
        }
        if (m_text.empty() || isEmpty) {
            return false;
        }
        m_text.remove_prefix(1);
        if (isNegated) {
            node.characters.flip();
        }
        return true;
    }

    std::optional<char> listMember()
    {
        const char c = take();
        if (c != '\\') {
            return c;
        }
        if (m_text.empty()) {
            return std::nullopt;
        }
        return take();
    }

    char take()
    {
        const char c = m_text.front();
        m_text.remove_prefix(1);
        return c;
    }

    std::string_view m_text;
};

std::optional<FindExpression> FindExpression::parse(std::string_view text)
{
    if (text.size() > LongestExpression) {
        return std::nullopt;
    }
    return FindExpressionParser(text).parse();
}

bool FindExpression::matches(std::string_view text) const
{
    Places places(text.size() + 1, false);
    places.front() = true;
    return advance(m_root, places, text).back();
}

FindExpression::Places FindExpression::advance(const Node &node, const Places &from,
                                               std::string_view text)
{
    Places to(from.size(), false);
    switch (node.kind) {
    case Kind::Characters:
        for (std::size_t i = 0; i < text.size(); ++i) {
            to[i + 1] = from[i] && node.characters.test(static_cast<unsigned char>(text[i]));
        }
        break;
    case Kind::Sequence:
        to = from;
        for (const Node &child : node.children) {
            to = advance(child, to, text);
        }
        break;
    case Kind::Alternatives:
        for (const Node &child : node.children) {
            const Places reached = advance(child, from, text);
            for (std::size_t i = 0; i < to.size(); ++i) {
                to[i] = to[i] || reached[i];
            }
        }
        break;
    case Kind::Repeat: {
        Places front = from;
        if (node.mayBeAbsent) {
            to = from;
        }
        for (bool hasGrown = true; hasGrown;) {
            front = advance(node.children.front(), front, text);
            hasGrown = false;
            for (std::size_t i = 0; i < to.size(); ++i) {
                // Places known before lead nowhere new.
                front[i] = front[i] && !to[i];
                hasGrown = hasGrown || front[i];
                to[i] = to[i] || front[i];
            }
        }
        break;
    }
    }
    return to;
}

} // namespace visa
