// SPDX-License-Identifier: Apache-2.0
#include "wildcard.h"

#include <cstddef>

namespace simulator {
namespace {

char fold(char byte, bool caseSensitive)
{
    return !caseSensitive && byte >= 'A' && byte <= 'Z' ? static_cast<char>(byte - 'A' + 'a')
                                                        : byte;
}

} // namespace

bool matchesWildcard(std::string_view name, std::string_view pattern, bool caseSensitive)
{
    if (pattern == "*.*") {
        return true;
    }
    // Greedy with one way back: on a mismatch the last `*` takes one byte more.
    std::size_t at = 0;
    std::size_t p = 0;
    std::size_t star = std::string_view::npos;
    std::size_t starAt = 0;
    while (at < name.size()) {
        if (p < pattern.size() && pattern[p] == '*') {
            star = p++;
            starAt = at;
        } else if (p < pattern.size() && (pattern[p] == '?' || fold(pattern[p], caseSensitive) ==
                                                                   fold(name[at], caseSensitive))) {
            ++p;
            ++at;
        } else if (star != std::string_view::npos) {
            p = star + 1;
            at = ++starAt;
        } else {
            return false;
        }
    }
    while (p < pattern.size() && pattern[p] == '*') {
        ++p;
    }
    return p == pattern.size();
}

} // namespace simulator
