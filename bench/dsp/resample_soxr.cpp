// SPDX-License-Identifier: Apache-2.0
// The rate conversion's peer: libsoxr's HQ recipe, with the same number of threads.
#include "resamplecase.h"

#include <omp.h>
#include <soxr.h>

namespace {

using namespace resamplecase;

void BM_Soxr(benchmark::State &state)
{
    const auto outputCount = static_cast<size_t>(state.range(0));
    const auto threads = static_cast<unsigned>(state.range(1));
    // Channels in arrays of their own are what soxr can spread over threads.
    std::vector<float> inPhase(InputCount);
    std::vector<float> quadrature(InputCount);
    for (size_t i = 0; i < inPhase.size(); ++i) {
        inPhase[i] = source()[i].real();
        quadrature[i] = source()[i].imag();
    }
    std::vector<float> outI(outputCount + 1000);
    std::vector<float> outQ(outputCount + 1000);
    const void *in[] = {inPhase.data(), quadrature.data()};
    void *out[] = {outI.data(), outQ.data()};
    const soxr_io_spec_t io = soxr_io_spec(SOXR_FLOAT32_S, SOXR_FLOAT32_S);
    const soxr_quality_spec_t quality = soxr_quality_spec(SOXR_HQ, 0);
    // With 0 soxr takes as many threads as OpenMP offers, one for each channel; above 1 none more.
    omp_set_num_threads(static_cast<int>(threads));
    const soxr_runtime_spec_t runtime = soxr_runtime_spec(threads == 1 ? 1 : 0);
    size_t done = 0;
    for (auto _ : state) {
        const soxr_error_t error =
            soxr_oneshot(InputCount, static_cast<double>(outputCount), 2, in, InputCount, nullptr,
                         out, outputCount, &done, &io, &quality, &runtime);
        if (error != nullptr) {
            state.SkipWithError(error);
            return;
        }
    }
    Samples result(outputCount);
    for (size_t i = 0; i < done; ++i) {
        result[i] = {outI[i], outQ[i]};
    }
    if (done + 2 < outputCount || !isTone(result, 0.5)) {
        state.SkipWithError("wrong result");
    }
    state.SetItemsProcessed(state.iterations() * InputCount);
}

BENCHMARK(BM_Soxr)->Apply(counts);

} // namespace
