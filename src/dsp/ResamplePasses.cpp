// SPDX-License-Identifier: Apache-2.0
#include "Resample.h"

#include "base/ProgressClock.h"
#include "base/parallel.h"
#include "base/simd.h"
#include "dotkernels.h"
#include "log/Tracer.h"
#include "streams/samplestream.h"
#include "vectormath.h"

#include <algorithm>
#include <cmath>
#include <cstddef>
#include <numbers>
#include <vector>

namespace {

constexpr double Circle = 2 * std::numbers::pi;

[[nodiscard]] bool failAtSample(const char *what, qint64 sample)
{
    return Tracer::fail(
        QString("*** %1 failed for sample %2.").arg(QLatin1String(what)).arg(sample));
}

/// The first sample of a block from `first` on that a failed write has lost: blocks reach the
/// device only when the write buffer, which holds the header too, is full.
qint64 failedWriteSample(const BufferedIO &stream, qint64 first)
{
    const qint64 start = BufferedIO::HeaderSize + first * BufferedIO::RecordSize;
    const qint64 boundary = (start / stream.bufferSize() + 1) * stream.bufferSize();
    return (boundary - BufferedIO::HeaderSize) / BufferedIO::RecordSize;
}

CORVANE_CLONES void scale(std::span<float> iq, float gain)
{
    for (float &value : iq) {
        value *= gain;
    }
}

/// Turns each sample by the angle whose sine and cosine are given.
CORVANE_CLONES void rotate(std::span<float> iq, const double *sine, const double *cosine)
{
    for (size_t i = 0; i < iq.size() / 2; ++i) {
        const double re = iq[2 * i];
        const double im = iq[2 * i + 1];
        const bool onAxis = re == 0;
        const double x = onAxis ? std::abs(im) : re;
        const double y = onAxis ? 0.0 : im;
        iq[2 * i] = static_cast<float>(x * cosine[i] - y * sine[i]);
        iq[2 * i + 1] = static_cast<float>(x * sine[i] + y * cosine[i]);
    }
}

/// Sine and cosine of the phase of cartesianToPolar are those of the vector itself but for the
/// imaginary axis, where it is a full circle.
CORVANE_CLONES void splitPolar(std::span<const float> iq, std::span<float> phase,
                               std::span<float> amplitude, double offset, double gain)
{
    // The double closest to a full circle misses it by this much.
    constexpr double FullCircleSine = 2.4492935982947064e-16;
    constexpr double HalfCircleSine = 1.2246467991473532e-16;
    for (size_t i = 0; i < iq.size() / 2; ++i) {
        const double re = iq[2 * i];
        const double im = iq[2 * i + 1];
        const double magnitude = std::sqrt(re * re + im * im);
        const bool onAxis = re == 0;
        const double axisSine = im > 0 ? -FullCircleSine : FullCircleSine;
        const double realAxisSine = re < 0 ? HalfCircleSine : 0.0;
        const double divisor = onAxis ? 1.0 : magnitude;
        const double sine = im == 0 ? realAxisSine : im / divisor;
        phase[2 * i] = static_cast<float>(onAxis ? 1.0 : re / divisor);
        phase[2 * i + 1] = static_cast<float>(-(onAxis ? axisSine : sine));
        amplitude[2 * i] = static_cast<float>(((2 * magnitude) - 1.0) * gain + offset);
        amplitude[2 * i + 1] = 0.0F;
    }
}

/// The passes' common loop over a stream whose first sample is next to be read. `work` takes a
/// block of samples and its first index, and gives false if it has failed and said why.
template <typename Work>
[[nodiscard]] bool passOver(BufferedIO &stream, int samples, ProgressClock &clock, Work work)
{
    const BlockLoop loop = forEachBlock(
        stream, samples, [&](qint64 done) { return clock.shouldStop(percentOf(done, samples)); },
        work);
    switch (loop.end) {
    case BlockLoop::Stopped:
        return Tracer::fail("*** Action aborted by user.");
    case BlockLoop::ReadFailed:
        return failAtSample("Reading", loop.position);
    case BlockLoop::WorkFailed:
    case BlockLoop::Done:
        break;
    }
    return loop.end == BlockLoop::Done;
}

} // namespace

bool Resample::transformInPlace(int samples, BufferedIO *stream, const BlockWork &work)
{
    m_cancelled = false;
    if (samples < 1) {
        return Tracer::fail("*** Invalid input data length.");
    }
    if (stream == nullptr) {
        return Tracer::fail("*** Invalid data buffer.");
    }
    if (!stream->checkHeader(BufferedIO::DataHeader)) {
        return Tracer::fail("*** Cannot validate data stream header.");
    }
    if (!stream->writeBytes(BufferedIO::HeaderSize, BufferedIO::DataHeader)) {
        return Tracer::fail("*** Cannot write to data buffer.");
    }
    ProgressClock clock([this](int percent) { emit ProgressUpdate(percent); }, m_cancelled);
    return passOver(*stream, samples, clock, [&](std::span<float> iq, qint64 first) {
        work(iq);
        return writeSamples(*stream, iq) ||
               failAtSample("Writing", failedWriteSample(*stream, first));
    });
}

bool Resample::rescale(int samples, double factor, BufferedIO *stream)
{
    const auto gain = static_cast<float>(factor);
    if (!std::isfinite(gain)) {
        return Tracer::fail(QString("*** Invalid scaling factor %1.").arg(factor));
    }
    return transformInPlace(samples, stream, [gain](std::span<float> iq) { scale(iq, gain); });
}

bool Resample::frequencyShift(int samples, double frequency, double clock, BufferedIO *stream)
{
    const double step = frequency * Circle / clock;
    // An angle that large has no fraction of a circle left.
    constexpr double MaxAngle = 1e15;
    if (!(std::abs(step) * std::max(samples, 1) <= MaxAngle)) {
        return Tracer::fail(QString("*** Invalid frequency shift of %1 Hz at a clock of %2 Hz.")
                                .arg(frequency)
                                .arg(clock));
    }
    double angle = 0.0;
    std::vector<double> angles(StreamBlockSamples);
    std::vector<double> sine(StreamBlockSamples);
    std::vector<double> cosine(StreamBlockSamples);
    constexpr size_t Part = StreamBlockSamples / 8;
    const auto turn = [&](std::span<float> iq) {
        // The sum is taken sample by sample: its roundings are a part of the result.
        const size_t count = iq.size() / 2;
        for (size_t i = 0; i < count; ++i) {
            angles[i] = angle;
            angle += step;
        }
        parallelFor((count + Part - 1) / Part, [&](size_t part) {
            const size_t first = part * Part;
            const size_t length = std::min(Part, count - first);
            sinCos(std::span(angles).subspan(first, length), std::span(sine).subspan(first, length),
                   std::span(cosine).subspan(first, length));
            rotate(iq.subspan(2 * first, 2 * length), sine.data() + first, cosine.data() + first);
        });
    };
    if (!transformInPlace(samples, stream, turn)) {
        return false;
    }
    return stream->restartAtBegining() || Tracer::fail("*** Cannot write to data buffer.");
}

bool Resample::polarSplit(int samples, BufferedIO *source, BufferedIO *phase, BufferedIO *amplitude,
                          double offset, double gain, PolarLevels *levels)
{
    m_cancelled = false;
    if (samples < 1) {
        return Tracer::fail("*** Invalid input data length.");
    }
    if (source == nullptr || phase == nullptr || amplitude == nullptr) {
        return Tracer::fail("*** Invalid data buffer.");
    }
    if (!std::isfinite(offset) || !std::isfinite(gain)) {
        return Tracer::fail(
            QString("*** Invalid amplitude offset %1 or gain %2.").arg(offset).arg(gain));
    }
    if (!source->checkHeader(BufferedIO::DataHeader)) {
        return Tracer::fail("*** Cannot validate data stream header.");
    }
    if (!phase->restartAtBegining()) {
        return Tracer::fail("*** Cannot setup phase output buffer.");
    }
    if (!amplitude->restartAtBegining()) {
        return Tracer::fail("*** Cannot setup amplitude output buffer.");
    }
    if (!phase->writeBytes(BufferedIO::HeaderSize, BufferedIO::DataHeader)) {
        return Tracer::fail("*** Cannot write to phase data buffer.");
    }
    if (!amplitude->writeBytes(BufferedIO::HeaderSize, BufferedIO::DataHeader)) {
        return Tracer::fail("*** Cannot write to amplitude data buffer.");
    }
    std::vector<float> phaseBlock(floatsOf(StreamBlockSamples));
    std::vector<float> amplitudeBlock(floatsOf(StreamBlockSamples));
    ProgressClock clock([this](int percent) { emit ProgressUpdate(percent); }, m_cancelled);
    return passOver(*source, samples, clock, [&](std::span<float> iq, qint64 first) {
        const std::span<float> phasePart = std::span(phaseBlock).first(iq.size());
        const std::span<float> amplitudePart = std::span(amplitudeBlock).first(iq.size());
        splitPolar(iq, phasePart, amplitudePart, offset, gain);
        if (levels != nullptr) {
            addLevels(phasePart, levels->phase);
            addLevels(amplitudePart, levels->amplitude);
        }
        if (!writeSamples(*phase, phasePart)) {
            return failAtSample("Writing phase data", failedWriteSample(*phase, first));
        }
        return writeSamples(*amplitude, amplitudePart) ||
               failAtSample("Writing amplitude data", failedWriteSample(*amplitude, first));
    });
}

bool Resample::statistics(int samples, BufferedIO *stream, double *peak, double *rms)
{
    m_cancelled = false;
    if (stream == nullptr || peak == nullptr || rms == nullptr) {
        return Tracer::fail("*** Invalid input arguments.");
    }
    if (samples < 1) {
        return Tracer::fail("*** Invalid input data length.");
    }
    if (!stream->checkHeader(BufferedIO::DataHeader)) {
        return Tracer::fail("*** Cannot validate data stream header.");
    }
    LevelSums level;
    ProgressClock clock([this](int percent) { emit ProgressUpdate(percent); }, m_cancelled);
    const bool done = passOver(*stream, samples, clock, [&](std::span<const float> iq, qint64) {
        addLevels(iq, level);
        return true;
    });
    if (done) {
        *rms = level.rmsLevel(samples);
        *peak = level.peakLevel();
    }
    return done;
}
