// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <QtGlobal>

/// Milliseconds since the system started this process, exact to 10 ms; -1 if it can't be told.
[[nodiscard]] qint64 processAgeMs();
