// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <QByteArray>

#include <complex>
#include <random>
#include <vector>

/// A generator for random tests, another one at each run. Its seed is printed; the environment
/// variable CORVANE_TEST_SEED sets it, which repeats a run.
[[nodiscard]] std::mt19937 randomGenerator();

/// Bytes of any value, the same for a seed on every machine.
[[nodiscard]] QByteArray randomBytes(qsizetype count, unsigned seed = 1);

/// Samples spread evenly over the square from -1 to 1, the same for a seed on every machine.
[[nodiscard]] std::vector<std::complex<float>> randomSamples(int count, unsigned seed = 1);
