// SPDX-License-Identifier: Apache-2.0
#include "AveragedSpectrum.h"

#include "base/parallel.h"
#include "base/vectorstate.h"
#include "dsp/fft.h"
#include "dsp/windows.h"

#include <algorithm>
#include <bit>
#include <numeric>

namespace {

/// Frames transformed side by side: enough for a few threads, little enough for the cache.
constexpr std::size_t BatchFrames = 16;

} // namespace

AveragedSpectrum::AveragedSpectrum(qint64 total, int length, int windowKind)
    : m_total(total)
{
    if (total < 1) {
        return;
    }
    const auto fitting = std::bit_floor(static_cast<quint64>(total));
    m_length = static_cast<int>(std::min(static_cast<quint64>(std::max(length, 1)), fitting));
    m_window = windowList(m_length, windowKind);
    const double gain = std::accumulate(m_window.begin(), m_window.end(), 0.0);
    const double power =
        std::inner_product(m_window.begin(), m_window.end(), m_window.begin(), 0.0);
    if (gain == 0) {
        // The windows of one point that begin at zero.
        std::fill(m_window.begin(), m_window.end(), 1.0);
        m_scale = 1.0 / m_length / m_length;
    } else {
        m_scale = 1 / gain / gain;
        m_noiseBandwidth = power / gain / gain * m_length;
    }
    m_sum.assign(static_cast<std::size_t>(m_length), 0.0);
    m_maximum = m_sum;
}

void AveragedSpectrum::append(std::span<const IqSample> samples)
{
    if (m_length == 0) {
        return;
    }
    clearVectorState();
    m_pending.insert(m_pending.end(), samples.begin(), samples.end());
    m_taken += static_cast<qint64>(samples.size());
    const qint64 step = std::max(m_length / 2, 1);
    std::vector<std::size_t> starts;
    while (m_next + m_length <= m_taken) {
        starts.push_back(static_cast<std::size_t>(m_next - m_pendingFirst));
        const qint64 last = m_total - m_length;
        // The last frame ends with the stretch, so that nothing at its end is missed.
        m_next = m_next < last ? std::min(m_next + step, last) : m_total;
    }
    for (std::size_t done = 0; done < starts.size(); done += BatchFrames) {
        transform(std::span(starts).subspan(done, std::min(BatchFrames, starts.size() - done)));
    }
    const qint64 unused = std::clamp<qint64>(m_next - m_pendingFirst, 0, std::ssize(m_pending));
    m_pending.erase(m_pending.begin(), m_pending.begin() + unused);
    m_pendingFirst += unused;
}

void AveragedSpectrum::transform(std::span<const std::size_t> starts)
{
    const auto length = static_cast<std::size_t>(m_length);
    m_powers.resize(BatchFrames);
    parallelFor(starts.size(), [&](std::size_t k) {
        thread_local std::vector<std::complex<double>> weighted;
        thread_local std::vector<std::complex<double>> spectrum;
        weighted.resize(length);
        spectrum.resize(length);
        const IqSample *frame = m_pending.data() + starts[k];
        for (std::size_t i = 0; i < length; ++i) {
            weighted[i] = {frame[i].i * m_window[i], frame[i].q * m_window[i]};
        }
        std::vector<double> &power = m_powers[k];
        power.assign(length, 0.0);
        if (fftCentred(weighted, spectrum)) {
            for (std::size_t i = 0; i < length; ++i) {
                const double re = spectrum[i].real();
                const double im = spectrum[i].imag();
                power[i] = (re * re + im * im) * m_scale;
            }
        }
    });
    // In the order of the frames, so that the sums don't depend on the number of threads.
    for (std::size_t k = 0; k < starts.size(); ++k) {
        for (std::size_t i = 0; i < length; ++i) {
            m_sum[i] += m_powers[k][i];
            m_maximum[i] = std::max(m_maximum[i], m_powers[k][i]);
        }
    }
    m_frames += static_cast<qint64>(starts.size());
}

std::vector<double> AveragedSpectrum::mean() const
{
    std::vector<double> result = m_sum;
    for (double &value : result) {
        value /= static_cast<double>(std::max<qint64>(m_frames, 1));
    }
    return result;
}
