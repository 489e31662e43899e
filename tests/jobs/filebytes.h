// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "support/files.h"
#include "support/wavbytes.h"

#include <QStringList>

[[nodiscard]] QStringList takeMessages(unsigned levels);

namespace filebytes {

/// The waiting lines of the log at the given levels, without their time of day.
[[nodiscard]] inline QStringList takeLog(int levels)
{
    return takeMessages(static_cast<unsigned>(levels));
}

} // namespace filebytes
