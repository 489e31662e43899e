// SPDX-License-Identifier: Apache-2.0
#pragma once

/// The number of processor cores that this process may use, at least 1; the threads of one core
/// count once. Logs what the processor is.
[[nodiscard]] int detectCores();
