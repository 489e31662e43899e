// SPDX-License-Identifier: Apache-2.0
#include "SourceWaveform.h"

#include "ToolJob.h"

#include "log/Tracer.h"
#include "wvfile/HvFileIO.h"

#include <algorithm>
#include <vector>

namespace {

constexpr int blockSize = 64 * 1024;

/// Splits a tags stream at its closing braces; reads on as needed.
class TagSplitter
{
public:
    explicit TagSplitter(BufferedIO &stream)
        : m_stream(stream)
    {
    }

    /// The next tag with its braces; empty at the end.
    [[nodiscard]] QByteArray next()
    {
        for (;;) {
            const qsizetype end = m_text.indexOf('}', m_begin);
            if (end >= 0) {
                const QByteArray tag = m_text.mid(m_begin, end + 1 - m_begin);
                m_begin = end + 1;
                return tag;
            }
            m_text.remove(0, m_begin);
            m_begin = 0;
            const qsizetype held = m_text.size();
            m_text.resize(held + blockSize);
            const int got = m_stream.readBlock(blockSize, m_text.data() + held);
            m_text.resize(held + std::max(got, 0));
            if (got <= 0) {
                return {};
            }
        }
    }

private:
    BufferedIO &m_stream;
    QByteArray m_text;
    qsizetype m_begin = 0;
};

} // namespace

bool SourceWaveform::read(ToolJob &job, const QString &fileName)
{
    TempStream unknownTags;
    if (!m_data.open() || !unknownTags.open() || !m_tags.open()) {
        return Tracer::fail("Cannot create temporary data buffer.");
    }
    if (!m_markers.open()) {
        return Tracer::fail("Cannot create temporary marker buffer.");
    }
    m_info = WvFileInfo();
    m_info.fileName = fileName;
    m_info.dataStream = m_data.stream();
    m_info.markerStream = m_markers.stream();
    m_info.tagsStream = unknownTags.stream();
    HvFileIO file;
    const JobStep step(job, "Reading Waveform...", file);
    return file.readWaveform(&m_info) && completeMarkers() && filterTags(unknownTags);
}

/// A file may state marker positions for fewer samples than it has; the trace then goes on with its
/// last byte, so that each sample has markers to be carried on.
bool SourceWaveform::completeMarkers()
{
    BufferedIO &stream = *m_markers.stream();
    qint64 held = stream.deviceSize();
    if (held >= m_info.samples) {
        return true;
    }
    // Only a pass over the stream brings the write side to its end.
    std::vector<char> block(blockSize);
    char last = 0;
    for (qint64 done = 0; done < held;) {
        const int got = stream.readBlock(blockSize, block.data());
        if (got <= 0 || !stream.writeBytes(got, block.data())) {
            return Tracer::fail("Cannot complete the temporary marker data.");
        }
        last = block[static_cast<size_t>(got) - 1];
        done += got;
    }
    std::fill(block.begin(), block.end(), last);
    while (held < m_info.samples) {
        const auto count = static_cast<int>(std::min<qint64>(m_info.samples - held, blockSize));
        if (!stream.writeBytes(count, block.data())) {
            return Tracer::fail("Cannot complete the temporary marker data.");
        }
        held += count;
    }
    return stream.restartAtBegining() || Tracer::fail("Cannot complete the temporary marker data.");
}

bool SourceWaveform::filterTags(TempStream &unknownTags)
{
    m_hasTags = false;
    if (!unknownTags->restartAtBegining()) {
        return Tracer::fail("Cannot save unknown tag.");
    }
    TagSplitter splitter(*unknownTags.stream());
    for (QByteArray tag = splitter.next(); !tag.isEmpty(); tag = splitter.next()) {
        // The writer states the marker clock itself; a second one would follow with every copy.
        if (tag.startsWith("{CLOCK MARKER:")) {
            continue;
        }
        if (!m_tags->writeBytes(static_cast<int>(tag.size()), tag.constData())) {
            return Tracer::fail("Cannot save unknown tag.");
        }
        m_hasTags = true;
    }
    return true;
}

void SourceWaveform::dropTags()
{
    if (m_hasTags) {
        Tracer::Trace(Tracer::Information,
                      "Unknown tags of the source are not carried on to the result.");
    }
    m_hasTags = false;
}

WvWriteJob SourceWaveform::writeJob() const
{
    WvWriteJob job;
    job.type = typeForFormat(m_info.format);
    job.clock = m_info.clock;
    job.markerClock = m_info.clock;
    job.samples = m_info.samples;
    job.rmsOffset = m_info.rmsOffset;
    job.peakOffset = m_info.peakOffset;
    job.comment = m_info.comment;
    job.copyright = m_info.copyright;
    job.levelsValid = true;
    return job;
}
