// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <QString>

/// One kind of waveform file, named by the first field of its TYPE tag.
struct FileKind
{
    const char *name;        ///< first field of TYPE, upper case
    const char *description; ///< shown to the user
    int format;              ///< WvFormat; WvFormatUnknown if the kind holds no plain waveform
    const char *logText;     ///< what the reader logs on meeting it, null if it refuses the kind
};

/// The kind of a TYPE field, whatever its case and blanks; null if there is none.
[[nodiscard]] const FileKind *findFileKind(const QString &typeField);
