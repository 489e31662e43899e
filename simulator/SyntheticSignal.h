// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <array>
#include <cstdint>
#include <span>

namespace simulator {

/// One complex sample; 1 is the reference level of an analyzer, or full scale of an I/Q input.
struct IqSample
{
    float i = 0;
    float q = 0;
};

/// Two tones in white Gaussian noise, or less than that.
///
/// Samples are counted from the trigger on, those before it have negative numbers. Each depends on
/// the settings and its number alone, so that any part of a record can be made at any time and is
/// always the same.
class SyntheticSignal
{
public:
    struct Tone
    {
        double frequencyHz = 0; ///< from the centre; phase 0 at sample 0
        double amplitude = 0;   ///< 0: it is not there
    };

    struct Settings
    {
        std::uint64_t seed = 1; ///< of the noise
        double sampleRateHz = 1e6;
        Tone carrier;
        Tone spur;
        double noiseDeviation = 0;   ///< of I and of Q
        bool isSilentBefore = false; ///< the tones come at sample 0
        bool isSilentAfter = false;  ///< the tones end before sample 0
    };

    static constexpr std::int64_t BlockSize = 1024; ///< samples

    explicit SyntheticSignal(const Settings &settings);

    /// Makes the `BlockSize` samples from number `block` * `BlockSize` on. I and Q beyond -1 to 1
    /// are cut off there, as by an overdriven converter.
    void makeBlock(std::int64_t block, std::span<IqSample, BlockSize> samples) const;

private:
    /// A tone of amplitude 1 as it goes through one block.
    struct Turn
    {
        std::array<float, BlockSize> cosine{};
        std::array<float, BlockSize> sine{};
    };

    [[nodiscard]] Turn turnOf(const Tone &tone) const;
    void addTone(const Tone &tone, const Turn &turn, std::int64_t first,
                 std::span<IqSample, BlockSize> samples) const;
    void addNoise(std::int64_t block, std::span<IqSample, BlockSize> samples) const;

    Settings m_settings;
    Turn m_carrier;
    Turn m_spur;
};

} // namespace simulator
