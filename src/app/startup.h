// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <QSettings>

#include <memory>

/// Gives the application object, which exists, its name, version, pictures, icon and colours.
/// Returns the store of the colours, to be kept until the event loop has ended.
[[nodiscard]] std::unique_ptr<QSettings> prepareApplication();
