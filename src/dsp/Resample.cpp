// SPDX-License-Identifier: Apache-2.0
#include "Resample.h"

#include "base/ProgressClock.h"
#include "log/Tracer.h"
#include "samplestream.h"

#include <algorithm>
#include <cmath>
#include <vector>

namespace {

[[nodiscard]] bool fail(const QString &text)
{
    Tracer::Trace(Tracer::Error, text);
    return false;
}

[[nodiscard]] bool failAtSample(const char *what, qint64 sample)
{
    return fail(QString("*** %1 failed for sample %2.").arg(QLatin1String(what)).arg(sample));
}

/// The first sample of a block behind `first` that a failed write has lost: blocks reach the device
/// only when the write buffer, which holds the header too, is full.
qint64 failedWriteSample(qint64 first)
{
    const qint64 start = BufferedIO::HeaderSize + first * BufferedIO::RecordSize;
    const qint64 boundary = (start / BufferedIO::BufferSize + 1) * BufferedIO::BufferSize;
    return (boundary - BufferedIO::HeaderSize) / BufferedIO::RecordSize;
}

} // namespace

Resample::Resample(QObject *parent)
    : QObject(parent)
{
}

void Resample::cancel()
{
    m_cancelled = true;
}

bool Resample::transformInPlace(int samples, BufferedIO *stream, const BlockWork &work)
{
    m_cancelled = false;
    if (samples < 1) {
        return fail("*** Invalid input data length.");
    }
    if (stream == nullptr) {
        return fail("*** Invalid data buffer.");
    }
    if (!stream->checkHeader("IQF")) {
        return fail("*** Cannot validate data stream header.");
    }
    if (!stream->writeBytes(BufferedIO::HeaderSize, "IQF")) {
        return fail("*** Cannot write to data buffer.");
    }
    std::vector<float> block(2 * static_cast<size_t>(std::min(samples, StreamBlockSamples)));
    ProgressClock clock([this](int percent) { emit ProgressUpdate(percent); }, m_cancelled);
    for (int done = 0; done < samples;) {
        if (clock.shouldStop(percentOf(done, samples))) {
            return fail("*** Action aborted by user.");
        }
        const int count = std::min(samples - done, StreamBlockSamples);
        const std::span<float> iq(block.data(), 2 * static_cast<size_t>(count));
        const int got = readSamples(*stream, iq);
        const std::span<float> read = iq.first(2 * static_cast<size_t>(got));
        work(read);
        if (got > 0 && !writeSamples(*stream, read)) {
            return failAtSample("Writing", failedWriteSample(done));
        }
        if (got < count) {
            return failAtSample("Reading", done + got);
        }
        done += count;
    }
    return true;
}

bool Resample::rescale(int samples, double factor, BufferedIO *stream)
{
    const auto gain = static_cast<float>(factor);
    return transformInPlace(samples, stream, [gain](std::span<float> iq) {
        for (float &value : iq) {
            value *= gain;
        }
    });
}

bool Resample::statistics(int samples, BufferedIO *stream, double *peak, double *rms)
{
    m_cancelled = false;
    if (stream == nullptr || peak == nullptr || rms == nullptr) {
        return fail("*** Invalid input arguments.");
    }
    if (samples < 1) {
        return fail("*** Invalid input data length.");
    }
    if (!stream->checkHeader("IQF")) {
        return fail("*** Cannot validate data stream header.");
    }
    std::vector<float> block(2 * static_cast<size_t>(std::min(samples, StreamBlockSamples)));
    ProgressClock clock([this](int percent) { emit ProgressUpdate(percent); }, m_cancelled);
    double highest = 0;
    double sum = 0;
    for (int done = 0; done < samples;) {
        if (clock.shouldStop(percentOf(done, samples))) {
            return fail("*** Action aborted by user.");
        }
        const int count = std::min(samples - done, StreamBlockSamples);
        const int got = readSamples(*stream, {block.data(), 2 * static_cast<size_t>(count)});
        if (got < count) {
            return failAtSample("Reading", done + got);
        }
        for (size_t i = 0; i < 2 * static_cast<size_t>(count); i += 2) {
            const double inPhase = block[i];
            const double quadrature = block[i + 1];
            const double square = inPhase * inPhase + quadrature * quadrature;
            highest = std::max(highest, square);
            sum += square;
        }
        done += count;
    }
    *rms = std::sqrt(sum / samples);
    *peak = std::sqrt(highest);
    return true;
}
