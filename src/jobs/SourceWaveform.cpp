// SPDX-License-Identifier: Apache-2.0
#include "SourceWaveform.h"

#include "ToolJob.h"

#include "log/Tracer.h"
#include "wvfile/HvFileIO.h"

#include <algorithm>
#include <span>
#include <utility>
#include <vector>

namespace {

constexpr int BlockSize = 64 * 1024;

/// Copies a tags stream without the tags that begin with a given text. Works on what comes, since
/// a tag may be as long as its file.
class TagFilter
{
public:
    TagFilter(BufferedIO &target, QByteArray dropped)
        : m_target(target)
        , m_dropped(std::move(dropped))
    {
    }

    /// Whether a tag has gone to the target.
    [[nodiscard]] bool hasKept() const { return m_hasKept; }

    /// Takes the next bytes of the stream; false if the target can't be written.
    [[nodiscard]] bool take(std::span<const char> bytes)
    {
        while (!bytes.empty()) {
            if (m_state == State::Head) {
                if (!takeHead(bytes.front())) {
                    return false;
                }
                bytes = bytes.subspan(1);
                continue;
            }
            const auto end = std::find(bytes.begin(), bytes.end(), '}');
            const bool ends = end != bytes.end();
            const auto part =
                bytes.first(static_cast<size_t>(end - bytes.begin()) + (ends ? 1 : 0));
            if (m_state == State::Keep && !write(part)) {
                return false;
            }
            if (ends) {
                m_state = State::Head;
            }
            bytes = bytes.subspan(part.size());
        }
        return true;
    }

private:
    enum class State { Head, Keep, Drop };

    [[nodiscard]] bool takeHead(char byte)
    {
        m_head.append(byte);
        if (m_head == m_dropped) {
            m_head.clear();
            m_state = State::Drop;
            return true;
        }
        if (m_dropped.startsWith(m_head)) {
            return true;
        }
        m_hasKept = true;
        m_state = byte == '}' ? State::Head : State::Keep;
        const QByteArray head = std::exchange(m_head, {});
        return write({head.constData(), static_cast<size_t>(head.size())});
    }

    [[nodiscard]] bool write(std::span<const char> bytes)
    {
        return m_target.writeBytes(static_cast<int>(bytes.size()), bytes.data());
    }

    BufferedIO &m_target;
    QByteArray m_dropped;
    QByteArray m_head; // of the tag that began, until it is known whether it is dropped
    State m_state = State::Head;
    bool m_hasKept = false;
};

} // namespace

bool SourceWaveform::read(ToolJob &job, const QString &fileName, SampleReading reading)
{
    if (!job.mayProceed()) {
        return false;
    }
    TempStream unknownTags;
    const bool unpacks = reading == SampleReading::Unpacked;
    if ((unpacks && !m_data.open()) || !unknownTags.open() || !m_tags.open()) {
        return Tracer::fail("Cannot create temporary data buffer.");
    }
    if (!m_markers.initBuf(&m_markerBytes, BufferedIO::ReadWrite)) {
        return Tracer::fail("Cannot create temporary marker buffer.");
    }
    m_info = WvFileInfo();
    m_info.fileName = fileName;
    m_info.reading = reading;
    m_info.dataStream = unpacks ? m_data.stream() : nullptr;
    m_info.markerStream = &m_markers;
    m_info.tagsStream = unknownTags.stream();
    HvFileIO file;
    const JobStep step(job, "Reading Waveform...", file);
    if (!file.readWaveform(&m_info)) {
        return false;
    }
    m_markerBytes.extendTo(m_info.samples);
    if (!m_markers.restartAtBegining() || !filterTags(unknownTags)) {
        return false;
    }
    return unpacks ||
           (m_samples.setSource(m_info) && (m_decoded.initBuf(&m_samples, BufferedIO::Read) ||
                                            Tracer::fail("Cannot open waveform input file.")));
}

bool SourceWaveform::filterTags(TempStream &unknownTags)
{
    m_hasTags = false;
    if (!unknownTags->restartAtBegining()) {
        return Tracer::fail("Cannot save unknown tag.");
    }
    // The writer states the marker clock itself; a second one would follow with every copy.
    TagFilter filter(*m_tags.stream(), "{CLOCK MARKER:");
    std::vector<char> block(BlockSize);
    for (;;) {
        const int got = unknownTags->readBlock(BlockSize, block.data());
        if (got == 0) {
            m_hasTags = filter.hasKept();
            return true;
        }
        if (got < 0 || !filter.take(std::span(block).first(static_cast<size_t>(got)))) {
            return Tracer::fail("Cannot save unknown tag.");
        }
    }
}

void SourceWaveform::dropTags()
{
    if (m_hasTags) {
        Tracer::Trace(Tracer::Information,
                      "Unknown tags of the source are not carried on to the result.");
    }
    m_hasTags = false;
}

void SourceWaveform::tellDroppedTags() const
{
    if (!m_info.droppedTags.isEmpty()) {
        Tracer::Trace(Tracer::Information,
                      QString("Tags of the source that are not carried on to the result: %1.")
                          .arg(m_info.droppedTags.join(", ")));
    }
}

WvWriteJob SourceWaveform::writeJob() const
{
    WvWriteJob job;
    job.type = typeForFormat(m_info.format);
    job.clock = m_info.clock;
    job.markerClock = m_info.clock;
    job.samples = m_info.samples;
    job.rmsOffset = m_info.rmsOffset;
    job.markerLists = m_info.hasMarkers;
    job.peakOffset = m_info.peakOffset;
    job.comment = m_info.comment;
    job.copyright = m_info.copyright;
    job.levelsValid = true;
    return job;
}
