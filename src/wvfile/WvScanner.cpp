// SPDX-License-Identifier: Apache-2.0
#include "WvScanner.h"

#include "ByteSource.h"
#include "FileKind.h"

#include "log/Tracer.h"

#include <QIODevice>
#include <QStringList>

#include <algorithm>
#include <cmath>

namespace {

/// Characters of a list of segments; hundreds of file names are long.
constexpr int MaxSegmentsText = 64 * 1024;

constexpr int MaxNameLength = 1024;

/// Blocks of more samples than this are taken for damaged.
constexpr qint64 MaxScannedSamples = 4'000'000'000;

QString withoutQuotes(QString text)
{
    return text.remove('"');
}

double toFiniteDouble(const QString &text, bool *isNumber)
{
    const double value = text.simplified().toDouble(isNumber);
    *isNumber = *isNumber && std::isfinite(value);
    return value;
}

} // namespace

WvScanner::WvScanner(WvFileSummary &summary)
    : m_summary(summary)
{
}

bool WvScanner::scan(QIODevice &device)
{
    ByteSource source(device);
    while (source.skipPast('{')) {
        QString name;
        if (!readName(source, name)) {
            continue;
        }
        name = name.simplified().toUpper();
        if (name.isEmpty()) {
            continue;
        }
        if (Tracer::isEnabled(Tracer::Debug)) {
            Tracer::Trace(Tracer::Debug, "Evaluating tag '" + name + "'");
        }
        if (!processTag(source, name)) {
            return false;
        }
    }
    if (m_holdsSamples && !m_blockFound) {
        m_summary.isCutOff = true;
        m_summary.missingSamples = std::max<qint64>(m_summary.samples, 0);
    }
    if (!m_summary.levelsValid) {
        Tracer::Trace(Tracer::Warning, "No LEVEL OFFS tag found in waveform file.");
    }
    if (m_summary.clock <= 0) {
        Tracer::Trace(Tracer::Warning, "Invalid data in CLOCK tag.");
    }
    if (m_clockFound && m_summary.clock != 0 && m_summary.samples >= 0) {
        m_summary.playTime = static_cast<double>(m_summary.samples) / m_summary.clock;
    }
    return true;
}

bool WvScanner::readName(ByteSource &source, QString &name)
{
    QByteArray bytes;
    while (bytes.size() < MaxNameLength) {
        const int byte = source.next();
        if (byte == ':') {
            name = QString::fromLatin1(bytes);
            return true;
        }
        if (byte < 0x20 || byte > 0x7D) {
            return false;
        }
        bytes.append(static_cast<char>(byte));
    }
    if (source.next() != ':') {
        return false;
    }
    name = QString::fromLatin1(bytes);
    return true;
}

bool WvScanner::processTag(ByteSource &source, const QString &name)
{
    if (name.contains("MARKER LIST")) {
        m_summary.hasMarkers = true;
        return source.skipPast('}') || Tracer::fail("Invalid MARKER LIST tag.");
    }
    if (name.contains("WAVEFORM")) {
        return processSampleBlock(source, name);
    }

    struct TextTag
    {
        const char *name;
        QString WvFileSummary::*text;
        bool quoted;
    };
    static constexpr TextTag TextTags[] = {
        {"COMMENT", &WvFileSummary::comment, false},
        {"COPYRIGHT", &WvFileSummary::copyright, false},
        {"DATE", &WvFileSummary::date, false},
        {"MWV_SEGMENT_SETTINGS_FILE", &WvFileSummary::settingsFile, true},
        {"MWV_SEGMENT_LEVEL_MODE", &WvFileSummary::levelMode, false},
        {"MWV_SEGMENT_CLOCK_MODE", &WvFileSummary::clockMode, false},
    };
    static const QStringList segmentTags{
        "MWV_SEGMENT_COUNT", "MWV_SEGMENT_FILES",    "MWV_SEGMENT_START",     "MWV_SEGMENT_LENGTH",
        "MWV_SEGMENT_CLOCK", "MWV_SEGMENT_DURATION", "MWV_SEGMENT_LEVEL_OFFS"};
    static const QStringList otherTags{"TYPE", "CLOCK", "SAMPLES", "LEVEL OFFS"};
    const auto *textTag =
        std::find_if(std::begin(TextTags), std::end(TextTags),
                     [&](const TextTag &tag) { return name == QLatin1String(tag.name); });
    const bool isText = textTag != std::end(TextTags);
    const bool isSegments = segmentTags.contains(name);
    if (!isText && !isSegments && !otherTags.contains(name)) {
        return true;
    }
    TagText content;
    if (isSegments) {
        // One list that is too long leaves the rest of the report as it is.
        if (source.readText('}', content, MaxSegmentsText)) {
            return processSegments(name, content.text);
        }
        Tracer::Trace(Tracer::Error, "Invalid " + name + " tag.");
        return source.skipPast('}');
    }
    if (!source.readText('}', content)) {
        return Tracer::fail("Invalid " + name + " tag.");
    }
    if (isText) {
        m_summary.*(textTag->text) = textTag->quoted ? withoutQuotes(content.text) : content.text;
        return true;
    }
    if (name == "TYPE") {
        return processType(content.text);
    }
    if (name == "LEVEL OFFS") {
        return processLevels(content.text);
    }
    bool isNumber = false;
    if (name == "CLOCK") {
        m_summary.clock = toFiniteDouble(content.text, &isNumber);
        m_clockFound = isNumber;
        return isNumber || Tracer::fail("Invalid clock rate in CLOCK tag.");
    }
    m_summary.samples = content.text.simplified().toLongLong(&isNumber);
    return isNumber || Tracer::fail("Invalid samples count in SAMPLES tag.");
}

bool WvScanner::processType(const QString &text)
{
    bool isNumber = false;
    m_summary.hasChecksum =
        text.section(',', 1, 1).simplified().toDouble(&isNumber) != 0 && isNumber;
    const FileKind *kind = findFileKind(text.section(',', 0, 0));
    if (kind == nullptr) {
        return Tracer::fail("Invalid file format in TYPE tag.");
    }
    m_summary.typeText = kind->description;
    m_holdsSamples = kind->logText != nullptr;
    Tracer::Trace(Tracer::Information, "Waveform TYPE-tag : " + m_summary.typeText);
    return true;
}

bool WvScanner::processLevels(const QString &text)
{
    bool rmsIsNumber = false;
    bool peakIsNumber = false;
    const double rms = toFiniteDouble(text.section(',', 0, 0), &rmsIsNumber);
    const double peak = toFiniteDouble(text.section(',', 1, 1), &peakIsNumber);
    if (!rmsIsNumber || !peakIsNumber) {
        return Tracer::fail("Invalid parameters in LEVEL OFFS tag.");
    }
    m_summary.rmsOffset = rms;
    m_summary.peakOffset = peak;
    m_summary.levelsValid = true;
    return true;
}

void WvScanner::growSegments(qsizetype count)
{
    if (m_summary.segments.size() < count) {
        m_summary.segments.resize(count);
    }
}

bool WvScanner::processSegments(const QString &name, const QString &text)
{
    const QString invalid = "Invalid " + name + " tag.";
    bool isNumber = true;
    if (name == "MWV_SEGMENT_COUNT") {
        const int count = text.simplified().toInt(&isNumber);
        if (!isNumber) {
            return Tracer::fail(invalid);
        }
        if (count < 0) {
            return Tracer::fail("Invalid count in MSW_SEGMENT_COUNT tag.");
        }
        m_summary.segmentCount = count;
        return true;
    }
    const QStringList items = text.split(',');
    if (name == "MWV_SEGMENT_LEVEL_OFFS") {
        growSegments(items.size() / 2);
        for (qsizetype i = 0; i + 1 < items.size(); i += 2) {
            WvSegment &segment = m_summary.segments[i / 2];
            bool peakIsNumber = false;
            segment.rmsOffset = toFiniteDouble(items.at(i), &isNumber);
            segment.peakOffset = toFiniteDouble(items.at(i + 1), &peakIsNumber);
            if (!isNumber || !peakIsNumber) {
                return Tracer::fail(invalid);
            }
        }
        return true;
    }
    using Setter = void (*)(WvSegment &, const QString &, bool *);
    struct ListTag
    {
        const char *name;
        Setter set;
    };
    static constexpr ListTag ListTags[] = {
        {"MWV_SEGMENT_DURATION",
         [](WvSegment &s, const QString &t, bool *ok) { s.duration = toFiniteDouble(t, ok); }},
        {"MWV_SEGMENT_CLOCK",
         [](WvSegment &s, const QString &t, bool *ok) { s.clock = toFiniteDouble(t, ok); }},
        {"MWV_SEGMENT_START",
         [](WvSegment &s, const QString &t, bool *ok) { s.start = t.simplified().toLongLong(ok); }},
        {"MWV_SEGMENT_LENGTH", [](WvSegment &s, const QString &t,
                                  bool *ok) { s.length = t.simplified().toLongLong(ok); }},
        {"MWV_SEGMENT_FILES",
         [](WvSegment &s, const QString &t, bool *ok) {
             s.fileName = withoutQuotes(t);
             *ok = true;
         }},
    };
    for (const ListTag &tag : ListTags) {
        if (name != QLatin1String(tag.name)) {
            continue;
        }
        growSegments(items.size());
        for (qsizetype i = 0; i < items.size(); ++i) {
            tag.set(m_summary.segments[i], items.at(i), &isNumber);
            if (!isNumber) {
                return Tracer::fail(invalid);
            }
        }
    }
    return true;
}

bool WvScanner::processSampleBlock(ByteSource &source, const QString &name)
{
    Tracer::Trace(Tracer::Debug, "WAVEFORM-tag found.");
    m_blockFound = true;
    TagText prefix;
    bool isNumber = false;
    const qint64 blockBytes = name.section('-', 1, 1).simplified().toLongLong(&isNumber);
    if (!source.readText('#', prefix) || !prefix.endedOnDelimiter || !isNumber) {
        return Tracer::fail("Invalid WAVEFORM tag.");
    }
    // A length below the prefix is nonsense, and must not lead back in the file.
    const qint64 dataBytes = blockBytes < prefix.consumed ? 0 : blockBytes - prefix.consumed;
    const auto warn = [](const QString &text) { Tracer::Trace(Tracer::Warning, text); };
    if (dataBytes % 4 != 0) {
        warn(QString("Resulting data length in WAVEFORM tag is invalid: %1").arg(dataBytes));
        warn(QString("Tag begins with '%1:%2#'").arg(name, prefix.text));
        warn(QString("Number of stripped bytes at beginning (including #): %1")
                 .arg(prefix.consumed));
    }
    const qint64 count = dataBytes / 4;
    if (count < 1 || count > MaxScannedSamples) {
        warn(QString("Invalid number of samples in WAVEFORM tag: %1").arg(count));
    }
    if (count != m_summary.samples) {
        warn(QString("Suspicious number of samples (WAVEFORM tag:%1, SAMPLES tag:%2)")
                 .arg(count)
                 .arg(m_summary.samples));
        m_summary.samples = count;
    }
    // Held within the file by the source, however far the stated length leads.
    const qint64 rest = source.size() - source.position();
    if (rest < dataBytes) {
        m_summary.isCutOff = true;
        m_summary.missingSamples = count - rest / 4;
        warn(QString("The file is cut off: %1 of %2 samples are missing.")
                 .arg(m_summary.missingSamples)
                 .arg(count));
    }
    return source.seek(source.position() + std::min(dataBytes, rest)) ||
           Tracer::fail("Invalid WAVEFORM tag.");
}
