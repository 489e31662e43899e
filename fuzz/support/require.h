// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <cstdlib>

/// Ends the run as a crash if what must hold doesn't.
inline void require(bool holds)
{
    if (!holds) {
        std::abort();
    }
}
