// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "UniqueFd.h"

#include <fcntl.h>

#include <functional>
#include <string>
#include <string_view>

namespace simulator {

/// How a folder on the way of an instrument's path is opened: links are not followed.
inline constexpr int FolderFlags = O_RDONLY | O_DIRECTORY | O_NOFOLLOW | O_CLOEXEC;

/// The SCPI error that stands for an error number of the system.
[[nodiscard]] int scpiErrorOf(int systemError);

/// Visits the names in an open folder, without "." and "..", in no order.
void forEachName(int folder, const std::function<void(std::string_view name)> &visitor);

/// Opens a plain file in an open folder; links, pipes and devices are refused. Returns the SCPI
/// error, 0 for none.
[[nodiscard]] int openRegular(int folder, const std::string &name, int flags, UniqueFd &fd);

} // namespace simulator
