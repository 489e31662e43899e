// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <QSettings>

#include <memory>

/// The INI file with window state, instruments and one group for each tool. It is opened anew for
/// each load and each save.
[[nodiscard]] std::unique_ptr<QSettings> openMainStore();

/// The INI file with the colour set, which stays open for the whole run.
[[nodiscard]] std::unique_ptr<QSettings> openColorStore();
