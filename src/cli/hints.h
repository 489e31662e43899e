// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <CLI/CLI.hpp>
#include <QString>

/// Adds to the help of each command an example and what is common to all.
void addExamples(CLI::App &app);

/// The command or option nearest to what was typed in its place, behind the commands that were
/// understood; empty if none comes near.
[[nodiscard]] QString nearestName(const CLI::App &app, const QString &typed);
