// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <optional>
#include <string>
#include <string_view>
#include <vector>

namespace visa {

/// Turns a format of viPrintf into the messages to send, each to be closed with END: a line feed
/// ends a message, as the standard has it. Nothing if a conversion other than "%%" occurs, for
/// which there is no argument.
///
/// Escapes: \n \r \t \\ \" and \ with one to three octal digits; a backslash before anything else
/// stands for itself. Between a pair of SCPI string quotes ('...' or "...") each backslash stands
/// for itself, because it separates folders there: 'D:\new' must not become a line feed.
[[nodiscard]] std::optional<std::vector<std::string>> formatMessages(std::string_view format);

} // namespace visa
