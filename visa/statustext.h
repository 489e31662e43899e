// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "visa.h"

#include <string>

namespace visa {

/// What a status code means, in one sentence; empty for a code that this library does not know.
[[nodiscard]] std::string statusText(ViStatus status);

} // namespace visa
