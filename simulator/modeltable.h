// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <span>
#include <string>
#include <string_view>
#include <vector>

namespace simulator {

/// What the simulator knows of one instrument model.
struct ModelInfo
{
    std::string_view name{};
    bool unixPaths = false;        ///< paths begin at "/", otherwise at a drive such as "D:"
    std::string_view roots{};      ///< user folders with a vertical bar between; may be empty
    std::string_view diskOption{}; ///< the option that adds the folder "/hdd/"; may be empty
    bool coder = false;            ///< waveform commands stand below SOURce:BB
    bool analyzer = false;
    bool steppedSampleRate = false;    ///< an analyzer that only records at 32 MHz over powers of 2
    std::string_view defaultOptions{}; ///< the answer of *OPT? where the user sets none
};

[[nodiscard]] std::span<const ModelInfo> modelTable();

/// The model of that very name; null when there is none.
[[nodiscard]] const ModelInfo *findModel(std::string_view name);

/// All names with commas between, for messages.
[[nodiscard]] std::string modelNames();

/// The user folders of a model with the given options, such as "/var/user" and "/hdd", or "D:".
[[nodiscard]] std::vector<std::string> rootFolders(const ModelInfo &model,
                                                   std::string_view options);

} // namespace simulator
