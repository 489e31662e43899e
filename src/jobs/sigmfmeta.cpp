// SPDX-License-Identifier: Apache-2.0
#include "sigmfmeta.h"

#include "SigmfMarks.h"
#include "SourceWaveform.h"

#include "log/Tracer.h"

#include <QDateTime>
#include <QJsonArray>
#include <QJsonDocument>
#include <QJsonObject>

#include <optional>

namespace {

constexpr int BlockBytes = 64 * 1024;

QJsonObject extension()
{
    return {{"name", "corvane"}, {"version", "1.0.0"}, {"optional", true}};
}

/// The unknown tags, each as it stands in the file. Nothing, with the reason logged, if they can't
/// be read.
std::optional<QJsonArray> unknownTags(BufferedIO *tags)
{
    QJsonArray array;
    if (tags == nullptr) {
        return array;
    }
    QByteArray text;
    QByteArray block(BlockBytes, Qt::Uninitialized);
    int got = tags->restartAtBegining() ? 0 : -1;
    while (got >= 0) {
        got = tags->readBlock(BlockBytes, block.data());
        if (got <= 0) {
            break;
        }
        text.append(block.constData(), got);
        qsizetype end = 0;
        while ((end = text.indexOf('}')) >= 0) {
            array.append(QString::fromLatin1(text.left(end + 1)));
            text.remove(0, end + 1);
        }
    }
    if (got < 0) {
        Tracer::Trace(Tracer::Error, "Cannot read the unknown tags.");
        return std::nullopt;
    }
    return array;
}

QByteArray jsonText(const QJsonObject &object)
{
    return QJsonDocument(object).toJson().trimmed();
}

/// One annotation a line: there may be millions.
bool writeAnnotations(const SigmfMarks &marks, const std::function<bool(const QByteArray &)> &write)
{
    QByteArray lines;
    const char *separator = "\n";
    for (const SigmfMarks::Stretch &stretch : marks.stretches()) {
        lines += separator;
        lines += "{\"core:sample_start\": " + QByteArray::number(stretch.begin) +
                 ", \"core:sample_count\": " + QByteArray::number(stretch.count) +
                 ", \"core:label\": \"M" + QByteArray::number(stretch.marker) + "\"}";
        separator = ",\n";
        if (lines.size() > BlockBytes) {
            if (!write(lines)) {
                return false;
            }
            lines.clear();
        }
    }
    return write(lines + "\n]");
}

} // namespace

bool writeSigmfMeta(SourceWaveform &source, const SigmfData &data, bool isWhole,
                    const SigmfMarks &marks, const std::function<bool(const QByteArray &)> &write)
{
    const WvFileInfo &info = source.info();
    QJsonObject global{{"core:datatype", QString::fromLatin1(data.datatype)},
                       {"core:version", "1.0.0"},
                       {"core:num_channels", 1},
                       {"core:recorder", "Corvane"},
                       {"core:sha512", QString::fromLatin1(data.sha512)},
                       {"core:extensions", QJsonArray{extension()}}};
    if (info.clock > 0) {
        global["core:sample_rate"] = info.clock;
    }
    if (!info.comment.isEmpty()) {
        global["core:description"] = info.comment;
    }
    if (!info.copyright.isEmpty()) {
        global["corvane:copyright"] = info.copyright;
    }
    if (isWhole) {
        global["corvane:peak_offset"] = info.peakOffsetTag;
        global["corvane:rms_offset"] = info.rmsOffsetTag;
    }
    const std::optional<QJsonArray> tags = unknownTags(source.tags());
    if (!tags) {
        return false;
    }
    if (!tags->isEmpty()) {
        global["corvane:tags"] = *tags;
    }
    QJsonObject capture{{"core:sample_start", 0}};
    // The file tells the local time of its making, the standard asks for UTC.
    const QDateTime made = QDateTime::fromString(info.date, "yyyy-MM-dd;HH:mm:ss");
    if (made.isValid()) {
        capture["core:datetime"] = made.toUTC().toString("yyyy-MM-ddTHH:mm:ssZ");
    }
    return write("{\n\"global\": " + jsonText(global) + ",\n\"captures\": [\n" + jsonText(capture) +
                 "\n],\n\"annotations\": [") &&
           writeAnnotations(marks, write) && write("\n}\n");
}
