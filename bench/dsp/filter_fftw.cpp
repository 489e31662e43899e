// SPDX-License-Identifier: Apache-2.0
// The filter's peer: an overlap-save of the same length with FFTW on one thread.
#include "filtercase.h"

#include <benchmark/benchmark.h>
#include <fftw3.h>

#include <algorithm>

namespace {

using namespace filtercase;
using Complex = std::complex<double>;

class OverlapSave
{
public:
    explicit OverlapSave(const std::vector<double> &taps)
        : m_block(Size)
        , m_spectrum(Size)
        , m_filter(Size)
        , m_forward(plan(m_block, m_spectrum, FFTW_FORWARD))
        , m_backward(plan(m_spectrum, m_block, FFTW_BACKWARD))
    {
        std::fill(m_block.begin(), m_block.end(), 0.0);
        std::copy(taps.begin(), taps.end(), m_block.begin());
        fftw_execute(m_forward);
        for (size_t i = 0; i < Size; ++i) {
            m_filter[i] = m_spectrum[i] / static_cast<double>(Size);
        }
    }
    ~OverlapSave()
    {
        fftw_destroy_plan(m_forward);
        fftw_destroy_plan(m_backward);
    }
    OverlapSave(const OverlapSave &) = delete;
    OverlapSave &operator=(const OverlapSave &) = delete;

    /// Round the loop, as the filter does.
    void run(const Samples &in, Samples &out)
    {
        constexpr size_t Step = Size - Length + 1;
        constexpr size_t Half = Length / 2;
        const size_t n = in.size();
        for (size_t first = 0; first < n; first += Step) {
            for (size_t i = 0; i < Size; ++i) {
                m_block[i] = Complex(in[(first + i + n - Half) % n]);
            }
            fftw_execute(m_forward);
            for (size_t i = 0; i < Size; ++i) {
                m_spectrum[i] *= m_filter[i];
            }
            fftw_execute(m_backward);
            for (size_t i = 0; i < std::min(Step, n - first); ++i) {
                out[first + i] = std::complex<float>(m_block[Length - 1 + i]);
            }
        }
    }

private:
    static constexpr size_t Size = 2048;

    static fftw_plan plan(std::vector<Complex> &in, std::vector<Complex> &out, int sign)
    {
        return fftw_plan_dft_1d(static_cast<int>(Size), reinterpret_cast<fftw_complex *>(in.data()),
                                reinterpret_cast<fftw_complex *>(out.data()), sign, FFTW_MEASURE);
    }

    std::vector<Complex> m_block;
    std::vector<Complex> m_spectrum;
    std::vector<Complex> m_filter;
    fftw_plan m_forward;
    fftw_plan m_backward;
};

void BM_OverlapSave(benchmark::State &state)
{
    OverlapSave filter(taps());
    Samples result(Count);
    for (auto _ : state) {
        filter.run(source(), result);
        benchmark::DoNotOptimize(result.data());
    }
    if (!isFiltered(result)) {
        state.SkipWithError("wrong result");
    }
}

/// As above, from one temporary file to another, as the filter works.
void BM_OverlapSaveOfStreams(benchmark::State &state)
{
    OverlapSave filter(taps());
    TempStream in;
    TempStream out;
    Samples input(Count);
    Samples result(Count);
    bool done = openStreams(source(), in, out);
    for (auto _ : state) {
        done = done && readStream(in, input);
        filter.run(input, result);
        done = done && out->writeHeader(BufferedIO::DataHeader) &&
               out->writeBytes(static_cast<int>(8 * result.size()), result.data());
    }
    if (!done || !readStream(out, result) || !isFiltered(result)) {
        state.SkipWithError("wrong result");
    }
}

BENCHMARK(BM_OverlapSaveOfStreams)->UseRealTime()->Unit(benchmark::kMillisecond);
BENCHMARK(BM_OverlapSave)->UseRealTime()->Unit(benchmark::kMillisecond);

} // namespace
