// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "base/limits.h"

#include <QtGlobal>

#include <array>
#include <span>
#include <vector>

/// Gathers the stretches in which markers are high from the marker bytes of a signal as they pass.
class SigmfMarks
{
public:
    struct Stretch
    {
        qint64 begin = 0; ///< sample, counted from 0
        qint64 count = 0;
        int marker = 1; ///< 1 to 4
    };

    /// Takes the bytes from sample `first`, which follow those before.
    void add(std::span<const char> markers, qint64 first);

    /// Closes the stretches that reach to the end of the signal, and orders all by their begin.
    void finish(qint64 samples);

    [[nodiscard]] const std::vector<Stretch> &stretches() const { return m_stretches; }

private:
    void change(quint8 markers, qint64 position);

    quint8 m_state = 0;
    std::array<qint64, MarkerCount> m_begins{};
    std::vector<Stretch> m_stretches;
};
