// SPDX-License-Identifier: Apache-2.0
#include "CreateSignal.h"

#include "Resample.h"
#include "base/ProgressClock.h"
#include "base/simd.h"
#include "dotkernels.h"
#include "log/Tracer.h"
#include "signalgenerators.h"
#include "streams/TempStream.h"
#include "streams/samplestream.h"

#include <QTime>

#include <algorithm>
#include <array>
#include <cmath>
#include <cstddef>
#include <cstdlib>
#include <vector>

namespace {

/// Shorter periods are repeated up to the smallest memory block of an instrument.
constexpr int MinStreamSamples = 512;

/// Converts to the records of a stream and takes the level, sample by sample: the order of a sum is
/// a part of its result.
CORVANE_CLONES void packSamples(const double *inPhase, const double *quadrature, std::size_t count,
                                float *iq, LevelSums &level)
{
    constexpr std::size_t Lanes = 8;
    double highest = level.peak;
    double sum = level.sum;
    for (std::size_t first = 0; first < count; first += Lanes) {
        const std::size_t used = std::min(Lanes, count - first);
        std::array<double, Lanes> squares;
        for (std::size_t i = 0; i < Lanes; ++i) {
            const double re = inPhase[first + i];
            const double im = quadrature[first + i];
            squares[i] = re * re + im * im;
            iq[2 * (first + i)] = static_cast<float>(re);
            iq[2 * (first + i) + 1] = static_cast<float>(im);
        }
        for (std::size_t i = 0; i < used; ++i) {
            highest = std::max(highest, squares[i]);
            sum += squares[i];
        }
    }
    level = {sum, highest};
}

[[nodiscard]] unsigned seedOfTheClock()
{
    const QTime now = QTime::currentTime();
    return static_cast<unsigned>(now.second() * 5 + now.minute() + 1);
}

} // namespace

/// The arrays of one run; whole vectors of samples fit, so the last ones may be too many.
class CreateSignal::Writer
{
public:
    Writer(CreateSignal &owner, SignalGenerator &generator)
        : m_owner(owner)
        , m_generator(generator)
        , m_inPhase(static_cast<std::size_t>(generator.blockSize()))
        , m_quadrature(m_inPhase.size())
        , m_packed(2 * m_inPhase.size())
    {
    }

    [[nodiscard]] bool write(int first, int count)
    {
        const auto used = static_cast<std::size_t>(count);
        const std::span<double> inPhase = std::span(m_inPhase).first(used);
        const std::span<double> quadrature = std::span(m_quadrature).first(used);
        m_generator.fill(first, inPhase, quadrature);
        LevelSums level{m_owner.m_rms, m_owner.m_peak};
        packSamples(m_inPhase.data(), m_quadrature.data(), used, m_packed.data(), level);
        m_owner.m_peak = level.peak;
        m_owner.m_rms = level.sum;
        m_owner.m_samplesWritten += count;
        return writeSamples(*m_owner.m_output, std::span(m_packed).first(2 * used)) ||
               Tracer::fail("*** Cannot write to output file.");
    }

private:
    CreateSignal &m_owner;
    SignalGenerator &m_generator;
    std::vector<double> m_inPhase;
    std::vector<double> m_quadrature;
    std::vector<float> m_packed;
};

CreateSignal::CreateSignal(QObject *parent)
    : QObject(parent)
    , m_bandLimit(std::make_unique<Resample>())
{
}

CreateSignal::~CreateSignal() = default;

void CreateSignal::setSignalType(SignalType type)
{
    m_type = type;
    m_configured = false;
    m_generated = false;
}

void CreateSignal::setOutput(BufferedIO *stream)
{
    if (stream != nullptr) {
        m_output = stream;
    }
}

void CreateSignal::cancel()
{
    m_cancelled = true;
    m_bandLimit->cancel();
}

bool CreateSignal::accept(const std::optional<SignalFit> &fit)
{
    m_generated = false;
    m_configured = fit.has_value();
    if (fit) {
        m_fit = *fit;
    }
    return m_configured;
}

bool CreateSignal::configureFunction(const FunctionSettings &settings)
{
    m_function = settings;
    return accept(fitFunction(settings, m_limits));
}

bool CreateSignal::configureMultiCarrier(const MultiCarrierSettings &settings)
{
    m_multiCarrier = settings;
    return accept(fitMultiCarrier(settings, m_limits));
}

bool CreateSignal::configurePulse(const PulseSettings &settings)
{
    m_pulse.kind = PulseKind::Single;
    m_pulse.pulse = settings;
    return accept(fitPulse(settings, m_limits));
}

bool CreateSignal::configureChirp(const ChirpSettings &settings)
{
    m_pulse.kind = PulseKind::Chirp;
    m_pulse.pulse = settings.pulse;
    m_pulse.chirpRange = settings.range;
    return accept(fitChirp(settings, m_limits));
}

bool CreateSignal::configureFm(const FmSettings &settings)
{
    m_fm = settings;
    return accept(fitFm(settings, m_limits));
}

bool CreateSignal::configureAm(const AmSettings &settings)
{
    m_am = settings;
    return accept(fitAm(settings, m_limits));
}

bool CreateSignal::configurePm(const PmSettings &settings)
{
    m_pm = settings;
    return accept(fitPm(settings, m_limits));
}

bool CreateSignal::configureSweep(const SweepSettings &settings)
{
    m_sweep = settings;
    return accept(fitSweep(settings, m_limits));
}

bool CreateSignal::configureNoise(const NoiseSettings &settings)
{
    m_noise = settings;
    return accept(fitNoise(settings, m_limits));
}

bool CreateSignal::isPeriodic() const
{
    return m_type != SignalType::Pulse && m_type != SignalType::FmSweep &&
           m_type != SignalType::Noise;
}

std::unique_ptr<SignalGenerator> CreateSignal::makeGenerator() const
{
    const char *message = "*** Invalid signal type.";
    std::unique_ptr<SignalGenerator> generator;
    switch (m_type) {
    case SignalType::Function:
        generator = makeFunction(m_function, m_fit);
        break;
    case SignalType::MultiCarrier:
        generator = makeMultiCarrier(m_multiCarrier, m_fit);
        break;
    case SignalType::Fm:
        message = "*** Invalid FM signal type.";
        generator = makeFm(m_fm, m_fit);
        break;
    case SignalType::Pulse:
        message = "*** Invalid pulse type.";
        generator = makePulse(m_pulse, m_fit);
        break;
    case SignalType::Pm:
        generator = makePm(m_pm, m_fit);
        break;
    case SignalType::Am:
        message = "*** Invalid AM signal type.";
        generator = makeAm(m_am, m_fit);
        break;
    case SignalType::FmSweep:
        generator = makeSweep(m_sweep, m_fit);
        break;
    case SignalType::Noise:
        generator = makeNoise(m_noise);
        break;
    }
    if (!generator) {
        Tracer::Trace(Tracer::Error, message);
    }
    return generator;
}

bool CreateSignal::generate()
{
    m_cancelled = false;
    if (m_output == nullptr) {
        return Tracer::fail("*** No output device set.");
    }
    if (!m_configured) {
        return Tracer::fail("*** Waveform not yet configured.");
    }
    m_generated = false;
    if (!m_output->writeHeader(BufferedIO::DataHeader)) {
        return Tracer::fail("*** Cannot write to output file.");
    }
    std::srand(m_seed.value_or(seedOfTheClock()));
    const std::unique_ptr<SignalGenerator> generator = makeGenerator();
    m_generated =
        generator && writeSignal(*generator) && (m_type != SignalType::Noise || limitBand());
    return m_generated;
}

bool CreateSignal::writeSignal(SignalGenerator &generator)
{
    m_peak = 0;
    m_rms = 0;
    m_samplesWritten = 0;
    const int samples = m_fit.samples;
    const bool isRepeated = isPeriodic() && samples < MinStreamSamples;
    const int passes = isRepeated ? (MinStreamSamples + samples - 1) / samples : 1;
    const double total = static_cast<double>(samples) * passes;
    ProgressClock clock([this](int percent) { emit ProgressUpdate(percent); }, m_cancelled);
    Writer writer(*this, generator);
    for (int pass = 0; pass < passes; ++pass) {
        for (int first = 0; first < samples;) {
            const int count = std::min(samples - first, generator.blockSize());
            const double done = static_cast<double>(pass) * MinStreamSamples + first;
            if (clock.shouldStop(static_cast<int>(done * 100.0 / total)) || m_cancelled) {
                return Tracer::fail("*** User break.");
            }
            if (!writer.write(first, count)) {
                return false;
            }
            first += count;
        }
    }
    m_peak = std::sqrt(m_peak);
    m_rms = std::sqrt(m_rms / m_samplesWritten);
    return true;
}

bool CreateSignal::limitBand()
{
    TempStream filtered;
    if (!filtered.open()) {
        return Tracer::fail("*** Cannot create temporary data buffer.");
    }
    const int samples = m_fit.samples;
    m_bandLimit->setFilterFrequency(m_fit.clock, m_noise.bandwidth * 0.5);
    m_bandLimit->setFilterLength(101);
    m_bandLimit->setInput(m_output, samples);
    m_bandLimit->setOutput(filtered.stream(), samples);
    if (!m_bandLimit->run()) {
        return false;
    }
    m_peak = levelOfOffset(m_bandLimit->peakOffset());
    m_rms = levelOfOffset(m_bandLimit->rmsOffset());
    if (!m_output->writeHeader(BufferedIO::DataHeader)) {
        return Tracer::fail("*** Cannot write to output file.");
    }
    if (!filtered->checkHeader(BufferedIO::DataHeader)) {
        return Tracer::fail("*** Cannot read the filtered noise.");
    }
    bool written = true;
    const BlockLoop copied = forEachBlock(
        *filtered.stream(), samples, [](qint64) { return false; },
        [&](std::span<const float> iq, qint64) {
            written = writeSamples(*m_output, iq);
            return written;
        });
    if (!written) {
        return Tracer::fail("*** Cannot write to output file.");
    }
    return copied.end == BlockLoop::Done || Tracer::fail("*** Cannot read the filtered noise.");
}

bool CreateSignal::statistics(int *samplesWritten, double *rms, double *peak) const
{
    if (samplesWritten == nullptr || rms == nullptr || peak == nullptr || !m_generated) {
        return false;
    }
    *samplesWritten = m_samplesWritten;
    *rms = m_rms;
    *peak = m_peak;
    return true;
}
