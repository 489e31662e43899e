// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <QString>

#include <optional>

/// What every tool that writes a waveform asks for besides its own settings.
struct OutputOptions
{
    QString fileName;
    std::optional<QString> comment;   ///< nothing: that of the source, or none
    std::optional<QString> copyright; ///< nothing: that of the source, or none
    bool overwrite = true;            ///< a file that stands under the name may be replaced
};
