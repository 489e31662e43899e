// SPDX-License-Identifier: Apache-2.0
// Signals against the literal loops: one sample at a time, double precision, the C library's sine,
// with the statistics and the same kind of stream. One thread, but for the carriers.
#include "base/parallel.h"
#include "dsp/CreateSignal.h"
#include "log/Tracer.h"
#include "streams/TempStream.h"

#include <benchmark/benchmark.h>

#include <cmath>
#include <complex>
#include <functional>
#include <vector>

namespace {

using Samples = std::vector<std::complex<float>>;

constexpr double T = 6.2831853;
constexpr int Count = 1000000;

/// Takes the samples of a literal loop.
class Sink
{
public:
    [[nodiscard]] bool open() { return m_stream.open(); }

    void put(double inPhase, double quadrature)
    {
        const double square = inPhase * inPhase + quadrature * quadrature;
        m_peak = std::max(m_peak, square);
        m_sum += square;
        const auto i = static_cast<float>(inPhase);
        const auto q = static_cast<float>(quadrature);
        m_ok = m_stream->writeBytes(4, &i) && m_stream->writeBytes(4, &q) && m_ok;
    }

    [[nodiscard]] bool restart() { return m_ok && m_stream->writeHeader("IQF"); }

    [[nodiscard]] Samples samples(int count)
    {
        Samples result(static_cast<size_t>(count));
        const bool ok =
            m_stream->checkHeader("IQF") && m_stream->readBytes(count * 8, result.data());
        return ok && m_ok ? result : Samples{};
    }

private:
    TempStream m_stream;
    double m_peak = 0;
    double m_sum = 0;
    bool m_ok = true;
};

int wordOf(float value)
{
    return static_cast<int>(value * 32767.0F + 0.5F);
}

struct Signal
{
    SignalType type;
    std::function<bool(CreateSignal &)> configure;
    std::function<void(Sink &)> literal;
};

Signal sine()
{
    FunctionSettings s;
    s.frequency = 100;
    s.phaseQ = 90;
    s.customOversampling = true;
    s.oversampling = Count;
    return {SignalType::Function, [s](CreateSignal &c) { return c.configureFunction(s); },
            [s](Sink &sink) {
                const double ph = s.phaseQ / 360.0 * T;
                for (int i = 0; i < Count; ++i) {
                    const double x = T * i / Count;
                    sink.put(std::sin(x) * s.amplitudeI + s.offsetI,
                             std::sin(x + ph) * s.amplitudeQ + s.offsetQ);
                }
            }};
}

/// Base 100 Hz, 2500 cycles of deviation: 10 000 x 100 samples.
Signal fm()
{
    const FmSettings s{FmKind::SingleTone, 100, 24999900, 0, 0};
    return {SignalType::Fm, [s](CreateSignal &c) { return c.configureFm(s); },
            [s](Sink &sink) {
                constexpr int samples = 999996;
                constexpr double clock = 99999600;
                double acc = 0;
                for (int i = 0; i < samples; ++i) {
                    acc += std::sin(T * (s.frequency1 / 100) * i / samples) * s.deviation1 / clock;
                    const double phi = T * acc;
                    sink.put(std::cos(phi), std::sin(phi));
                }
            }};
}

Signal sweep(SweepKind kind)
{
    const SweepSettings s{kind, 1.25e7, 0.01, 0, 360};
    return {SignalType::FmSweep, [s](CreateSignal &c) { return c.configureSweep(s); },
            [s](Sink &sink) {
                constexpr double clock = 1e8;
                double acc = 0;
                for (int i = 0; i < Count; ++i) {
                    const double e = T * i / Count;
                    const double frequency = s.kind == SweepKind::Linear
                                                 ? s.deviation * i / Count - s.deviation * 0.5
                                                 : s.deviation * 0.5 * std::sin(e);
                    acc += frequency / clock;
                    const double phi = T * acc;
                    sink.put(0.707 * std::cos(phi), 0.707 * std::sin(phi));
                }
            }};
}

/// The clock makes a million samples of 100 Hz.
Signal pm()
{
    const PmSettings s{100, 180};
    return {SignalType::Pm,
            [s](CreateSignal &c) {
                c.setMinClock(1e8);
                return c.configurePm(s);
            },
            [s](Sink &sink) {
                for (int i = 0; i < Count; ++i) {
                    const double phi = (s.deviation / 360.0) * std::sin(T * i / Count) * T;
                    sink.put(0.707 * std::cos(phi), 0.707 * std::sin(phi));
                }
            }};
}

Signal am()
{
    AmSettings s;
    s.kind = AmKind::Lsb;
    s.frequency1 = 100;
    return {SignalType::Am,
            [s](CreateSignal &c) {
                c.setMinClock(1e8);
                return c.configureAm(s);
            },
            [s](Sink &sink) {
                const double a = s.depth1 * 0.707 / 100;
                for (int i = 0; i < Count; ++i) {
                    const double x = T * i / Count;
                    sink.put(a * std::sin(x), a * std::sin(x + 1.570796325));
                }
            }};
}

/// Runs the generator; afterwards every word is compared with those of the literal loop.
void generate(benchmark::State &state, const Signal &test)
{
    setThreadLimit(1);
    TempStream stream;
    CreateSignal signal;
    signal.setSignalType(test.type);
    if (!stream.open() || !test.configure(signal)) {
        state.SkipWithError("not configured");
        return;
    }
    signal.setOutput(stream.stream());
    for (auto _ : state) {
        if (!signal.generate()) {
            state.SkipWithError("generate failed");
            return;
        }
    }
    Sink sink;
    if (!sink.open() || !sink.restart()) {
        state.SkipWithError("no stream");
        return;
    }
    test.literal(sink);
    const Samples expected = sink.samples(signal.sampleCount());
    const auto count = static_cast<size_t>(signal.sampleCount());
    Samples samples(count);
    if (expected.empty() || !stream->checkHeader("IQF") ||
        !stream->readBytes(static_cast<int>(count * 8), samples.data())) {
        state.SkipWithError("no samples");
        return;
    }
    for (size_t i = 0; i < count; ++i) {
        if (wordOf(samples[i].real()) != wordOf(expected[i].real()) ||
            wordOf(samples[i].imag()) != wordOf(expected[i].imag())) {
            state.SkipWithError("another word");
            return;
        }
    }
    state.SetItemsProcessed(state.iterations() * signal.sampleCount());
}

void literal(benchmark::State &state, const Signal &test)
{
    Sink sink;
    bool ok = sink.open();
    for (auto _ : state) {
        ok = ok && sink.restart();
        test.literal(sink);
    }
    if (!ok) {
        state.SkipWithError("no stream");
    }
    state.SetItemsProcessed(state.iterations() * Count);
}

/// 10 000 carriers, a million samples; the argument is the number of threads, 0 for all.
void BM_MultiCarrier(benchmark::State &state)
{
    setThreadLimit(static_cast<unsigned>(state.range(0)));
    TempStream stream;
    CreateSignal signal;
    signal.setSeed(1);
    signal.setMaxClock(6e8);
    signal.setSignalType(SignalType::MultiCarrier);
    if (!stream.open() || !signal.configureMultiCarrier({600, 10000, 0, true}) ||
        signal.sampleCount() != Count) {
        state.SkipWithError("not configured");
        return;
    }
    signal.setOutput(stream.stream());
    for (auto _ : state) {
        if (!signal.generate()) {
            state.SkipWithError("generate failed");
            return;
        }
    }
}

/// The literal loop over carriers for a thousand samples: the million takes a thousand times that.
void BM_MultiCarrierLiteralThousandth(benchmark::State &state)
{
    for (auto _ : state) {
        for (int i = 0; i < Count; i += 1000) {
            const double x = 600 * T * i / 6e8;
            double sum = 0;
            for (int k = 1; k <= 5000; ++k) {
                sum += std::sin(k * x + 1.0) + 0.0;
            }
            benchmark::DoNotOptimize(sum);
        }
    }
}

void registerAll()
{
    const std::vector<std::pair<const char *, Signal>> signalList{
        {"Sine", sine()},
        {"Fm", fm()},
        {"SweepLinear", sweep(SweepKind::Linear)},
        {"SweepSine", sweep(SweepKind::Sine)},
        {"Pm", pm()},
        {"Am", am()},
    };
    for (const auto &[name, test] : signalList) {
        const Signal copy = test;
        benchmark::RegisterBenchmark((std::string("BM_Generate/") + name).c_str(),
                                     [copy](benchmark::State &state) { generate(state, copy); })
            ->Unit(benchmark::kMillisecond);
        benchmark::RegisterBenchmark((std::string("BM_Literal/") + name).c_str(),
                                     [copy](benchmark::State &state) { literal(state, copy); })
            ->Unit(benchmark::kMillisecond);
    }
    benchmark::RegisterBenchmark("BM_MultiCarrier", BM_MultiCarrier)
        ->Arg(1)
        ->Arg(2)
        ->UseRealTime()
        ->Unit(benchmark::kMillisecond);
    benchmark::RegisterBenchmark("BM_MultiCarrierLiteralThousandth",
                                 BM_MultiCarrierLiteralThousandth)
        ->Unit(benchmark::kMillisecond);
}

} // namespace

int main(int argc, char **argv)
{
    Tracer::setMask(0);
    benchmark::Initialize(&argc, argv);
    registerAll();
    benchmark::RunSpecifiedBenchmarks();
    return 0;
}
