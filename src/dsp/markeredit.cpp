// SPDX-License-Identifier: Apache-2.0
#include "markeredit.h"

#include <algorithm>
#include <cstddef>

namespace {

/// Sets or clears the masked bits of each byte by a pattern that begins at `phase`.
void applyPattern(std::span<quint8> markers, quint8 mask, const QByteArray &pattern, qint64 phase)
{
    const auto clear = static_cast<quint8>(~mask);
    qsizetype next = static_cast<qsizetype>(phase % pattern.size());
    for (quint8 &byte : markers) {
        byte = static_cast<quint8>((byte & clear) | (pattern[next] == '1' ? mask : 0));
        next = next + 1 == pattern.size() ? 0 : next + 1;
    }
}

} // namespace

void applyMarkerEdit(const MarkerEdit &edit, qint64 position, std::span<quint8> markers)
{
    const qint64 begin = std::max(edit.first, position);
    const qint64 end = std::min(edit.last + 1, position + static_cast<qint64>(markers.size()));
    if (begin >= end) {
        return;
    }
    const std::span<quint8> part = markers.subspan(static_cast<std::size_t>(begin - position),
                                                   static_cast<std::size_t>(end - begin));
    const auto clear = static_cast<quint8>(~edit.mask);
    switch (edit.action) {
    case MarkerAction::High:
        for (quint8 &byte : part) {
            byte |= edit.mask;
        }
        break;
    case MarkerAction::Low:
        for (quint8 &byte : part) {
            byte &= clear;
        }
        break;
    case MarkerAction::Toggle:
        applyPattern(part, edit.mask, QByteArrayLiteral("10"), begin - edit.first);
        break;
    case MarkerAction::Pattern:
        if (!edit.pattern.isEmpty()) {
            applyPattern(part, edit.mask, edit.pattern, begin - edit.first);
        }
        break;
    }
}
