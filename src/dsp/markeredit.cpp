// SPDX-License-Identifier: Apache-2.0
#include "markeredit.h"

#include "base/simd.h"

#include <algorithm>
#include <cstddef>
#include <vector>

namespace {

/// Puts bits into the bytes in the place of those that `clear` takes away.
CORVANE_CLONES void replaceBits(quint8 *markers, const quint8 *bits, std::size_t count,
                                quint8 clear)
{
    for (std::size_t i = 0; i < count; ++i) {
        markers[i] = static_cast<quint8>((markers[i] & clear) | bits[i]);
    }
}

/// Sets or clears the masked bits of each byte by a pattern that begins at `phase`.
void applyPattern(std::span<quint8> markers, quint8 mask, const QByteArray &pattern, qint64 phase)
{
    // Several turns of a short pattern at a time, so that the loop over them has something to do.
    constexpr std::size_t UsefulBits = 4096;
    const auto period = static_cast<std::size_t>(pattern.size());
    const std::size_t turns = std::max<std::size_t>(1, UsefulBits / period);
    std::vector<quint8> bits(turns * period);
    for (std::size_t i = 0; i < bits.size(); ++i) {
        bits[i] = pattern[static_cast<qsizetype>(i % period)] == '1' ? mask : quint8(0);
    }
    std::size_t next = static_cast<std::size_t>(phase) % period;
    for (std::size_t done = 0; done < markers.size();) {
        const std::size_t count = std::min(markers.size() - done, bits.size() - next);
        replaceBits(markers.data() + done, bits.data() + next, count, static_cast<quint8>(~mask));
        done += count;
        next = 0;
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
