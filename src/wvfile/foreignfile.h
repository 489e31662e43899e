// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <QString>

/// What a name stands for that is no waveform file, by its first bytes, for a message: "a WAV sound
/// file", "a folder", "text". Empty for what begins as a waveform file does.
[[nodiscard]] QString foreignKind(const QString &fileName);
