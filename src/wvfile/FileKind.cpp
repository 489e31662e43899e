// SPDX-License-Identifier: Apache-2.0
#include "FileKind.h"

#include "WvTypes.h"

#include <algorithm>
#include <array>

namespace {

constexpr std::array<FileKind, 9> FileKinds{{
    {"TGX-WV", "TGX Waveform File", WvFormatTgx, "Format is TGX waveform."},
    {"TBX-WV", "TBX Waveform File", WvFormatTbx, "Format is TBX waveform."},
    {"TVX-WV", "TVX Waveform File", WvFormatTvx, "Format is TVX waveform."},
    {"TQX-130-WV", "TQX-130 waveform file", WvFormatTqx, "Format is TQX-130 waveform."},
    {"WV", "TQX-110, TQX-120 waveform file", WvFormatWv, "Format is TQX-110 waveform."},
    {"WV-ADD", "TQX-110, TQX-120 additional waveform file", WvFormatWv,
     "Format is TQX-110 waveform."},
    {"TGX-MWV", "TGX Multi-Segment Waveform", WvFormatUnknown, nullptr},
    {"TGX-DL", "TGX data list", WvFormatUnknown, nullptr},
    {"TGX-CL", "TGX control list", WvFormatUnknown, nullptr},
}};

} // namespace

const FileKind *findFileKind(const QString &typeField)
{
    const QString name = typeField.simplified().toUpper();
    const auto *found = std::find_if(FileKinds.begin(), FileKinds.end(), [&](const FileKind &kind) {
        return name == QLatin1String(kind.name);
    });
    return found == FileKinds.end() ? nullptr : found;
}
