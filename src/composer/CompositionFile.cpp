// SPDX-License-Identifier: Apache-2.0
#include "Composition.h"

#include "base/OutputFile.h"
#include "log/Tracer.h"

#include <QDir>
#include <QFile>
#include <QFileInfo>
#include <QXmlStreamReader>
#include <QXmlStreamWriter>

#include <cmath>

namespace {

/// A composition that fits into so much has more segments than can be rendered; more isn't read.
constexpr qint64 MaxFileBytes = 64LL * 1024 * 1024;

QString numberText(double value)
{
    return QString::number(value, 'g', QLocale::FloatingPointShortest);
}

QString numberText(qint64 value)
{
    return QString::number(value);
}

QString flagText(bool value)
{
    return value ? QStringLiteral("1") : QStringLiteral("0");
}

void writeTarget(QXmlStreamWriter &xml, const ComposerTarget &target, const QDir &folder)
{
    xml.writeEmptyElement(QStringLiteral("TargetWv"));
    xml.writeAttribute(QStringLiteral("sName"), folder.relativeFilePath(target.sName));
    xml.writeAttribute(QStringLiteral("iLenMode"), numberText(qint64{target.iLenMode}));
    xml.writeAttribute(QStringLiteral("bSamples"), flagText(target.bSamples));
    xml.writeAttribute(QStringLiteral("lSamples"), numberText(target.lSamples));
    xml.writeAttribute(QStringLiteral("dTime"), numberText(target.dTime));
    xml.writeAttribute(QStringLiteral("bClk"), flagText(target.bClk));
    xml.writeAttribute(QStringLiteral("dUsrClk"), numberText(target.dUsrClk));
}

void writeSegment(QXmlStreamWriter &xml, const ComposerSegment &segment, const QDir &folder)
{
    xml.writeEmptyElement(QStringLiteral("Segment"));
    xml.writeAttribute(QStringLiteral("sName"), folder.relativeFilePath(segment.sName));
    xml.writeAttribute(QStringLiteral("dFOfs"), numberText(segment.dFOfs));
    xml.writeAttribute(QStringLiteral("dLOfs"), numberText(segment.dLOfs));
    xml.writeAttribute(QStringLiteral("dFadeIn"), numberText(segment.dFadeIn));
    xml.writeAttribute(QStringLiteral("iFadeIn"), numberText(qint64{segment.iFadeIn}));
    xml.writeAttribute(QStringLiteral("dFadeOut"), numberText(segment.dFadeOut));
    xml.writeAttribute(QStringLiteral("iFadeOut"), numberText(qint64{segment.iFadeOut}));
    xml.writeAttribute(QStringLiteral("lSamples"), numberText(segment.lSamples));
    xml.writeAttribute(QStringLiteral("dSrcClk"), numberText(segment.dSrcClk));
    xml.writeAttribute(QStringLiteral("lStart"), numberText(segment.lStart));
    xml.writeAttribute(QStringLiteral("lUsed"), numberText(segment.lUsed));
    xml.writeAttribute(QStringLiteral("lTarget"), numberText(segment.lTarget));
    xml.writeAttribute(QStringLiteral("bMkr"), flagText(segment.bMkr));
    xml.writeAttribute(QStringLiteral("bWrap"), flagText(segment.bWrap));
    xml.writeAttribute(QStringLiteral("bAdjOfs"), flagText(segment.bAdjOfs));
    xml.writeAttribute(QStringLiteral("dAdjLim"), numberText(segment.dAdjLim));
}

/// The values of one element. What is absent has its default, what is no number is 0.
class Attributes
{
public:
    explicit Attributes(const QXmlStreamAttributes &attributes)
        : m_attributes(attributes)
    {
    }

    [[nodiscard]] QString text(const char *name, const QString &byDefault = {}) const
    {
        const QLatin1String key(name);
        return m_attributes.hasAttribute(key) ? m_attributes.value(key).toString() : byDefault;
    }
    [[nodiscard]] bool flag(const char *name, const QString &byDefault = QStringLiteral("0")) const
    {
        return integer(name, byDefault) != 0;
    }
    [[nodiscard]] qint32 integer(const char *name,
                                 const QString &byDefault = QStringLiteral("0")) const
    {
        return text(name, byDefault).toInt(nullptr, 10);
    }
    [[nodiscard]] qint64 count(const char *name) const
    {
        return text(name, QStringLiteral("0")).toLongLong(nullptr, 10);
    }
    [[nodiscard]] double number(const char *name,
                                const QString &byDefault = QStringLiteral("0")) const
    {
        const double value = text(name, byDefault).toDouble();
        return std::isfinite(value) ? value : 0;
    }

private:
    const QXmlStreamAttributes &m_attributes;
};

QString absoluteName(const QString &name, const QDir &folder, const char *what)
{
    if (!QFileInfo(name).isRelative()) {
        return name;
    }
    QString absolute = QDir::cleanPath(folder.absoluteFilePath(name));
    Tracer::Trace(Tracer::Debug,
                  QStringLiteral("Relative %1 file '%2'").arg(QLatin1String(what), name));
    Tracer::Trace(Tracer::Debug, QStringLiteral("  converted to '%1'").arg(absolute));
    return absolute;
}

ComposerSegment segmentFrom(const QXmlStreamAttributes &element, const QDir &folder)
{
    const Attributes attributes(element);
    ComposerSegment segment;
    segment.sName = absoluteName(attributes.text("sName"), folder, "input");
    segment.missing = !QFileInfo(segment.sName).isFile();
    segment.dFOfs = attributes.number("dFOfs");
    segment.dLOfs = attributes.number("dLOfs");
    segment.dFadeIn = attributes.number("dFadeIn");
    segment.iFadeIn = attributes.integer("iFadeIn");
    segment.dFadeOut = attributes.number("dFadeOut");
    segment.iFadeOut = attributes.integer("iFadeOut");
    segment.lSamples = attributes.count("lSamples");
    segment.dSrcClk = attributes.number("dSrcClk");
    segment.lStart = attributes.count("lStart");
    segment.lUsed = attributes.count("lUsed");
    segment.lTarget = attributes.count("lTarget");
    segment.bMkr = attributes.flag("bMkr");
    segment.bWrap = attributes.flag("bWrap");
    segment.bAdjOfs = attributes.flag("bAdjOfs", QStringLiteral("1"));
    segment.dAdjLim = attributes.number("dAdjLim", QStringLiteral("0.1"));
    return segment;
}

struct TrackElement
{
    QXmlStreamAttributes attributes;
    std::vector<QXmlStreamAttributes> segments;
};

/// What of a file matters, before any of it is taken over: a file that breaks off later is none.
struct SettingsFile
{
    bool hasRoot = false; ///< the root is that of a composition
    QXmlStreamAttributes target;
    std::vector<TrackElement> tracks;
};

bool readSettings(QXmlStreamReader &xml, SettingsFile &file)
{
    xml.setNamespaceProcessing(false);
    bool hasTarget = false;
    if (xml.readNextStartElement()) {
        file.hasRoot = xml.qualifiedName() == QLatin1String("Settings");
        while (xml.readNextStartElement()) {
            if (xml.qualifiedName() == QLatin1String("Track")) {
                file.tracks.push_back({xml.attributes(), {}});
                while (xml.readNextStartElement()) {
                    if (xml.qualifiedName() == QLatin1String("Segment")) {
                        file.tracks.back().segments.push_back(xml.attributes());
                    }
                    xml.skipCurrentElement();
                }
                continue;
            }
            if (!hasTarget && xml.qualifiedName() == QLatin1String("TargetWv")) {
                hasTarget = true;
                file.target = xml.attributes();
            }
            xml.skipCurrentElement();
        }
    }
    // To the end: what stands behind the root may be wrong, too.
    while (!xml.atEnd()) {
        xml.readNext();
    }
    return !xml.hasError();
}

void repair(ComposerTarget &target)
{
    if (!(target.dUsrClk > 0)) {
        Tracer::Trace(Tracer::Information, "Invalid target clock rate. Setting to 1 MHz.");
        target.dUsrClk = 1000000.0;
    }
    if (target.dTime < 0) {
        Tracer::Trace(Tracer::Information, "Invalid target play time. Setting to 0.");
        target.dTime = 0;
    }
    if (target.lSamples < 0) {
        Tracer::Trace(Tracer::Information, "Invalid target sample count. Setting to 0.");
        target.lSamples = 0;
    }
}

} // namespace

QByteArray Composition::toXml(const QDir &folder) const
{
    QByteArray bytes;
    QXmlStreamWriter xml(&bytes);
    xml.setAutoFormatting(true);
    xml.setAutoFormattingIndent(2);
    xml.writeDTD(QStringLiteral("<!DOCTYPE HV_Corvane_Waveform_Composer>"));
    xml.writeStartElement(QStringLiteral("Settings"));
    writeTarget(xml, target, folder);
    for (const ComposerTrack &track : m_tracks) {
        xml.writeStartElement(QStringLiteral("Track"));
        xml.writeAttribute(QStringLiteral("bEnable"), flagText(track.bEnable));
        xml.writeAttribute(QStringLiteral("bSelect"), flagText(track.bSelect));
        for (const ComposerSegment &segment : track.segments) {
            writeSegment(xml, segment, folder);
        }
        xml.writeEndElement();
    }
    xml.writeEndElement();
    xml.writeEndDocument();
    return bytes.trimmed() + '\n'; // the writer begins with an empty line
}

bool Composition::save(const QString &fileName) const
{
    const QByteArray bytes = toXml(QFileInfo(fileName).absoluteDir());
    OutputFile file(fileName);
    return (file.open() && file.write(bytes) && file.commit()) ||
           Tracer::fail(QStringLiteral("Cannot write '%1': %2").arg(fileName, file.errorString()));
}

bool Composition::load(const QString &fileName)
{
    const auto fail = [&](const QString &reason) {
        return Tracer::fail(QStringLiteral("Cannot read '%1': %2").arg(fileName, reason));
    };
    QFile file(fileName);
    // Only regular files: a device or a pipe may never end.
    if (!QFileInfo(fileName).isFile()) {
        return fail(QStringLiteral("there is no such file."));
    }
    if (!file.open(QIODevice::ReadOnly)) {
        return fail(file.errorString());
    }
    if (file.size() > MaxFileBytes) {
        return fail(QStringLiteral("it has %1 bytes; a composition has at most %2.")
                        .arg(file.size())
                        .arg(MaxFileBytes));
    }
    const QString problem = fromXml(file, QFileInfo(fileName).absoluteDir());
    return problem.isEmpty() || fail(problem);
}

QString Composition::fromXml(QIODevice &device, const QDir &folder)
{
    QXmlStreamReader xml(&device);
    SettingsFile settings;
    if (!readSettings(xml, settings)) {
        return QStringLiteral("line %1: %2").arg(xml.lineNumber()).arg(xml.errorString());
    }
    clear();
    if (!settings.hasRoot) {
        return QStringLiteral("it is no composition, since its root isn't \"Settings\".");
    }
    const Attributes attributes(settings.target);
    target.sName =
        absoluteName(attributes.text("sName", QStringLiteral("composition.wv")), folder, "output");
    target.iLenMode = attributes.integer("iLenMode");
    target.bSamples = attributes.flag("bSamples");
    target.lSamples = attributes.count("lSamples");
    target.dTime = attributes.number("dTime");
    target.bClk = attributes.flag("bClk");
    target.dUsrClk = attributes.number("dUsrClk", QStringLiteral("1e6"));
    repair(target);
    for (const TrackElement &element : settings.tracks) {
        // Beyond the limit all goes to the last track.
        addTrack();
        ComposerTrack &track = m_tracks.back();
        track.bEnable = Attributes(element.attributes).flag("bEnable");
        track.bSelect = Attributes(element.attributes).flag("bSelect");
        for (const QXmlStreamAttributes &segment : element.segments) {
            track.segments.push_back(segmentFrom(segment, folder));
        }
    }
    return {};
}
