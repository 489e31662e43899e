// SPDX-License-Identifier: Apache-2.0
#include "WvReader.h"

#include "FileKind.h"
#include "streams/BufferedIO.h"
#include "streams/levels.h"

#include "base/ProgressClock.h"
#include "log/Tracer.h"

#include <QIODevice>

#include <algorithm>
#include <cmath>
#include <vector>

namespace {

constexpr int MaxNameLength = 99;
constexpr int BlockSamples = 64 * 1024;

} // namespace

WvReader::WvReader(WvFileInfo &info, QIODevice &device, ProgressClock &progress)
    : m_info(info)
    , m_progress(progress)
    , m_source(device)
    , m_fileLimit(m_source.size() / 4)
    , m_markers(*info.markerStream, m_fileLimit, progress)
{
}

bool WvReader::read()
{
    QString name;
    Round round = Round::Tag;
    while (round == Round::Tag) {
        round = readTag(name);
    }
    if (round == Round::Failed || !openSampleBlock(name) || !readSamples()) {
        return false;
    }
    if (!measures()) {
        return true;
    }
    m_info.levels = m_levels;
    m_info.rmsOffset = measuredOffset(m_levels.rmsLevel(m_info.samples));
    m_info.peakOffset = measuredOffset(m_levels.peakLevel());
    return true;
}

WvReader::Round WvReader::readTag(QString &name)
{
    if (m_progress.shouldStop(0)) {
        Tracer::fail("Action aborted by user.");
        return Round::Failed;
    }
    if (!m_source.skipPast('{')) {
        Tracer::fail("No tag mark found! Probably incorrect format.");
        return Round::Failed;
    }
    QByteArray bytes;
    int byte = m_source.next();
    for (; byte != ':' && byte != ByteSource::NoByte && bytes.size() <= MaxNameLength;
         byte = m_source.next()) {
        bytes.append(static_cast<char>(byte));
    }
    name = QString::fromLatin1(bytes);
    if (byte == ByteSource::NoByte && m_source.position() >= m_source.size()) {
        Tracer::fail("The file is cut off within its tags.");
        return Round::Failed;
    }
    if (byte != ':' || bytes.size() > MaxNameLength) {
        Tracer::fail("Tag name '" + name + "' is invalid.");
        return Round::Failed;
    }
    if (name.toUpper().contains("WAVEFORM")) {
        return Round::SampleBlock;
    }
    if (Tracer::isEnabled(Tracer::Debug)) {
        Tracer::Trace(Tracer::Debug, "Processing tag '" + name + "' ...");
    }
    return processTag(name) ? Round::Tag : Round::Failed;
}

bool WvReader::processTag(const QString &name)
{
    if (name == "TYPE") {
        return processType();
    }
    if (name.contains("MARKER LIST ")) {
        m_info.hasMarkers = true;
        if (m_info.reading == SampleReading::Checked) {
            return m_source.skipPast('}') || Tracer::fail("Invalid tag. '}' is missing.");
        }
        return m_markers.mergeList(m_source, name);
    }
    for (const char *dropped : {"CRESTFACTOR", "SI COMPENSATED", "SYSTEM"}) {
        if (name == QLatin1String(dropped) && !m_info.droppedTags.contains(name)) {
            m_info.droppedTags << name;
        }
    }
    if (name == "CRESTFACTOR") {
        return m_source.skipPast('}') || Tracer::fail("Invalid tag. '}' is missing.");
    }

    enum class Content { Text, Ignored, Resolution, Clock, Samples, Levels, ControlLength };
    struct Known
    {
        const char *name;
        Content content;
        QString WvFileInfo::*text;
    };
    static constexpr Known KnownTags[] = {
        {"SI COMPENSATED", Content::Ignored, nullptr},
        {"RESOLUTION", Content::Resolution, nullptr},
        {"SYSTEM", Content::Text, &WvFileInfo::system},
        {"COMMENT", Content::Text, &WvFileInfo::comment},
        {"COPYRIGHT", Content::Text, &WvFileInfo::copyright},
        {"DATE", Content::Text, &WvFileInfo::date},
        {"CLOCK", Content::Clock, nullptr},
        {"SAMPLES", Content::Samples, nullptr},
        {"LEVEL OFFS", Content::Levels, nullptr},
        {"LEVEL OFFSET", Content::Levels, nullptr},
        {"CONTROL LENGTH", Content::ControlLength, nullptr},
    };
    const auto *known =
        std::find_if(std::begin(KnownTags), std::end(KnownTags),
                     [&](const Known &tag) { return name == QLatin1String(tag.name); });
    if (known == std::end(KnownTags)) {
        return keepUnknownTag(name);
    }
    TagText content;
    if (!m_source.readText('}', content)) {
        return Tracer::fail("Invalid tag data");
    }
    switch (known->content) {
    case Content::Text:
        m_info.*(known->text) = content.text;
        return true;
    case Content::Ignored:
        return true;
    case Content::Resolution:
        m_sixteenBit = content.text.contains("16");
        return true;
    case Content::Clock:
        return processClock(content.text);
    case Content::Samples:
        return processSamples(content.text);
    case Content::Levels:
        return processLevels(content.text);
    case Content::ControlLength:
        return processControlLength(content.text);
    }
    return false;
}

bool WvReader::processType()
{
    m_info.format = WvFormatUnknown;
    TagText content;
    if (!m_source.readText('}', content)) {
        return Tracer::fail("Invalid TYPE tag.");
    }
    const QString field = content.text.section(',', 0, 0).simplified().toUpper();
    const FileKind *kind = findFileKind(field);
    if (kind == nullptr || kind->logText == nullptr) {
        return Tracer::fail("File is not a valid waveform file (" + field + ") !");
    }
    m_info.format = kind->format;
    Tracer::Trace(Tracer::Information, kind->logText);
    return true;
}

bool WvReader::processClock(const QString &text)
{
    bool isNumber = false;
    m_info.clock = text.simplified().toDouble(&isNumber);
    if (!isNumber || !(m_info.clock > MinClockHz && m_info.clock <= MaxClockHz)) {
        return Tracer::fail("Invalid clock rate! Range is 0.001-600MHz");
    }
    return true;
}

bool WvReader::processSamples(const QString &text)
{
    bool isNumber = false;
    const qint64 count = text.simplified().toLongLong(&isNumber);
    if (!isNumber || count <= 0) {
        return Tracer::fail("Invalid number of samples! Use value > 0.");
    }
    m_statedSamples = count;
    return takeSampleCount(count);
}

bool WvReader::takeSampleCount(qint64 count)
{
    if (count > MaxSamples) {
        return Tracer::fail(
            QString("Number of samples %1 is too large. At most %2 samples can be read.")
                .arg(count)
                .arg(MaxSamples));
    }
    m_info.samples = static_cast<int>(count);
    return true;
}

bool WvReader::processLevels(const QString &text)
{
    bool rmsIsNumber = false;
    bool peakIsNumber = false;
    const double rms = text.section(',', 0, 0).simplified().toDouble(&rmsIsNumber);
    const double peak = text.section(',', 1, 1).simplified().toDouble(&peakIsNumber);
    if (!rmsIsNumber || !peakIsNumber || !std::isfinite(rms) || !std::isfinite(peak)) {
        return Tracer::fail("LEVEL OFFS tag is invalid ('" + text + "').");
    }
    m_info.rmsOffset = m_info.rmsOffsetTag = rms;
    m_info.peakOffset = m_info.peakOffsetTag = peak;
    return true;
}

bool WvReader::processControlLength(const QString &text)
{
    bool isNumber = false;
    const qint64 length = text.simplified().toLongLong(&isNumber);
    if (m_info.reading == SampleReading::Checked) {
        return true;
    }
    if (!isNumber || length < 0 || length > std::min(m_fileLimit, MaxSamples)) {
        return Tracer::fail("CONTROL LENGTH tag is invalid ('" + text + "').");
    }
    m_info.controlLength = static_cast<int>(length);
    return true;
}

bool WvReader::keepUnknownTag(const QString &name)
{
    if (m_info.tagsStream == nullptr) {
        return m_source.skipPast('}') || Tracer::fail("Invalid tag. '}' is missing.");
    }
    const auto keep = [&](const QByteArray &bytes) {
        return bytes.isEmpty() ||
               m_info.tagsStream->writeBytes(static_cast<int>(bytes.size()), bytes.constData()) ||
               Tracer::fail("Cannot save unknown tag.");
    };
    QByteArray bytes = '{' + name.toLatin1() + ": ";
    // Blanks behind the colon are no content: without this a tag would grow with every copy.
    int byte = m_source.next();
    while (byte == ' ') {
        byte = m_source.next();
    }
    for (; byte != '}'; byte = m_source.next()) {
        if (byte == ByteSource::NoByte) {
            return Tracer::fail("Invalid tag. '}' is missing.");
        }
        bytes.append(static_cast<char>(byte));
        if (bytes.size() >= BlockSamples) {
            if (!keep(bytes)) {
                return false;
            }
            bytes.clear();
        }
    }
    bytes.append('}');
    return keep(bytes);
}

bool WvReader::openSampleBlock(const QString &name)
{
    if (!m_markers.finishLists()) {
        return false;
    }
    if (m_info.format == WvFormatUnknown) {
        return Tracer::fail("Unsupported waveform file type!");
    }
    if (m_info.samples <= 0) {
        Tracer::Trace(Tracer::Warning,
                      "No SAMPLES tag found. Trying to determine the sample count later...");
    }
    TagText prefix;
    if (!m_source.readText('#', prefix) || !prefix.endedOnDelimiter) {
        return Tracer::fail("Cannot read WAVEFORM tag");
    }
    bool isNumber = false;
    const qint64 blockBytes = name.section('-', 1, 1).simplified().toLongLong(&isNumber);
    if (!isNumber) {
        return Tracer::fail("Invalid WAVEFORM tag format (samples count).");
    }
    if (prefix.text.contains(',')) {
        m_info.prefixNumber = prefix.text.section(',', 0, 0).simplified().toInt();
    }
    const qint64 count = blockBytes > prefix.consumed ? (blockBytes - prefix.consumed) / 4 : 0;
    if (count < 1) {
        return Tracer::fail("Invalid number of samples in WAVEFORM tag.");
    }
    if (count != m_info.samples) {
        Tracer::Trace(Tracer::Warning,
                      "Number of samples from xWAVEFORM tag and SAMPLES tag disagree");
        Tracer::Trace(Tracer::Warning, "Using data from xWAVEFORM tag.");
        if (!takeSampleCount(count)) {
            return false;
        }
    }
    if (m_info.controlLength == 0) {
        // Without marker lists nothing depends on it.
        Tracer::Trace(m_info.hasMarkers ? Tracer::Warning : Tracer::Information,
                      QString("No CONTROL LENGTH tag found. Using sample count instead (%1).")
                          .arg(m_info.samples));
        m_info.controlLength = m_info.samples;
    }
    if (!finalizeMarkers()) {
        return false;
    }
    if (m_info.reading == SampleReading::Unpacked &&
        !m_info.dataStream->writeHeader(BufferedIO::DataHeader)) {
        return Tracer::fail("Writing to temporary waveform storage failed.");
    }
    Tracer::Trace(Tracer::Information, QString("Reading %1 samples @ %2 bit from waveform...")
                                           .arg(m_info.samples)
                                           .arg(m_sixteenBit ? "16" : "14"));
    return true;
}

bool WvReader::finalizeMarkers()
{
    if (m_markers.written() < m_info.controlLength) {
        Tracer::Trace(Tracer::Information,
                      QString("Finalizing marker stream up to position %1 using value 0x%2")
                          .arg(m_info.controlLength)
                          .arg(m_markers.lastByte(), 0, 16));
        // A count that the file can't hold fails below, at the samples; the stream needn't grow to
        // it.
        if (!m_markers.extendTo(std::min<qint64>(m_info.controlLength, m_fileLimit))) {
            return false;
        }
    }
    m_markers.warnAboutCuts(m_info.samples);
    return true;
}

SampleCoding WvReader::coding() const
{
    switch (m_info.format) {
    case WvFormatTqx:
        return SampleCoding::B;
    case WvFormatWv:
        return m_sixteenBit ? SampleCoding::C : SampleCoding::D;
    default:
        return SampleCoding::A;
    }
}

bool WvReader::readSamples()
{
    m_info.coding = coding();
    m_info.blockStart = m_source.position();
    if (m_info.reading == SampleReading::Checked) {
        const auto there = (m_source.size() - m_info.blockStart) / 4;
        const auto stated = std::max<qint64>(m_info.samples, m_statedSamples);
        m_info.samples = static_cast<int>(std::min<qint64>(m_info.samples, there));
        m_info.missingSamples = stated - m_info.samples;
        return true;
    }
    if (m_info.reading != SampleReading::Unpacked &&
        m_source.size() - m_info.blockStart < 4 * static_cast<qint64>(m_info.samples)) {
        return Tracer::fail("Cannot read enough data from xWAVEFORM tag!");
    }
    if (!measures()) {
        return true;
    }
    const bool complete = readBlocks();
    m_measuring.wait();
    return complete;
}

bool WvReader::readBlocks()
{
    const auto gain = static_cast<float>(std::pow(10.0, m_info.gainDb / 20));
    const qint64 total = m_info.samples;
    const auto blockLength = static_cast<size_t>(std::min<qint64>(total, BlockSamples));
    std::vector<std::byte> words(4 * blockLength);
    m_values[0].resize(2 * blockLength);
    m_values[1].resize(total > BlockSamples ? 2 * blockLength : 0);
    size_t current = 0;
    for (qint64 done = 0; done < total;) {
        if (m_progress.shouldStop(done, total)) {
            return Tracer::fail("Action aborted by user.");
        }
        const auto wanted = static_cast<size_t>(std::min<qint64>(total - done, BlockSamples));
        const size_t got = m_source.read(std::span(words).first(4 * wanted)) / 4;
        const auto block = std::span(m_values[current]).first(2 * got);
        decodeWords(coding(), std::span(words).first(4 * got), gain, block);
        if (got > 0 && !storeBlock(done, block)) {
            return false;
        }
        if (got < wanted) {
            return Tracer::fail("Cannot read enough data from xWAVEFORM tag!");
        }
        done += static_cast<qint64>(got);
        current = 1 - current;
    }
    return true;
}

bool WvReader::storeBlock(qint64 begin, std::span<const float> values)
{
    // The sum is bound by the latency of its additions, which have to keep their order; beside it
    // there is time to write.
    const auto measure = [this, values] { addLevels(values, m_levels); };
    if (m_info.samples > BlockSamples) {
        m_measuring.start(measure);
    } else {
        measure();
    }
    if (m_info.reading == SampleReading::Measured) {
        return true;
    }
    if (!m_info.dataStream->writeBlock(static_cast<int>(values.size_bytes()), values.data())) {
        return Tracer::fail("Cannot write to temporary file!");
    }
    // With marker lists shorter than the samples the carried byte goes on from the sample behind
    // the next one: readers of the stream live with its missing last byte.
    const qint64 end = begin + static_cast<qint64>(values.size() / 2);
    return m_markers.pad(end - std::max(begin, m_markers.written() + 1));
}
