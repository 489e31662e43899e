// SPDX-License-Identifier: Apache-2.0
// A composition file of any bytes is read or refused; what was read can be edited, written and read
// again as the same document.
#include "composer/Composition.h"
#include "support/fuzzcheck.h"

#include <QBuffer>
#include <QDir>

#include <cstdint>

namespace {

bool read(Composition &document, QByteArray bytes)
{
    QBuffer device(&bytes);
    return device.open(QIODevice::ReadOnly) &&
           document.fromXml(device, QDir(QStringLiteral("/nowhere"))).isEmpty();
}

} // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t *data, std::size_t size)
{
    Composition document;
    const bool ok = read(
        document, QByteArray(reinterpret_cast<const char *>(data), static_cast<qsizetype>(size)));
    static_cast<void>(takeErrors());
    if (!ok) {
        return 0;
    }
    require(document.trackCount() <= Composition::MaxTracks);
    const QByteArray xml = document.toXml(QDir(QStringLiteral("/nowhere")));
    Composition again;
    require(read(again, xml));
    require(again.toXml(QDir(QStringLiteral("/nowhere"))) == xml);
    ComposerSegment segment;
    segment.lSamples = 1000;
    segment.lUsed = 1000;
    segment.dSrcClk = 1e6;
    segment.lTarget = document.target.lSamples / 2;
    if (document.trackCount() == 0) {
        require(document.addTrack());
    }
    document.track(0)->bSelect = true;
    // Whatever they give, they end, and no number leaves its range.
    for (int round = 0; round < 3; ++round) {
        static_cast<void>(document.adjustTarget());
        static_cast<void>(document.insertSegment(segment));
        static_cast<void>(document.overwriteSegment(segment));
        static_cast<void>(document.extractAt(segment.lTarget));
        const qint64 border = document.nearestBorder(segment.lTarget);
        document.markAt(border);
        static_cast<void>(document.liftAt(border));
        for (int i = 0; i < document.segmentCount(0) && i < 100; ++i) {
            static_cast<void>(document.effectiveOffset(*document.segment(0, i)));
        }
    }
    static_cast<void>(takeErrors());
    return 0;
}
