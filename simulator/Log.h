// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <string_view>

namespace simulator {

/// Lines on standard error; any thread may write them.
class Log
{
public:
    /// Whether commands and answers are logged. To be set before any thread runs.
    static void setVerbose(bool verbose);
    [[nodiscard]] static bool isVerbose();

    /// One line of the conversation, when that is wanted: who, ">>" or "<<", and the text with
    /// control characters as dots, cut where it is very long.
    static void conversation(std::string_view who, std::string_view arrow, std::string_view text);

    static void error(std::string_view text);
};

} // namespace simulator
