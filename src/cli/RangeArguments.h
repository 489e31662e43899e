// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "jobs/SampleReadJob.h"
#include "wvfile/WvTypes.h"

#include <CLI/CLI.hpp>

class Console;

/// Adds the file argument and the options --from and --count of the commands that look at samples.
void addRange(CLI::App &command, SampleRange &range);

/// What the tags of a waveform file say; nothing if it can't be scanned, of which the reading of
/// its samples tells the reason.
[[nodiscard]] std::optional<WvFileSummary> scanned(const QString &fileName);

/// Whether the range lies in the file, by its tags; if not, `exitCode` is that of wrong usage. A
/// file that can't be scanned passes: reading it tells the reason.
[[nodiscard]] bool rangeFits(Console &console, const SampleRange &range, int &exitCode);
