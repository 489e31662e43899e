// SPDX-License-Identifier: Apache-2.0
#include "SigmfMarks.h"

#include <algorithm>

void SigmfMarks::add(std::span<const char> markers, qint64 first)
{
    for (size_t i = 0; i < markers.size(); ++i) {
        const auto byte = static_cast<quint8>(markers[i] & 0xF);
        if (byte != m_state) {
            change(byte, first + static_cast<qint64>(i));
        }
    }
}

void SigmfMarks::finish(qint64 samples)
{
    change(0, samples);
    std::stable_sort(
        m_stretches.begin(), m_stretches.end(), [](const Stretch &one, const Stretch &other) {
            return one.begin != other.begin ? one.begin < other.begin : one.marker < other.marker;
        });
}

void SigmfMarks::change(quint8 markers, qint64 position)
{
    for (int marker = 1; marker <= MarkerCount; ++marker) {
        const auto mask = static_cast<quint8>(1U << (marker - 1));
        qint64 &begin = m_begins.at(static_cast<size_t>(marker - 1));
        const bool wasHigh = (m_state & mask) != 0;
        const bool isHigh = (markers & mask) != 0;
        if (isHigh && !wasHigh) {
            begin = position;
        } else if (wasHigh && !isHigh) {
            m_stretches.push_back({begin, position - begin, marker});
        }
    }
    m_state = markers;
}
