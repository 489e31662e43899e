// SPDX-License-Identifier: Apache-2.0
#include "PolarPreview.h"

#include "dsp/Resample.h"
#include "log/Tracer.h"
#include "streams/TempStream.h"
#include "streams/samplestream.h"
#include "view/iqlevels.h"

#include <algorithm>

std::optional<PolarPreview> makePolarPreview(BufferedIO &source, qint64 samples, double offset,
                                             double gain)
{
    const auto count = static_cast<int>(std::min<qint64>(samples, PolarPreview::MaxSamples));
    TempStream phase;
    TempStream amplitude;
    Resample splitter;
    if (!phase.open() || !amplitude.open() ||
        !splitter.polarSplit(count, &source, phase.stream(), amplitude.stream(), offset, gain)) {
        Tracer::Trace(Tracer::Error, "Polar conversion of the waveform failed.");
        return std::nullopt;
    }
    PolarPreview preview;
    const std::pair<BufferedIO *, IqList *> lists[] = {{&source, &preview.source},
                                                       {phase.stream(), &preview.phase},
                                                       {amplitude.stream(), &preview.amplitude}};
    std::vector<float> values(floatsOf(count));
    for (const auto &[stream, list] : lists) {
        if (!stream->checkHeader(BufferedIO::DataHeader) || readSamples(*stream, values) != count) {
            Tracer::Trace(Tracer::Error, "Insufficient data.");
            return std::nullopt;
        }
        *list = iqList(values);
    }
    return preview;
}
