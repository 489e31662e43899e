// SPDX-License-Identifier: Apache-2.0
#include "seed.h"

#include <QString>
#include <QtGlobal>

std::mt19937 randomGenerator()
{
    const QString wanted = qEnvironmentVariable("CORVANE_TEST_SEED");
    const unsigned seed = wanted.isEmpty() ? std::random_device{}() : wanted.toUInt();
    qInfo("CORVANE_TEST_SEED=%u", seed);
    return std::mt19937(seed);
}

QByteArray randomBytes(qsizetype count, unsigned seed)
{
    std::mt19937 generator(seed);
    QByteArray bytes(count, Qt::Uninitialized);
    for (char &byte : bytes) {
        byte = static_cast<char>(generator());
    }
    return bytes;
}

std::vector<std::complex<float>> randomSamples(int count, unsigned seed)
{
    std::mt19937 generator(seed);
    std::vector<std::complex<float>> samples(static_cast<size_t>(count));
    for (std::complex<float> &sample : samples) {
        const auto draw = [&generator] {
            return static_cast<float>(generator()) / 2147483648.0F - 1.0F;
        };
        const float inPhase = draw();
        sample = {inPhase, draw()};
    }
    return samples;
}
