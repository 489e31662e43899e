// SPDX-License-Identifier: Apache-2.0
#include "MatFileAccess.h"

#include "MatSource.h"
#include "matelements.h"

#include "base/freespace.h"
#include "log/Tracer.h"
#include "streams/TempStream.h"
#include "streams/samplestream.h"

#include <algorithm>
#include <array>

namespace {

constexpr int TextSize = 116;
constexpr quint16 LevelFiveVersion = 0x0100;
constexpr quint16 EndianIndicator = 0x4D49;
constexpr quint16 SwappedIndicator = 0x494D;

void say(const QString &text)
{
    Tracer::Trace(Tracer::Information, text);
}

/// The reason for a file of another level, with what to do where that is known.
QString wrongLevelText(const QString &description)
{
    const QString text = "This file does not seem to be a level 5 MAT.file.";
    const bool isHdf = description.startsWith("MATLAB 7.3") ||
                       description.startsWith(QString::fromLatin1("\x89HDF"));
    return isHdf ? text + " It is a MATLAB 7.3 file (HDF5): save it with 'save -v7'." : text;
}

bool hasVectorShape(const MatEntry &entry)
{
    const int rows = entry.dimensions.value(0);
    const int columns = entry.dimensions.value(1);
    return (rows == 1 && columns > 1) || (columns == 1 && rows > 1);
}

/// The reader's word on a variable that it can't import; empty if it can try.
QString refusal(const MatEntry &entry)
{
    if (!entry.complex) {
        return "Variable is not of type COMPLEX.";
    }
    if (entry.classId != mat::DoubleClass) {
        return "Array must be of type DOUBLE.";
    }
    if (entry.dimensions.size() != 2) {
        return "Array must have two dimensions.";
    }
    if (!hasVectorShape(entry)) {
        return "Array dimensions must be 1xN or Nx1.";
    }
    if (mat::typeSize(entry.realType) == 0 || mat::typeSize(entry.imagType) == 0) {
        return "Array must use numeric data types.";
    }
    if (entry.realCount != entry.imagCount) {
        return "Length of real and imaginary data do not match.";
    }
    return {};
}

} // namespace

bool MatEntry::isUsable() const
{
    return !name.isEmpty() && complex && hasVectorShape(*this);
}

QString MatEntry::obstacle() const
{
    if (name.isEmpty()) {
        return "It has no readable name: names of 1, 2 and 4 letters are not read. Rename it.";
    }
    QString text = refusal(*this);
    if (!text.isEmpty()) {
        return text;
    }
    return compressed ? QString() : "It is stored without compression. Save it with 'save -v7'.";
}

QString MatEntry::className() const
{
    static const QStringList names{"Unknown", "Cell",   "Struct", "Object", "Char",
                                   "Sparse",  "Double", "Single", "Int8",   "UInt8",
                                   "Int16",   "UInt16", "Int32",  "UInt32"};
    return names.value(static_cast<qsizetype>(classId), names.first());
}

MatFileAccess::MatFileAccess(QObject *parent)
    : FileAccess(parent)
{
}

void MatFileAccess::forget()
{
    m_directory.clear();
    m_directoryValid = false;
    m_swap = false;
}

bool MatFileAccess::readHeader()
{
    say("Reading file header...");
    std::array<char, TextSize> text{};
    constexpr qint64 StartSize = 4;
    if (!device()->seek(0) || device()->read(text.data(), StartSize) < StartSize) {
        return Tracer::fail("Cannot read inital 4 bytes from file.");
    }
    if (std::all_of(text.begin(), text.begin() + StartSize, [](char c) { return c == 0; })) {
        return Tracer::fail(wrongLevelText({}));
    }
    if (device()->read(text.data() + StartSize, TextSize - StartSize) < TextSize - StartSize) {
        return Tracer::fail("Cannot read descriptive text.");
    }
    const auto *const end = std::find(text.begin(), text.end(), '\0');
    m_description = QString::fromLatin1(text.data(), end - text.begin());
    MatFileSource source(*device());
    quint64 subsystemOffset = 0;
    quint16 version = 0;
    quint16 indicator = 0;
    if (!source.readNumber(subsystemOffset)) {
        return Tracer::fail("Cannot read subsys data offset.");
    }
    if (!source.readNumber(version)) {
        return Tracer::fail("Cannot read version tag.");
    }
    if (version != LevelFiveVersion) {
        return Tracer::fail(wrongLevelText(m_description));
    }
    m_level = 5;
    m_swap = false;
    if (!source.readNumber(indicator)) {
        return Tracer::fail("Cannot read endian indicator tag.");
    }
    if (indicator == SwappedIndicator) {
        // Other programs' files of this order have been refused by their version.
        m_swap = true;
        say("Swapping byte order.");
        return true;
    }
    return indicator == EndianIndicator || Tracer::fail("Invalid endian indicator tag.");
}

bool MatFileAccess::readDirectory()
{
    forget();
    say("Reading directory structure from file " + fileName());
    if (!isOpen()) {
        return false;
    }
    if (!readHeader()) {
        dumpBytes(0);
        return false;
    }
    m_directoryValid = true;
    ProgressClock progress = startProgress();
    MatFileSource source(*device());
    source.setBigEndian(m_swap);
    quint32 tag = 0;
    for (qint64 start = source.position(); source.readNumber(tag); start = source.position()) {
        if (progress.shouldStop(start, device()->size())) {
            return Tracer::fail("Action aborted by user.");
        }
        if (!readElement(tag, source)) {
            dumpBytes(start);
            return false;
        }
    }
    return true;
}

bool MatFileAccess::readElement(quint32 tag, MatSource &source)
{
    if (tag > 0xFFFFU) {
        return addSmallElement(tag, source);
    }
    switch (tag) {
    case mat::MatrixType:
        return addMatrix(source);
    case mat::CompressedType:
        return addCompressedElement(source);
    default:
        return addRegularElement(tag, source);
    }
}

bool MatFileAccess::addSmallElement(quint32 tag, MatSource &source)
{
    say("Evaluating small data element...");
    const quint32 type = tag & 0xFFFFU;
    const quint32 length = tag >> 16U;
    constexpr quint32 LastType = 18;
    if (type > LastType) {
        return Tracer::fail(QString("Invalid data type: %1").arg(type));
    }
    if (length > 4) {
        return Tracer::fail(QString("Invalid data length: %1").arg(length));
    }
    MatEntry entry;
    entry.position = source.position();
    entry.size = length;
    entry.type = type;
    entry.small = true;
    m_directory.append(entry);
    if (!source.seek(entry.position + 4)) {
        say("End of file reached.");
    }
    return true;
}

bool MatFileAccess::addRegularElement(quint32 tag, MatSource &source)
{
    say("Evaluating regular, uncompressed data element...");
    MatEntry entry;
    if (!source.readNumber(entry.size)) {
        return Tracer::fail("Cannot read number of bytes of matrix element.");
    }
    entry.type = tag;
    entry.position = source.position();
    m_directory.append(entry);
    if (!source.seek(entry.position + mat::paddedSize(entry.size))) {
        say("End of file reached.");
    }
    return true;
}

bool MatFileAccess::addMatrix(MatSource &source)
{
    say("Evaluating matrix element...");
    MatEntry entry;
    if (!source.readNumber(entry.size)) {
        return Tracer::fail("Cannot read number of bytes of matrix element.");
    }
    say(QString("  Data size is %1 bytes.").arg(entry.size));
    entry.type = mat::MatrixType;
    entry.position = source.position();
    const qint64 end = entry.position + entry.size;
    if (auto *inflated = dynamic_cast<InflateSource *>(&source)) {
        // Some programs fill the compressed bytes of an element up.
        inflated->setBound(entry.position + mat::paddedSize(entry.size));
    }
    if (!mat::readArray(source, end, entry)) {
        return false;
    }
    m_directory.append(entry);
    if (!source.seek(end)) {
        say("End of file reached.");
    }
    return true;
}

bool MatFileAccess::addCompressedElement(MatSource &source)
{
    say("Entering compressed element...");
    quint32 size = 0;
    if (!source.readNumber(size)) {
        return Tracer::fail("Cannot read data size.");
    }
    say(QString("  Compressed array size is %1 bytes.").arg(size));
    const qint64 position = source.position();
    ProgressClock progress = startProgress();
    InflateSource inflated(*device(), size,
                           [&] { return progress.shouldStop(device()->pos(), device()->size()); });
    const qsizetype entries = m_directory.size();
    if (!addInflated(inflated)) {
        return inflated.hasFailed() ? Tracer::fail("Uncompressing data failed.") : false;
    }
    if (!inflated.finish()) {
        return Tracer::fail("Uncompressing data failed.");
    }
    say(QString("  Uncompressed size is %1 bytes.").arg(inflated.position()));
    for (qsizetype i = entries; i < m_directory.size(); ++i) {
        m_directory[i].position = position;
        m_directory[i].compressed = true;
        m_directory[i].size = size;
    }
    const bool atEnd = !source.seek(position + size);
    say(atEnd ? "  End of file reached." : "  Leaving compressed element...");
    return true;
}

bool MatFileAccess::addInflated(InflateSource &inflated)
{
    quint32 tag = 0;
    if (!inflated.readNumber(tag)) {
        return Tracer::fail("  Cannot read data type.");
    }
    if (tag == mat::MatrixType) {
        say("  Entering compressed matrix field...");
        return addMatrix(inflated);
    }
    say("  Entering compressed regular element...");
    return addRegularElement(tag, inflated);
}

void MatFileAccess::dumpBytes(qint64 start) const
{
    if (!Tracer::isEnabled(Tracer::Debug)) {
        return;
    }
    constexpr int RowLength = 16;
    constexpr int Rows = 8;
    const qint64 position = device()->pos();
    Tracer::Trace(Tracer::Debug, QString::asprintf("Current pos: %08llX , start: %08llX",
                                                   static_cast<unsigned long long>(position),
                                                   static_cast<unsigned long long>(start)));
    qint64 at = std::max<qint64>(position - Rows / 2 * RowLength, 0);
    if (!device()->seek(at)) {
        return;
    }
    const QByteArray bytes = device()->read(static_cast<qint64>(Rows) * RowLength);
    for (qsizetype row = 0; row < bytes.size(); row += RowLength, at += RowLength) {
        QString line = QString::asprintf("%08llX:  ", static_cast<unsigned long long>(at));
        for (const char byte : bytes.mid(row, RowLength)) {
            line += QString::asprintf("%02X ", static_cast<unsigned char>(byte));
        }
        Tracer::Trace(Tracer::Debug, line);
    }
}

const MatEntry *MatFileAccess::usableEntry(const QString &name) const
{
    const auto entry =
        std::find_if(m_directory.begin(), m_directory.end(), [&name](const MatEntry &candidate) {
            return candidate.name == name && candidate.type == mat::MatrixType && !candidate.small;
        });
    if (name.isEmpty() || entry == m_directory.end()) {
        Tracer::Trace(Tracer::Error, "Variable not found in directory.");
        return nullptr;
    }
    const QString text = refusal(*entry);
    if (!text.isEmpty()) {
        Tracer::Trace(Tracer::Error, text);
        return nullptr;
    }
    return &*entry;
}

bool MatFileAccess::readVariable(const QString &name, BufferedIO *stream, qint64 *limit)
{
    say("Reading variable " + name);
    if (!m_directoryValid) {
        return Tracer::fail("Directory structure is invalid.");
    }
    if (!isOpen()) {
        return Tracer::fail("File is not open.");
    }
    const MatEntry *entry = usableEntry(name);
    if (!entry) {
        return false;
    }
    qint64 samples = entry->realCount;
    if (limit) {
        samples = *limit > 0 ? std::min(samples, *limit) : samples;
        *limit = samples;
    }
    if (!device()->seek(entry->position)) {
        return Tracer::fail("Cannot set start position of data block.");
    }
    if (!entry->compressed) {
        return Tracer::fail("TO DO: !!! Evaluate data of uncompressed elements !!!");
    }
    // The samples and, on their way, the real parts.
    if (!hasTemporaryRoomFor(samples * (BufferedIO::RecordSize + qint64(sizeof(float))))) {
        return false;
    }
    if (!stream->writeHeader(BufferedIO::DataHeader)) {
        return Tracer::fail("Cannot write to temporary file.");
    }
    return copySamples(*entry, samples, *stream);
}

/// The parts stand one after the other: the real one waits in a temporary file, so that the data
/// is inflated once and never held in memory.
bool MatFileAccess::copySamples(const MatEntry &entry, qint64 samples, BufferedIO &stream)
{
    ProgressClock progress = startProgress();
    const qint64 first = entry.position;
    InflateSource inflated(*device(), entry.size, [&] {
        return progress.shouldStop(device()->pos() - first, entry.size);
    });
    TempStream realPart;
    if (!realPart.open()) {
        return Tracer::fail("Cannot create temporary data buffer.");
    }
    std::vector<char> bytes(8 * StreamBlockSamples);
    std::vector<float> values(StreamBlockSamples);
    std::vector<float> iq(floatsOf(StreamBlockSamples));
    const auto readPart = [&](qint64 position, quint32 type, auto &&take) {
        const qint64 size = mat::typeSize(type);
        bool found = inflated.seek(position);
        for (qint64 done = 0; found && done < samples;) {
            const qint64 count = std::min<qint64>(samples - done, StreamBlockSamples);
            found = inflated.read(bytes.data(), count * size) == count * size;
            if (found) {
                mat::toFloats(type, bytes.data(), count, values.data());
                if (!take(static_cast<int>(count))) {
                    return Tracer::fail("Cannot write to temporary file.");
                }
                done += count;
            }
        }
        return found || Tracer::fail(inflated.hasFailed() ? "Decompressing data failed."
                                                          : "Data index is out of range.");
    };
    constexpr int FloatSize = sizeof(float);
    const auto keep = [&](int count) {
        return realPart->writeBytes(count * FloatSize, values.data());
    };
    const auto combine = [&](int count) {
        std::vector<float> real(static_cast<size_t>(count));
        if (realPart->readBlock(count * FloatSize, real.data()) != count * FloatSize) {
            return false;
        }
        for (size_t i = 0; i < real.size(); ++i) {
            iq[2 * i] = real[i];
            iq[2 * i + 1] = values[i];
        }
        return writeSamples(stream, std::span(iq).first(floatsOf(count)));
    };
    if (!readPart(entry.realPosition, entry.realType, keep)) {
        return false;
    }
    return (realPart->restartAtBegining() || Tracer::fail("Cannot write to temporary file.")) &&
           readPart(entry.imagPosition, entry.imagType, combine);
}
