// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "signalfit.h"
#include "signalsettings.h"

#include <memory>
#include <span>

/// Computes the samples of one period of a signal. Used by one thread at a time.
///
/// The values are part of the system's established results: sums run in double precision, with the
/// short circle constants below, in the stated order.
class SignalGenerator
{
public:
    SignalGenerator() = default;
    virtual ~SignalGenerator() = default;
    SignalGenerator(const SignalGenerator &) = delete;
    SignalGenerator &operator=(const SignalGenerator &) = delete;

    /// Samples that are best computed in one call, a multiple of 8. The default leaves all arrays
    /// in the first cache.
    [[nodiscard]] virtual int blockSize() const { return 1024; }

    /// Computes the samples from index `first` on, as many as the spans hold. Calls follow each
    /// other without gaps; index 0 starts over.
    virtual void fill(int first, std::span<double> inPhase, std::span<double> quadrature) = 0;
};

namespace SignalConstants {
inline constexpr double Circle = 6.2831853;
inline constexpr double HalfCircle = 3.14159265;
inline constexpr double QuarterCircle = 1.570796325;
inline constexpr double Level = 0.707;
} // namespace SignalConstants

// The makers give nothing for a kind that doesn't exist. The fit must be that of the settings.

[[nodiscard]] std::unique_ptr<SignalGenerator> makeFunction(const FunctionSettings &settings,
                                                            const SignalFit &fit);

/// Draws the phases of the carriers with rand().
[[nodiscard]] std::unique_ptr<SignalGenerator>
makeMultiCarrier(const MultiCarrierSettings &settings, const SignalFit &fit);

/// Also gives nothing for a coded pulse without a pattern or without time for it.
[[nodiscard]] std::unique_ptr<SignalGenerator> makePulse(const PulseRecord &record,
                                                         const SignalFit &fit);
[[nodiscard]] std::unique_ptr<SignalGenerator> makeFm(const FmSettings &settings,
                                                      const SignalFit &fit);
[[nodiscard]] std::unique_ptr<SignalGenerator> makeAm(const AmSettings &settings,
                                                      const SignalFit &fit);
[[nodiscard]] std::unique_ptr<SignalGenerator> makePm(const PmSettings &settings,
                                                      const SignalFit &fit);
[[nodiscard]] std::unique_ptr<SignalGenerator> makeSweep(const SweepSettings &settings,
                                                         const SignalFit &fit);

/// Noise before the limit of its band; draws with rand().
[[nodiscard]] std::unique_ptr<SignalGenerator> makeNoise(const NoiseSettings &settings);
