// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "IqSample.h"

#include <QtGlobal>

#include <functional>
#include <span>
#include <vector>

class BufferedIO;

/// Samples and marker bytes of a stretch of a waveform, handed out in order.
class SampleSource
{
public:
    virtual ~SampleSource() = default;

    /// Number of samples in the stretch.
    [[nodiscard]] virtual qint64 count() const = 0;
    /// Position of the first one in the waveform.
    [[nodiscard]] virtual qint64 first() const = 0;
    /// Goes to the first sample. False, and a line in the log, if that fails.
    [[nodiscard]] virtual bool restart() = 0;
    /// Fills both spans with what comes next; they have one length, or that of the markers is 0,
    /// for a caller that looks at no markers in this whole run. Same failures.
    [[nodiscard]] virtual bool next(std::span<IqSample> samples, std::span<quint8> markers) = 0;
};

/// A stretch that is held in memory, by the caller; missing markers are low.
class MemorySource : public SampleSource
{
public:
    explicit MemorySource(std::span<const IqSample> samples, std::span<const quint8> markers = {},
                          qint64 first = 0);

    [[nodiscard]] qint64 count() const override { return static_cast<qint64>(m_samples.size()); }
    [[nodiscard]] qint64 first() const override { return m_first; }
    [[nodiscard]] bool restart() override;
    [[nodiscard]] bool next(std::span<IqSample> samples, std::span<quint8> markers) override;

private:
    std::span<const IqSample> m_samples;
    std::span<const quint8> m_markers;
    qint64 m_first;
    std::size_t m_done = 0;
};

/// A stretch of a data and a marker stream, which are not owned; of any length, since only what is
/// asked for is in memory.
class StreamSource : public SampleSource
{
public:
    /// Asked before each block with the number of samples handed out; false ends the reading
    /// without a message.
    using Proceed = std::function<bool(qint64 done)>;

    StreamSource(BufferedIO &data, BufferedIO &markers, qint64 first, qint64 count,
                 Proceed proceed = {});

    [[nodiscard]] qint64 count() const override { return m_count; }
    [[nodiscard]] qint64 first() const override { return m_first; }
    [[nodiscard]] bool restart() override;
    [[nodiscard]] bool next(std::span<IqSample> samples, std::span<quint8> markers) override;

private:
    BufferedIO &m_data;
    BufferedIO &m_markers;
    qint64 m_first;
    qint64 m_count;
    Proceed m_proceed;
    qint64 m_done = 0;
    std::vector<float> m_block;
};
