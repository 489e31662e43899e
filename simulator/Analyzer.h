// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "IqSource.h"

#include <chrono>
#include <cstdint>
#include <memory>
#include <optional>

namespace simulator {

/// Settings of an I/Q record.
struct IqSettings
{
    enum class Trigger { Immediate, External, IfPower };

    double filterHz = 10e6;     ///< resolution bandwidth, 300 kHz to 50 MHz
    double sampleRateHz = 32e6; ///< 10 kHz to 326 MHz
    Trigger trigger = Trigger::Immediate;
    bool positiveSlope = true;
    std::int64_t pretriggerSamples = 0; ///< -16776703 to 65023
    std::int64_t sampleCount = 128;     ///< 1 to 124999999, what a block's nine digits can count
};

/// The signal input of an analyzer.
enum class AnalyzerInput { Rf, AnalogIq, DigitalIq };

/// The I/Q recorder of an analyzer.
class Analyzer
{
public:
    /// `steppedSampleRate`: only 32 MHz divided by powers of two can be had.
    Analyzer(bool steppedSampleRate, std::uint64_t seed);

    /// Takes new settings, the sample rate brought to the nearest that the instrument has. The last
    /// record is lost and a running sweep ends.
    void configure(IqSettings settings, TimePoint now);
    [[nodiscard]] const IqSettings &settings() const { return m_settings; }

    /// I/Q mode on or off; either ends a sweep and drops the record.
    void setIqMode(bool on, TimePoint now);
    [[nodiscard]] bool isIqMode() const { return m_iqMode; }

    /// What a sweep goes by besides the settings of its record.
    struct Sweep
    {
        double referenceDbm = -10;         ///< power of a tone with the amplitude 1
        double triggerDbm = -20;           ///< level of the IF power trigger
        std::chrono::milliseconds delay{}; ///< that it takes longer than its samples last
    };

    /// Starts a sweep; it begins at once or waits for its trigger.
    void start(TimePoint now, const Sweep &sweep);

    /// Ends a sweep; a record that was not complete is lost.
    void abort(TimePoint now);

    /// Fires the external trigger.
    void trigger(TimePoint now);

    [[nodiscard]] bool isWaiting() const { return m_waiting; }
    [[nodiscard]] bool isSweeping(TimePoint now) const;
    [[nodiscard]] bool isPending(TimePoint now) const { return m_waiting || isSweeping(now); }

    /// When the running sweep ends; never, while it waits for a trigger.
    [[nodiscard]] TimePoint sweepEnd() const;

    /// A sweep was started with these settings, and not aborted.
    [[nodiscard]] bool hasRecord() const { return m_hasRecord; }

    /// Part of the record of the last sweep.
    [[nodiscard]] std::unique_ptr<IqSource> record(std::uint64_t firstSample,
                                                   std::uint64_t sampleCount) const;

    void reset();

    AnalyzerInput input = AnalyzerInput::Rf;
    IqFormat format = IqFormat::Blocks;
    bool binary = false; ///< FORMat REAL,32; otherwise ASCii

private:
    void begin(TimePoint now);
    [[nodiscard]] SyntheticSignal::Settings signalAt(double referenceDbm) const;

    bool m_steppedSampleRate;
    std::uint64_t m_seed;
    IqSettings m_settings;
    bool m_iqMode = false;
    bool m_waiting = false;
    bool m_hasRecord = false;
    TimePoint m_sweepEnd;
    std::chrono::milliseconds m_sweepDelay{};
    SyntheticSignal::Settings m_signal; ///< of the last sweep
};

} // namespace simulator
