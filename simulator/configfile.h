// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "Options.h"
#include "protocols/ini.h"

#include <optional>
#include <span>
#include <string>
#include <vector>

namespace simulator {

/// The instruments of a configuration; a relative root begins at `folder`. Nothing, with the reason
/// in `error`, when a key or value is not allowed.
[[nodiscard]] std::optional<std::vector<InstrumentPlace>>
instrumentsOf(std::span<const protocols::IniEntry> entries, const std::string &folder,
              std::string &error);

} // namespace simulator
