// SPDX-License-Identifier: Apache-2.0
#include "sigmfmetadata.h"

#include "log/Tracer.h"

#include <QJsonArray>
#include <QJsonDocument>
#include <QJsonObject>
#include <QRegularExpression>

#include <algorithm>
#include <cmath>

namespace {

std::nullopt_t refuse(const QString &reason)
{
    Tracer::Trace(Tracer::Error, reason);
    return std::nullopt;
}

/// A whole number from 0; `missing` if there is none, nothing if it is something else.
std::optional<qint64> count(const QJsonObject &object, const char *key, qint64 missing)
{
    const QJsonValue value = object.value(QLatin1String(key));
    if (value.isUndefined() || value.isNull()) {
        return missing;
    }
    const qint64 number = value.toInteger(-1);
    return number >= 0 ? std::optional(number) : std::nullopt;
}

std::nullopt_t refuseCount(const QJsonObject &object, const char *key)
{
    return refuse(QString("The SigMF metadata have no whole number from 0 in %1: %2.")
                      .arg(key, object.value(QLatin1String(key)).toVariant().toString()));
}

/// Whether a text is one tag that the writer doesn't write itself and that breaks no other.
bool isUnknownTag(const QString &text)
{
    static const QRegularExpression form("^\\{([ -z|]+):[ -z|]*\\}$");
    const QRegularExpressionMatch match = form.match(text);
    if (!match.hasMatch()) {
        return false;
    }
    const QString name = match.captured(1).section(':', 0, 0).toUpper();
    static const QStringList known{"TYPE",       "COMMENT",      "COPYRIGHT",      "DATE",
                                   "CLOCK",      "CLOCK MARKER", "SYSTEM",         "SAMPLES",
                                   "LEVEL OFFS", "LEVEL OFFSET", "CONTROL LENGTH", "RESOLUTION"};
    return !known.contains(name.simplified()) && !name.contains("WAVEFORM") &&
           !name.contains("MARKER LIST");
}

void readTags(const QJsonArray &array, QByteArray &tags)
{
    for (const auto &value : array) {
        const QString text = value.toString();
        if (isUnknownTag(text)) {
            tags += text.toLatin1();
        } else {
            Tracer::Trace(Tracer::Warning,
                          "A text of corvane:tags is no tag that can be kept: " + text.left(80));
        }
    }
}

bool readCaptures(const QJsonArray &array, qint64 offset, QList<SigmfMetadata::Capture> &captures)
{
    for (const auto &value : array) {
        const QJsonObject object = value.toObject();
        const std::optional<qint64> begin = count(object, "core:sample_start", 0);
        const std::optional<qint64> header = count(object, "core:header_bytes", 0);
        if (!begin || !header) {
            refuseCount(object, !begin ? "core:sample_start" : "core:header_bytes");
            return false;
        }
        captures.append({std::max<qint64>(*begin - offset, 0), *header});
    }
    std::stable_sort(captures.begin(), captures.end(),
                     [](const auto &one, const auto &other) { return one.begin < other.begin; });
    return true;
}

/// Annotations that are no markers, or can't be placed, say nothing about the samples.
void readMarks(const QJsonArray &array, qint64 offset, std::vector<SigmfMetadata::Mark> &marks)
{
    static const QStringList labels{"M1", "M2", "M3", "M4"};
    qint64 others = 0;
    for (const auto &value : array) {
        const QJsonObject object = value.toObject();
        const auto marker = labels.indexOf(object.value("core:label").toString());
        const std::optional<qint64> begin = count(object, "core:sample_start", -1);
        const std::optional<qint64> length = count(object, "core:sample_count", -1);
        if (marker < 0 || !begin || *begin < offset || !length) {
            ++others;
            continue;
        }
        marks.push_back({*begin - offset, *length, static_cast<int>(marker) + 1});
    }
    if (others > 0) {
        Tracer::Trace(
            Tracer::Warning,
            QString("%1 annotations are not labelled M1 to M4 and get lost.").arg(others));
    }
}

} // namespace

std::optional<SigmfType> sigmfType(const QString &name)
{
    static const QRegularExpression form("^([cr])(?:(f32|f64|i32|i16|u32|u16)_(le|be)|(i8|u8))$");
    const QRegularExpressionMatch match = form.match(name);
    if (!match.hasMatch()) {
        return std::nullopt;
    }
    const QString value = match.captured(2) + match.captured(4);
    SigmfType type;
    type.name = name;
    type.isComplex = match.captured(1) == "c";
    type.bigEndian = match.captured(3) == "be";
    type.bytes = value.mid(1).toInt() / 8;
    type.kind = value.startsWith('f')   ? SigmfType::Kind::Float
                : value.startsWith('i') ? SigmfType::Kind::Signed
                                        : SigmfType::Kind::Unsigned;
    return type;
}

std::optional<SigmfMetadata> parseSigmfMetadata(const QByteArray &text)
{
    QJsonParseError problem{};
    const QJsonObject root = QJsonDocument::fromJson(text, &problem).object();
    if (problem.error != QJsonParseError::NoError) {
        return refuse(QString("The SigMF metadata are no JSON: %1 at byte %2.")
                          .arg(problem.errorString())
                          .arg(problem.offset));
    }
    const QJsonObject global = root.value("global").toObject();
    const QString typeName = global.value("core:datatype").toString();
    const std::optional<SigmfType> type = sigmfType(typeName);
    if (!type) {
        return refuse(
            QString("The SigMF datatype '%1' is unknown; permitted: c or r, then f32, f64, "
                    "i32, i16, u32 or u16 with _le or _be, or i8 or u8.")
                .arg(typeName));
    }
    if (global.value("core:metadata_only").toBool()) {
        return refuse("The SigMF recording consists of metadata alone.");
    }
    SigmfMetadata metadata;
    metadata.type = *type;
    const QJsonValue rate = global.value("core:sample_rate");
    metadata.sampleRate = rate.toDouble(0);
    if (!rate.isUndefined() && !(metadata.sampleRate > 0)) {
        return refuse("The SigMF metadata have no positive number in core:sample_rate.");
    }
    constexpr qint64 MaxChannels = 65536;
    const std::optional<qint64> channels = count(global, "core:num_channels", 1);
    const std::optional<qint64> offset = count(global, "core:offset", 0);
    const std::optional<qint64> trailing = count(global, "core:trailing_bytes", 0);
    if (!channels || *channels < 1 || *channels > MaxChannels) {
        return refuseCount(global, "core:num_channels");
    }
    if (!offset || !trailing) {
        return refuseCount(global, !offset ? "core:offset" : "core:trailing_bytes");
    }
    metadata.channels = static_cast<int>(*channels);
    metadata.trailingBytes = *trailing;
    metadata.description = global.value("core:description").toString();
    metadata.copyright = global.value("corvane:copyright").toString();
    metadata.dataset = global.value("core:dataset").toString();
    metadata.sha512 = global.value("core:sha512").toString().toLatin1().toLower();
    readTags(global.value("corvane:tags").toArray(), metadata.unknownTags);
    if (!readCaptures(root.value("captures").toArray(), *offset, metadata.captures)) {
        return std::nullopt;
    }
    readMarks(root.value("annotations").toArray(), *offset, metadata.marks);
    return metadata;
}
