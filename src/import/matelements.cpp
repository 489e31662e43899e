// SPDX-License-Identifier: Apache-2.0
#include "matelements.h"

#include "MatSource.h"

#include "log/Tracer.h"

#include <array>
#include <cstring>

namespace mat {

namespace {

/// A sub-element of an array while it is read.
struct SubElement
{
    quint32 tag = 0;
    qint64 size = 0;
    qint64 position = 0; ///< of its data
};

struct Seen
{
    bool flags = false;
    bool dimensions = false;
    bool name = false;
    int parts = 0;
};

void say(const QString &text)
{
    Tracer::Trace(Tracer::Information, text);
}

bool takeFlags(MatSource &source, SubElement &sub, MatEntry &entry)
{
    say("    Evaluating array flags.");
    quint32 flags = 0;
    quint32 unused = 0;
    if (!source.readNumber(flags)) {
        return Tracer::fail("Cannot read array flags from subelement.");
    }
    entry.complex = (flags & 0x800U) != 0;
    entry.global = (flags & 0x400U) != 0;
    entry.logical = (flags & 0x200U) != 0;
    entry.classId = flags & 0xFFU;
    constexpr quint32 LastClass = 13;
    if (entry.classId > LastClass) {
        return Tracer::fail("Invalid class ID in array flags subelement.");
    }
    if (!source.readNumber(unused)) {
        return Tracer::fail("Cannot read unused bytes of array flags subelement.");
    }
    sub.size = 8;
    return true;
}

bool takeName(MatSource &source, const SubElement &sub, MatEntry &entry)
{
    say(QString("    Evaluating array name (%1 bytes).").arg(sub.size));
    constexpr qint64 MaxLength = 1024;
    if (sub.size > MaxLength) {
        return Tracer::fail("Length of name subelement is > 1024 characters.");
    }
    QByteArray name(sub.size, '\0');
    if (source.read(name.data(), sub.size) < sub.size) {
        return Tracer::fail("Name subelement cannot be read entirely.");
    }
    entry.name = QString::fromLatin1(name);
    say(QString("      Name: '%1'").arg(entry.name));
    return true;
}

/// A name of three letters stands in the four bytes that are the size of longer ones.
void takeSmallName(SubElement &sub, MatEntry &entry)
{
    say("    Evaluating array name (< 4 bytes).");
    const auto letters = static_cast<quint32>(sub.size);
    entry.name = QString::fromLatin1(reinterpret_cast<const char *>(&letters), 3);
    say(QString("      Name: '%1'").arg(entry.name));
    sub.size = 0;
}

bool takeDimensions(MatSource &source, const SubElement &sub, MatEntry &entry)
{
    say(QString("    Evaluating dimensions array (%1 bytes).").arg(sub.size));
    constexpr qint64 MaxDimensions = 256;
    if (sub.size / 4 > MaxDimensions) {
        return Tracer::fail("Cannot read dimension information from subelement.");
    }
    for (qint64 i = 0; i < sub.size / 4; ++i) {
        qint32 dimension = 0;
        if (!source.readNumber(dimension)) {
            return Tracer::fail("Cannot read dimension information from subelement.");
        }
        entry.dimensions.append(dimension);
    }
    return true;
}

bool takeData(const SubElement &sub, int part, MatEntry &entry)
{
    say("    Evaluating data section.");
    const quint32 size = typeSize(sub.tag);
    if (size == 0) {
        return Tracer::fail("Size of data sub element is zero.");
    }
    const auto count = static_cast<quint32>(sub.size / size);
    if (part == 0) {
        entry.realPosition = sub.position;
        entry.realCount = count;
        entry.realType = sub.tag;
    } else if (part == 1) {
        entry.imagPosition = sub.position;
        entry.imagCount = count;
        entry.imagType = sub.tag;
    }
    return true;
}

bool take(MatSource &source, SubElement &sub, Seen &seen, MatEntry &entry)
{
    if (sub.tag < MatrixType && seen.flags && seen.dimensions && seen.name) {
        return takeData(sub, seen.parts++, entry);
    }
    if (sub.tag == ArrayFlagsType && !seen.flags) {
        seen.flags = true;
        return takeFlags(source, sub, entry);
    }
    if (sub.tag == NameType && seen.flags) {
        seen.name = true;
        return takeName(source, sub, entry);
    }
    if (sub.tag == SmallNameTag && seen.flags) {
        seen.name = true;
        takeSmallName(sub, entry);
        return true;
    }
    if (sub.tag == DimensionsType && seen.flags) {
        seen.dimensions = true;
        return takeDimensions(source, sub, entry);
    }
    Tracer::Trace(Tracer::Warning,
                  QString("Unknown sub element detected (%1 bytes): ").arg(sub.size) +
                      QString::asprintf(" 0x%08X", sub.tag));
    // A small one has its bytes where others have their size: taken as one, they lead anywhere.
    if (sub.tag > 0xFFFFU) {
        sub.size = 0;
    }
    return true;
}

template <typename T>
void convert(const char *bytes, qint64 count, float *values)
{
    for (qint64 i = 0; i < count; ++i) {
        T value;
        std::memcpy(&value, bytes + i * qint64(sizeof(T)), sizeof(T));
        values[i] = static_cast<float>(static_cast<double>(value));
    }
}

} // namespace

quint32 typeSize(quint32 type)
{
    constexpr std::array<quint32, 14> Sizes{0, 1, 1, 2, 2, 4, 4, 4, 0, 8, 0, 0, 8, 8};
    return type < Sizes.size() ? Sizes.at(type) : 0;
}

void toFloats(quint32 type, const char *bytes, qint64 count, float *values)
{
    switch (type) {
    case 1:
        return convert<qint8>(bytes, count, values);
    case 2:
        return convert<quint8>(bytes, count, values);
    case 3:
        return convert<qint16>(bytes, count, values);
    case 4:
        return convert<quint16>(bytes, count, values);
    case 5:
        return convert<qint32>(bytes, count, values);
    case 6:
        return convert<quint32>(bytes, count, values);
    case 7:
        return convert<float>(bytes, count, values);
    case 9:
        return convert<double>(bytes, count, values);
    case 12:
        return convert<qint64>(bytes, count, values);
    case 13:
        return convert<quint64>(bytes, count, values);
    default:
        break;
    }
}

bool readArray(MatSource &source, qint64 end, MatEntry &entry)
{
    Seen seen;
    for (;;) {
        SubElement sub;
        quint32 size = 0;
        if (!source.readNumber(sub.tag) || !source.readNumber(size)) {
            return Tracer::fail("Cannot read inner matrix element tag.");
        }
        sub.size = size;
        sub.position = source.position();
        if (!take(source, sub, seen, entry)) {
            return false;
        }
        const qint64 next = sub.position + paddedSize(sub.size);
        if (next >= end || !source.seek(next)) {
            return true;
        }
    }
}

} // namespace mat
