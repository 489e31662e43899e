// SPDX-License-Identifier: Apache-2.0
#include "SpectrumLines.h"

#include "base/parallel.h"
#include "base/vectorstate.h"
#include "dsp/fft.h"
#include "dsp/windows.h"
#include "plotscale.h"

#include <algorithm>
#include <array>
#include <cmath>
#include <complex>
#include <cstddef>

namespace {

constexpr int WindowKind = 7; // 1 - cos(2 pi n / 512): its mean is 1, so a tone keeps its level
constexpr double Scale = 0.001953125; // 1 / 512

constexpr std::size_t FewFrames = 32;

} // namespace

void SpectrumLines::update(std::span<const IqSample> samples, qint64 first)
{
    clearVectorState();
    std::vector<Line> next;
    const auto count = static_cast<qint64>(samples.size());
    if (count >= FrameSize) {
        next.reserve(static_cast<std::size_t>((count - FrameSize) / FrameStep + 1));
    }
    std::vector<std::size_t> missing;
    auto kept = m_lines.begin();
    for (qint64 offset = 0; offset + FrameSize <= count; offset += FrameStep) {
        const qint64 position = first + offset;
        while (kept != m_lines.end() && kept->position < position) {
            ++kept;
        }
        if (kept != m_lines.end() && kept->position == position) {
            next.push_back(std::move(*kept));
            ++kept;
        } else {
            missing.push_back(next.size());
            next.push_back({position, {}});
        }
    }
    const auto makeLine = [&](std::size_t index) {
        const auto offset = static_cast<std::size_t>(next[index].position - first);
        next[index].level = transform(samples.subspan(offset, FrameSize));
    };
    // Starting threads costs as much as a few transforms.
    const std::size_t parts = missing.size() < FewFrames ? 1 : threadCount();
    parallelFor(parts, [&](std::size_t part) {
        for (std::size_t k = part; k < missing.size(); k += parts) {
            makeLine(missing[k]);
        }
    });
    m_transformCount += static_cast<qint64>(missing.size());
    m_lines = std::move(next);
}

void SpectrumLines::clear()
{
    m_lines.clear();
}

std::vector<double> SpectrumLines::transform(std::span<const IqSample> frame)
{
    std::array<std::complex<double>, FrameSize> weighted;
    std::array<std::complex<double>, FrameSize> spectrum;
    for (std::size_t i = 0; i < frame.size(); ++i) {
        weighted[i] = {frame[i].i, frame[i].q};
    }
    std::vector<double> level(FrameSize);
    if (applyWindow(weighted, WindowKind) && fftCentred(weighted, spectrum)) {
        for (std::size_t i = 0; i < level.size(); ++i) {
            const double re = spectrum[i].real();
            const double im = spectrum[i].imag();
            level[i] = magnitudeToDb(std::sqrt(re * re + im * im) * Scale);
        }
    }
    return level;
}

std::vector<double> SpectrumLines::mean() const
{
    if (m_lines.empty()) {
        return {};
    }
    std::vector<double> sum(FrameSize, 0.0);
    const auto count = static_cast<double>(m_lines.size());
    for (const Line &line : m_lines) {
        for (std::size_t i = 0; i < sum.size(); ++i) {
            sum[i] += line.level[i] / count;
        }
    }
    return sum;
}

std::vector<double> SpectrumLines::maximum() const
{
    if (m_lines.empty()) {
        return {};
    }
    std::vector<double> result = m_lines.front().level;
    for (const Line &line : m_lines) {
        for (std::size_t i = 0; i < result.size(); ++i) {
            result[i] = std::max(result[i], line.level[i]);
        }
    }
    return result;
}
