// SPDX-License-Identifier: Apache-2.0
#include "signalfit.h"

#include "log/Tracer.h"

#include <QString>
#include <QtGlobal>

#include <algorithm>
#include <cmath>
#include <initializer_list>
#include <limits>
#include <utility>

namespace {

/// Most samples of the kinds that limit themselves.
constexpr double MaxFittedSamples = 1e6;

void logError(const QString &text)
{
    Tracer::Trace(Tracer::Error, text);
}

/// Says why and is always true.
bool refuseUpper()
{
    logError("The required ARB clock rate exceeds the upper limit. Check settings.");
    return true;
}

/// Says why and is always true.
bool refuseLower()
{
    logError("The required ARB clock rate exceeds the lower limit. Check settings.");
    return true;
}

/// Drops the fraction; values beyond the range give its ends and not-a-number gives 0.
qint64 truncated(double value)
{
    constexpr double Limit = 0x1p62;
    return std::isnan(value) ? 0 : static_cast<qint64>(std::clamp(value, -Limit, Limit));
}

int truncatedToInt(double value)
{
    return static_cast<int>(std::clamp<qint64>(truncated(value), std::numeric_limits<int>::min(),
                                               std::numeric_limits<int>::max()));
}

/// Euclid's remainder method; a second operand that isn't above zero gives the first one.
qint64 greatestCommonDivisor(qint64 a, qint64 b)
{
    while (b > 0) {
        a = std::exchange(b, a % b);
    }
    return a;
}

struct NamedValue
{
    const char *name;
    double value;
};

bool areFinite(std::initializer_list<NamedValue> values)
{
    for (const NamedValue &entry : values) {
        if (!std::isfinite(entry.value)) {
            logError(QString("The %1 is %2, but it must be a finite number. Check settings.")
                         .arg(QLatin1String(entry.name))
                         .arg(entry.value));
            return false;
        }
    }
    return true;
}

bool arePositive(std::initializer_list<NamedValue> values)
{
    for (const NamedValue &entry : values) {
        if (!std::isfinite(entry.value) || entry.value <= 0) {
            logError(QString("The %1 is %2, but it must be above 0. Check settings.")
                         .arg(QLatin1String(entry.name))
                         .arg(entry.value));
            return false;
        }
    }
    return true;
}

bool areNotNegative(std::initializer_list<NamedValue> values)
{
    for (const NamedValue &entry : values) {
        if (!std::isfinite(entry.value) || entry.value < 0) {
            logError(QString("The %1 is %2, but it must not be below 0. Check settings.")
                         .arg(QLatin1String(entry.name))
                         .arg(entry.value));
            return false;
        }
    }
    return true;
}

bool areValid(const ClockLimits &limits)
{
    if (!arePositive({{"lowest ARB clock rate", limits.minClock},
                      {"highest ARB clock rate", limits.maxClock}})) {
        return false;
    }
    if (limits.minClock > limits.maxClock) {
        logError(QString("The lowest ARB clock rate of %1 Hz is above the highest one of %2 Hz. "
                         "Check settings.")
                     .arg(limits.minClock)
                     .arg(limits.maxClock));
        return false;
    }
    return true;
}

/// The end of every fit: a count that makes a signal, and the warning of short ones.
bool checkCount(const SignalFit &fit, const ClockLimits &limits)
{
    if (fit.samples < 1) {
        logError("The signal is shorter than one sample. Check settings.");
        return false;
    }
    if (fit.samples < limits.minSamples) {
        Tracer::Trace(
            Tracer::Warning,
            QString("The number of samples is less than %1. Check settings.").arg(fit.samples));
    }
    return true;
}

bool checkCountAndLimit(const SignalFit &fit, const ClockLimits &limits)
{
    if (!checkCount(fit, limits)) {
        return false;
    }
    if (fit.samples > MaxFittedSamples) {
        logError(
            QString("The number of samples exceeds %1. Check settings.").arg(MaxFittedSamples));
        return false;
    }
    return true;
}

/// The wanted count if the clock allows it, else the nearest that it allows.
struct FrequencyFit
{
    SignalFit fit;
    bool lowered = false; ///< the clock would have been too high
};

FrequencyFit fitFrequency(double frequency, double wantedSamples, const ClockLimits &limits)
{
    FrequencyFit result;
    SignalFit &fit = result.fit;
    fit.samples = truncatedToInt(wantedSamples);
    fit.clock = fit.samples * frequency;
    if (fit.clock < limits.minClock) {
        fit.samples = truncatedToInt(limits.minClock / frequency);
        fit.clock = fit.samples * frequency;
    }
    if (fit.clock > limits.maxClock) {
        fit.samples = truncatedToInt(limits.maxClock / frequency);
        fit.clock = fit.samples * frequency;
        result.lowered = true;
    }
    return result;
}

std::optional<SignalFit> fitPulseClock(const PulseSettings &settings, double clock,
                                       const ClockLimits &limits)
{
    if (!areNotNegative({{"rise time", settings.riseTime},
                         {"pulse on time", settings.onTime},
                         {"fall time", settings.fallTime},
                         {"blank time", settings.blankTime}})) {
        return {};
    }
    const double duration =
        settings.riseTime + settings.onTime + settings.fallTime + settings.blankTime;
    SignalFit fit;
    fit.clock = clock;
    fit.samples = truncatedToInt(duration * clock + 0.5);
    if ((clock > limits.maxClock && refuseUpper()) || (clock < limits.minClock && refuseLower()) ||
        !checkCountAndLimit(fit, limits)) {
        return {};
    }
    return fit;
}

std::optional<SignalFit> fitTwoToneAm(const AmSettings &settings, const ClockLimits &limits)
{
    if (!arePositive({{"modulation frequency of the 2nd tone", settings.frequency2}})) {
        return {};
    }
    const auto base = static_cast<double>(
        greatestCommonDivisor(truncated(settings.frequency2), truncated(settings.frequency1)));
    const double cycles1 = base > 0 ? std::trunc(settings.frequency1 / base) : 0;
    const double cycles2 = base > 0 ? std::trunc(settings.frequency2 / base) : 0;
    if (cycles1 < 1 || cycles2 < 1) {
        logError("Invalid AM configuration.");
        return {};
    }
    SignalFit fit;
    const double samples = std::max(4 * std::max(cycles1, cycles2), 1024.0);
    fit.samples = truncatedToInt(samples);
    fit.period1 = samples / cycles1;
    fit.period2 = samples / cycles2;
    fit.clock = fit.period1 * settings.frequency1;
    const auto fixClock = [&](double clock) {
        fit.clock = clock;
        fit.period1 = clock / settings.frequency1;
        fit.period2 = clock / settings.frequency2;
        fit.samples = truncatedToInt(fit.period1 / cycles1);
    };
    if (fit.clock < limits.minClock) {
        fixClock(limits.minClock);
    }
    if (fit.clock > limits.maxClock) {
        fixClock(limits.maxClock);
    }
    if ((fit.samples < 4 && refuseUpper()) || !checkCountAndLimit(fit, limits)) {
        return {};
    }
    return fit;
}

} // namespace

std::optional<SignalFit> fitFunction(const FunctionSettings &settings, const ClockLimits &limits)
{
    if (!areValid(limits) || !arePositive({{"frequency", settings.frequency}}) ||
        !areFinite({{"I signal amplitude", settings.amplitudeI},
                    {"Q signal amplitude", settings.amplitudeQ},
                    {"I signal offset", settings.offsetI},
                    {"Q signal offset", settings.offsetQ},
                    {"Q signal phase offset", settings.phaseQ}})) {
        return {};
    }
    const int wanted = settings.customOversampling ? settings.oversampling : 1000;
    const FrequencyFit result = fitFrequency(settings.frequency, wanted, limits);
    if ((result.lowered && result.fit.samples < 8 && refuseUpper()) ||
        !checkCount(result.fit, limits)) {
        return {};
    }
    return result.fit;
}

std::optional<SignalFit> fitMultiCarrier(const MultiCarrierSettings &settings,
                                         const ClockLimits &limits)
{
    if (!areValid(limits) || !arePositive({{"frequency spacing", settings.spacing}}) ||
        !areFinite({{"I signal offset", settings.offsetI}})) {
        return {};
    }
    if (settings.carriers < 2) {
        logError(QString("The number of carriers is %1, but it must be at least 2. Check settings.")
                     .arg(settings.carriers));
        return {};
    }
    const int half = settings.carriers / 2; // on each side of zero
    const FrequencyFit result = fitFrequency(settings.spacing, half * 512.0, limits);
    if ((result.fit.samples < half * 4.0 && refuseUpper()) || !checkCount(result.fit, limits)) {
        return {};
    }
    return result.fit;
}

std::optional<SignalFit> fitPulse(const PulseSettings &settings, const ClockLimits &limits)
{
    if (!areValid(limits) || !arePositive({{"time resolution", settings.timeResolution}})) {
        return {};
    }
    return fitPulseClock(settings, 1 / settings.timeResolution, limits);
}

std::optional<SignalFit> fitChirp(const ChirpSettings &settings, const ClockLimits &limits)
{
    if (!areValid(limits) || !arePositive({{"time resolution", settings.pulse.timeResolution}}) ||
        !areFinite({{"chirp range", settings.range}})) {
        return {};
    }
    return fitPulseClock(settings.pulse,
                         std::max(1 / settings.pulse.timeResolution, settings.range), limits);
}

std::optional<SignalFit> fitFm(const FmSettings &settings, const ClockLimits &limits)
{
    const bool twoTone = settings.kind == FmKind::TwoTone;
    if (!areValid(limits) || !areFinite({{"modulation frequency", settings.frequency1},
                                         {"deviation", settings.deviation1}})) {
        return {};
    }
    if (twoTone && !areFinite({{"modulation frequency of the 2nd tone", settings.frequency2},
                               {"deviation of the 2nd tone", settings.deviation2}})) {
        return {};
    }
    qint64 base = 0;
    double highest = 0;
    if (settings.kind == FmKind::SingleTone) {
        base =
            greatestCommonDivisor(truncated(settings.frequency1), truncated(settings.deviation1));
        highest = std::max(settings.frequency1, settings.deviation1);
    } else if (twoTone) {
        base = greatestCommonDivisor(
            greatestCommonDivisor(truncated(settings.frequency1), truncated(settings.frequency2)),
            greatestCommonDivisor(truncated(settings.deviation1), truncated(settings.deviation2)));
        highest = std::max(
            {settings.frequency1, settings.deviation1, settings.frequency2, settings.deviation2});
    }
    SignalFit fit;
    fit.base = static_cast<double>(base);
    const double ratio = base > 0 ? std::trunc(highest / fit.base) : 0;
    if (ratio < 1) {
        logError("Invalid FM configuration.");
        return {};
    }
    const double required = 4 * ratio;
    const SignalFit clocked = fitFrequency(fit.base, std::max(required, 1024.0), limits).fit;
    fit.samples = clocked.samples;
    fit.clock = clocked.clock;
    if ((fit.samples < required && refuseUpper()) || !checkCountAndLimit(fit, limits)) {
        return {};
    }
    return fit;
}

std::optional<SignalFit> fitAm(const AmSettings &settings, const ClockLimits &limits)
{
    if (!areValid(limits) || !arePositive({{"modulation frequency", settings.frequency1}}) ||
        !areFinite({{"modulation depth", settings.depth1},
                    {"modulation depth of the 2nd tone", settings.depth2}})) {
        return {};
    }
    if (settings.kind == AmKind::TwoTone || settings.kind == AmKind::TwoToneNoCarrier) {
        return fitTwoToneAm(settings, limits);
    }
    const SignalFit fit = fitFrequency(settings.frequency1, 1024, limits).fit;
    if ((fit.samples < 4 && refuseUpper()) || !checkCountAndLimit(fit, limits)) {
        return {};
    }
    return fit;
}

std::optional<SignalFit> fitPm(const PmSettings &settings, const ClockLimits &limits)
{
    if (!areValid(limits) || !arePositive({{"modulation frequency", settings.frequency}}) ||
        !areFinite({{"deviation", settings.deviation}})) {
        return {};
    }
    const SignalFit fit = fitFrequency(settings.frequency, 1024, limits).fit;
    if ((fit.samples < 4 && refuseUpper()) || !checkCountAndLimit(fit, limits)) {
        return {};
    }
    return fit;
}

std::optional<SignalFit> fitSweep(const SweepSettings &settings, const ClockLimits &limits)
{
    if (!areValid(limits) || !arePositive({{"sweep time", settings.sweepTime}}) ||
        !areFinite({{"deviation", settings.deviation},
                    {"start phase", settings.startPhase},
                    {"stop phase", settings.stopPhase}})) {
        return {};
    }
    SignalFit fit;
    const auto take = [&](double samples) {
        fit.samples = truncatedToInt(samples);
        fit.clock = fit.samples / settings.sweepTime;
    };
    take(8 * settings.deviation * settings.sweepTime);
    if (fit.clock < limits.minClock) {
        take(limits.minClock * settings.sweepTime);
    }
    if (fit.clock > limits.maxClock) {
        take(limits.maxClock * settings.sweepTime);
    }
    if ((fit.clock < 8 * settings.deviation && refuseUpper()) || !checkCountAndLimit(fit, limits)) {
        return {};
    }
    return fit;
}

std::optional<SignalFit> fitNoise(const NoiseSettings &settings, const ClockLimits &limits)
{
    if (!areValid(limits) || !arePositive({{"noise bandwidth", settings.bandwidth},
                                           {"duration of the noise", settings.duration}})) {
        return {};
    }
    SignalFit fit;
    fit.clock = 1.5 * settings.bandwidth;
    fit.samples = truncatedToInt(settings.duration * fit.clock);
    if ((fit.clock > limits.maxClock && refuseUpper()) ||
        (fit.clock < limits.minClock && refuseLower()) || !checkCountAndLimit(fit, limits)) {
        return {};
    }
    return fit;
}
