// SPDX-License-Identifier: Apache-2.0
// The transform's peer: FFTW (double, FFTW_ESTIMATE) with a window of its own.
#include "fftcase.h"

#include "dsp/windows.h"

#include <fftw3.h>

namespace {

using namespace fftcase;

/// FFTW with its plan, the way a display would hold it.
class Peer
{
public:
    explicit Peer(std::size_t n)
        : m_in(n)
        , m_out(n)
        , m_window(windowList(static_cast<int>(n), WindowKind))
        , m_plan(fftw_plan_dft_1d(
              static_cast<int>(n), reinterpret_cast<fftw_complex *>(m_in.data()),
              reinterpret_cast<fftw_complex *>(m_out.data()), FFTW_FORWARD, FFTW_ESTIMATE))
    {
    }
    ~Peer() { fftw_destroy_plan(m_plan); }
    Peer(const Peer &) = delete;
    Peer &operator=(const Peer &) = delete;

    const std::vector<Complex> &transform(const std::vector<Complex> &samples)
    {
        for (std::size_t i = 0; i < samples.size(); ++i) {
            m_in[i] = samples[i] * m_window[i];
        }
        fftw_execute(m_plan);
        return m_out;
    }

private:
    std::vector<Complex> m_in;
    std::vector<Complex> m_out;
    std::vector<double> m_window;
    fftw_plan m_plan;
};

void BM_Fftw(benchmark::State &state)
{
    const std::vector<Complex> samples = noise(static_cast<std::size_t>(state.range(0)));
    Peer peer(samples.size());
    for (auto _ : state) {
        benchmark::DoNotOptimize(peer.transform(samples).data());
    }
    if (!isSpectrum(samples, peer.transform(samples))) {
        state.SkipWithError("wrong result");
    }
}

BENCHMARK(BM_Fftw)->Apply(lengths);

} // namespace
