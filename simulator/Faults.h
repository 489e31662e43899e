// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <cstdint>
#include <map>
#include <optional>
#include <string>
#include <string_view>

namespace simulator {

/// The faults that an instrument was told to show.
class Faults
{
public:
    /// Switches a fault on. False with the reason in `error` when the name is unknown, or the value
    /// is missing, unexpected or out of range; then nothing changes.
    [[nodiscard]] bool set(std::string_view name, std::string_view value, std::string &error);

    /// As above from the text NAME or NAME=VALUE.
    [[nodiscard]] bool set(std::string_view text, std::string &error);

    void clear() { m_values.clear(); }
    void clear(std::string_view name) { m_values.erase(std::string(name)); }

    [[nodiscard]] bool has(std::string_view name) const;

    /// The fault's number; none when it is off or has no value.
    [[nodiscard]] std::optional<std::int64_t> number(std::string_view name) const;

    /// The fault's text; empty when it is off.
    [[nodiscard]] std::string text(std::string_view name) const;

    /// All that are on, as NAME or NAME=VALUE with commas between, in the order of their names.
    [[nodiscard]] std::string list() const;

    /// The help text: one line a fault.
    [[nodiscard]] static std::string help();

private:
    std::map<std::string, std::string, std::less<>> m_values;
};

} // namespace simulator
