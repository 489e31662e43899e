// SPDX-License-Identifier: Apache-2.0
#include "markerstream.h"

#include "BufferedIO.h"

#include "log/Tracer.h"

#include <algorithm>
#include <vector>

bool completeMarkers(BufferedIO &stream, qint64 samples)
{
    constexpr int BlockSize = 64 * 1024;
    qint64 held = stream.deviceSize();
    if (held >= samples) {
        return true;
    }
    // Only a pass over the stream brings the write side to its end.
    std::vector<char> block(BlockSize);
    char last = 0;
    for (qint64 done = 0; done < held;) {
        const int got = stream.readBlock(BlockSize, block.data());
        if (got <= 0 || !stream.writeBytes(got, block.data())) {
            return Tracer::fail("Cannot complete the temporary marker data.");
        }
        last = block[static_cast<size_t>(got) - 1];
        done += got;
    }
    std::fill(block.begin(), block.end(), last);
    while (held < samples) {
        const auto count = static_cast<int>(std::min<qint64>(samples - held, BlockSize));
        if (!stream.writeBytes(count, block.data())) {
            return Tracer::fail("Cannot complete the temporary marker data.");
        }
        held += count;
    }
    return stream.restartAtBegining() || Tracer::fail("Cannot complete the temporary marker data.");
}
