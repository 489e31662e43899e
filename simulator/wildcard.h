// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <string_view>

namespace simulator {

/// Whether a name fits a pattern with `*` and `?`. "*.*" fits every name.
[[nodiscard]] bool matchesWildcard(std::string_view name, std::string_view pattern,
                                   bool caseSensitive);

} // namespace simulator
