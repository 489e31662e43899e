// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "OutputQueue.h"

#include <cstdint>
#include <optional>
#include <string>

namespace simulator {

/// The arbitrary-waveform generator of an instrument: which file is loaded and whether it plays.
class Arb
{
public:
    /// Begins to load a file of that size. `busySeconds` replaces the usual loading time of 200 ms
    /// and 5 ns a byte.
    void select(std::string path, std::uint64_t size, std::optional<std::int64_t> busySeconds,
                TimePoint now);

    [[nodiscard]] const std::string &selection() const { return m_selection; }
    [[nodiscard]] bool isLoading(TimePoint now) const { return now < m_loadEnd; }
    [[nodiscard]] TimePoint loadEnd() const { return m_loadEnd; }

    /// How much of the waveform is loaded, 0 to 100; 100 when nothing is being loaded.
    [[nodiscard]] int progressPercent(TimePoint now) const;

    [[nodiscard]] bool isOn() const { return m_on; }
    void setOn(bool on) { m_on = on; }

    /// The clock rate at which the waveform is played, in Hz.
    [[nodiscard]] double clockHz() const { return m_clockHz; }
    void setClockHz(double clockHz) { m_clockHz = clockHz; }

    void reset() { *this = {}; }

private:
    std::string m_selection;
    TimePoint m_loadBegin;
    TimePoint m_loadEnd;
    bool m_on = false;
    double m_clockHz = 0;
};

} // namespace simulator
