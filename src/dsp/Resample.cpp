// SPDX-License-Identifier: Apache-2.0
#include "Resample.h"

#include "windows.h"

#include "LoopedInput.h"
#include "TapGeometry.h"
#include "base/ProgressClock.h"
#include "base/parallel.h"
#include "interpolator.h"
#include "log/Tracer.h"
#include "streams/samplestream.h"

#include <algorithm>
#include <cmath>
#include <cstddef>
#include <cstdint>
#include <utility>
#include <vector>

namespace {

/// Outputs between two looks at the clock: a block, the one before and their inputs shall stay in
/// the second cache.
constexpr qint64 MaxBlockOutputs = 96LL * 1024;

/// Products in a block, some 10 ms of one core.
constexpr qint64 MaxBlockProducts = 16LL * 1024 * 1024;

/// Parts of a block that go to the processors. The level is summed part by part, so that it doesn't
/// depend on the number of threads.
constexpr qint64 PartsPerBlock = 24;

/// Samples of the input window that a block may need.
constexpr qint64 MaxBlockInput = 512LL * 1024;

/// Keeps the offset of silence finite, at 240 dB.
constexpr double OffsetFloor = 1e-12;

/// Carries markers to the outputs. The positions of outputs never fall.
class MarkerCopy
{
public:
    MarkerCopy(BufferedIO *input, BufferedIO *output, const TapGeometry &geometry)
        : m_input(input)
        , m_output(output)
        , m_geometry(geometry)
    {
    }

    [[nodiscard]] bool open()
    {
        if (!isWanted()) {
            return true;
        }
        if (!m_input->restartAtBegining()) {
            return Tracer::fail("*** Cannot read marker data.");
        }
        return m_output->restartAtBegining() || Tracer::fail("*** Cannot write marker output.");
    }

    [[nodiscard]] bool copy(qint64 begin, qint64 end)
    {
        if (!isWanted()) {
            return true;
        }
        const auto last = static_cast<qint64>(m_geometry.inputPosition(end - 1));
        const int missing = static_cast<int>(last - m_position);
        m_bytes.resize(static_cast<std::size_t>(missing) + 1);
        m_bytes[0] = m_kept;
        if (missing > 0 && m_input->readBlock(missing, m_bytes.data() + 1) != missing) {
            return Tracer::fail("*** Cannot read marker data.");
        }
        m_result.resize(static_cast<std::size_t>(end - begin));
        for (qint64 n = begin; n < end; ++n) {
            const auto position = static_cast<qint64>(m_geometry.inputPosition(n));
            m_result[static_cast<std::size_t>(n - begin)] =
                m_bytes[static_cast<std::size_t>(position - m_position)];
        }
        m_kept = m_bytes.back();
        m_position = last;
        return m_output->writeBytes(static_cast<int>(m_result.size()), m_result.data()) ||
               Tracer::fail("*** Cannot write marker output.");
    }

private:
    [[nodiscard]] bool isWanted() const { return m_input != nullptr && m_output != nullptr; }

    BufferedIO *m_input;
    BufferedIO *m_output;
    const TapGeometry &m_geometry;
    qint64 m_position = -1; ///< input sample of the kept byte
    char m_kept = 0;
    std::vector<char> m_bytes;
    std::vector<char> m_result;
};

/// Some outputs that follow each other, on their way from the input to the output stream.
struct OutputBlock
{
    qint64 begin = 0;
    qint64 end = 0;
    PlanarInput input;
    qint64 inputStart = 0; ///< sample at index 0 of the input
    std::size_t partSize = 1;
    std::vector<float> result;
    std::vector<LevelSums> levels; ///< of the parts

    [[nodiscard]] bool isEmpty() const { return begin >= end; }
    [[nodiscard]] std::size_t count() const { return static_cast<std::size_t>(end - begin); }
    [[nodiscard]] std::size_t partCount() const { return (count() + partSize - 1) / partSize; }
};

} // namespace

/// One run: the state of the loop over the outputs. While a block is computed, the one before is
/// written and the input of the next one is read; each stream is used by one thread at a time.
class Resample::Conversion
{
public:
    Conversion(Resample &owner, int inputCount, int outputCount)
        : m_owner(owner)
        , m_inputCount(inputCount)
        , m_outputCount(outputCount)
        , m_geometry(owner.m_settings.length, inputCount, outputCount)
        , m_blockSize(blockSize())
        , m_interpolator(makeInterpolator(owner.m_table, m_geometry, inputCount, outputCount))
        , m_input(*owner.m_input, inputCount, owner.m_settings.length)
        , m_markers(owner.m_markerInput, owner.m_markerOutput, m_geometry)
    {
    }

    [[nodiscard]] bool run()
    {
        if (!m_input.open()) {
            return false;
        }
        if (!m_owner.m_output->writeHeader(BufferedIO::DataHeader)) {
            return Tracer::fail("*** Cannot write header.");
        }
        Tracer::Trace(Tracer::Information, "Resampling...");
        if (!m_markers.open()) {
            return false;
        }
        ProgressClock clock([this](int percent) { emit m_owner.ProgressUpdate(percent); },
                            m_owner.m_cancelled);
        OutputBlock done;
        OutputBlock current;
        OutputBlock next;
        if (!fetch(0, current)) {
            return false;
        }
        while (!current.isEmpty()) {
            if (clock.shouldStop(percentOf(current.begin, m_outputCount))) {
                return Tracer::fail("*** Action aborted by user.");
            }
            current.result.resize(2 * current.count());
            current.levels.resize(current.partCount());
            // Both streams first: they take as long as all the sums.
            bool stored = false;
            bool fetched = false;
            parallelFor(2 + current.partCount(), [&](std::size_t task) {
                if (task == 0) {
                    stored = store(done);
                } else if (task == 1) {
                    fetched = fetch(current.end, next);
                } else {
                    compute(current, task - 2);
                }
            });
            if (!stored || !fetched) {
                return false;
            }
            std::swap(done, current);
            std::swap(current, next);
        }
        return store(done);
    }

    [[nodiscard]] double peak() const { return m_level.peakLevel(); }
    [[nodiscard]] double rms() const { return m_level.rmsLevel(m_outputCount); }

private:
    [[nodiscard]] qint64 blockSize() const
    {
        const qint64 byWork = MaxBlockProducts / m_geometry.maxTaps();
        const double byInput = static_cast<double>(MaxBlockInput) * m_geometry.ratio();
        const qint64 limit = std::min(byWork, MaxBlockOutputs);
        return std::clamp<qint64>(static_cast<qint64>(std::min(byInput, 1e9)), 1, limit);
    }

    /// Whether an output's first tap lies behind the sample up to which the input was read: then
    /// one step is longer than the filter reaches.
    [[nodiscard]] bool missesInput(qint64 begin, qint64 end) const
    {
        if (1 / m_geometry.ratio() <= m_geometry.maxTaps() - 2) {
            return false;
        }
        for (qint64 n = std::max<qint64>(begin, 1); n < end; ++n) {
            const TapRange before = m_geometry.taps(n - 1);
            const TapRange taps = m_geometry.taps(n);
            if (taps.first < m_inputCount && taps.count > 0 &&
                taps.first > std::min(before.first + before.count, m_inputCount)) {
                return true;
            }
        }
        return false;
    }

    /// Reads the input of the outputs from `begin` on; the block is empty behind the last one.
    [[nodiscard]] bool fetch(qint64 begin, OutputBlock &block)
    {
        block.begin = begin;
        block.end = std::min(begin + m_blockSize, m_outputCount);
        block.partSize =
            static_cast<std::size_t>((m_blockSize + PartsPerBlock - 1) / PartsPerBlock);
        if (block.isEmpty()) {
            return true;
        }
        if (missesInput(block.begin, block.end)) {
            return Tracer::fail("*** Missed input sample.");
        }
        const TapRange last = m_geometry.taps(block.end - 1);
        if (!m_input.advance(m_geometry.taps(block.begin).first, last.first + last.count,
                             Interpolator::ReadAhead)) {
            return false;
        }
        block.input = m_input.samples();
        block.inputStart = m_input.start();
        return true;
    }

    void compute(OutputBlock &block, std::size_t part) const
    {
        const std::size_t from = part * block.partSize;
        const std::span<float> result =
            std::span(block.result)
                .subspan(2 * from, 2 * std::min(block.partSize, block.count() - from));
        m_interpolator->compute(block.begin + static_cast<qint64>(from), block.input,
                                block.inputStart, result);
        block.levels[part] = measureByLanes(result);
    }

    [[nodiscard]] bool store(const OutputBlock &block)
    {
        if (block.isEmpty()) {
            return true;
        }
        for (const LevelSums &level : block.levels) {
            m_level.peak = std::max(m_level.peak, level.peak);
            m_level.sum += level.sum;
        }
        if (!writeSamples(*m_owner.m_output, block.result)) {
            return Tracer::fail("*** Cannot write output data.");
        }
        return m_markers.copy(block.begin, block.end);
    }

    Resample &m_owner;
    qint64 m_inputCount;
    qint64 m_outputCount;
    TapGeometry m_geometry;
    qint64 m_blockSize; ///< outputs
    std::unique_ptr<Interpolator> m_interpolator;
    LoopedInput m_input;
    MarkerCopy m_markers;
    LevelSums m_level; ///< of all outputs so far
};

Resample::Resample(QObject *parent)
    : QObject(parent)
{
}

void Resample::setFilterFrequency(double rate, double cutoff)
{
    m_settings.rate = rate;
    m_settings.cutoff = cutoff;
}

void Resample::setFilterLength(int length)
{
    m_settings.length = length;
}

bool Resample::configure(const FilterSettings &settings)
{
    if (settings.window < 0 || settings.window >= NamedWindowCount) {
        return false;
    }
    m_settings = settings;
    return true;
}

bool Resample::setFilterType(int kind, double parameter)
{
    if (kind < 0 || kind > static_cast<int>(FilterKind::Custom)) {
        return false;
    }
    m_settings.filter = static_cast<FilterKind>(kind);
    m_settings.parameter = parameter;
    return true;
}

bool Resample::setWindowType(int kind)
{
    if (kind < 0 || kind >= NamedWindowCount) {
        return false;
    }
    m_settings.window = kind;
    return true;
}

void Resample::setInput(BufferedIO *stream, qint64 samples)
{
    m_input = stream;
    m_inputSamples = samples;
}

void Resample::setOutput(BufferedIO *stream, qint64 samples)
{
    m_output = stream;
    m_outputSamples = samples;
}

void Resample::setMarkers(BufferedIO *input, BufferedIO *output)
{
    m_markerInput = input;
    m_markerOutput = output;
}

void Resample::cancel()
{
    m_cancelled = true;
}

bool Resample::run()
{
    m_cancelled = false;
    const auto inputCount = static_cast<std::int32_t>(m_inputSamples);
    const auto outputCount = static_cast<std::int32_t>(m_outputSamples);
    if (inputCount < 1 || outputCount < 1) {
        return Tracer::fail("*** Invalid input or output data length.");
    }
    if (m_input == nullptr || m_output == nullptr || m_input == m_output) {
        return Tracer::fail("*** Invalid data buffer.");
    }
    if (m_tableSettings != m_settings) {
        m_tableSettings.reset();
        if (!buildFilterTable(m_settings, m_table)) {
            return Tracer::fail("*** Cannot create filter function.");
        }
        m_tableSettings = m_settings;
    }
    Conversion conversion(*this, inputCount, outputCount);
    if (!conversion.run()) {
        return false;
    }
    m_peakOffset = levelOffset(conversion.peak(), OffsetFloor);
    m_rmsOffset = levelOffset(conversion.rms(), OffsetFloor);
    return true;
}
