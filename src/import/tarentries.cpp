// SPDX-License-Identifier: Apache-2.0
#include "tarentries.h"

#include "log/Tracer.h"

namespace {

constexpr qint64 BlockBytes = 512;

std::nullopt_t refuse(const char *reason)
{
    Tracer::Trace(Tracer::Error, reason);
    return std::nullopt;
}

QByteArray field(const QByteArray &block, int begin, int size)
{
    const QByteArray bytes = block.mid(begin, size);
    const auto end = bytes.indexOf('\0');
    return end < 0 ? bytes : bytes.left(end);
}

/// Octal digits, or a binary number where the first bit is set; nothing if it is neither.
std::optional<qint64> numberIn(const QByteArray &block, int begin, int size)
{
    const QByteArray bytes = block.mid(begin, size);
    if ((static_cast<unsigned char>(bytes.at(0)) & 0x80U) != 0) {
        qint64 number = 0;
        for (int i = size - 7; i < size; ++i) {
            number = number << 8 | static_cast<unsigned char>(bytes.at(i));
        }
        return number;
    }
    bool isNumber = false;
    const qint64 number = field(block, begin, size).trimmed().toLongLong(&isNumber, 8);
    return isNumber && number >= 0 ? std::optional(number) : std::nullopt;
}

bool hasChecksum(const QByteArray &block)
{
    constexpr int ChecksumBegin = 148;
    constexpr int ChecksumSize = 8;
    qint64 sum = 0;
    for (int i = 0; i < block.size(); ++i) {
        const bool isChecksum = i >= ChecksumBegin && i < ChecksumBegin + ChecksumSize;
        sum += isChecksum ? ' ' : static_cast<unsigned char>(block.at(i));
    }
    return numberIn(block, ChecksumBegin, ChecksumSize) == sum;
}

/// A record of a pax header: its length, a blank, KEY=VALUE, a line break.
void readPax(const QByteArray &content, QString &name, qint64 &size)
{
    for (qsizetype at = 0; at < content.size();) {
        const auto blank = content.indexOf(' ', at);
        if (blank < 0) {
            return;
        }
        const qsizetype length = content.mid(at, blank - at).toInt();
        if (length <= blank - at + 1 || length > content.size() - at) {
            return; // no room for a record, or beyond the end
        }
        const QByteArray record = content.mid(blank + 1, at + length - blank - 2);
        if (record.startsWith("path=")) {
            name = QString::fromUtf8(record.mid(5));
        } else if (record.startsWith("size=")) {
            size = record.mid(5).toLongLong();
        }
        at += length;
    }
}

} // namespace

std::optional<QList<TarEntry>> tarEntries(QIODevice &archive)
{
    QList<TarEntry> entries;
    QString longName;
    qint64 longSize = -1; // of a pax header; none
    for (qint64 position = 0; position < archive.size();) {
        if (!archive.seek(position)) {
            return refuse("Cannot read the archive.");
        }
        const QByteArray block = archive.read(BlockBytes);
        if (block.size() == BlockBytes && block.count('\0') == BlockBytes) {
            break; // the end mark
        }
        const std::optional<qint64> stated = block.size() == BlockBytes && hasChecksum(block)
                                                 ? numberIn(block, 124, 12)
                                                 : std::nullopt;
        if (!stated) {
            return refuse("This is no archive of SigMF recordings (tar), or it is damaged.");
        }
        position += BlockBytes;
        const char type = block.at(156);
        const bool isFile = type == '0' || type == '\0' || type == '7';
        const qint64 size = isFile && longSize >= 0 ? longSize : *stated;
        if (size < 0 || size > archive.size() - position) {
            return refuse("The archive is cut off.");
        }
        constexpr qint64 LongestHeader = 64 * 1024;
        if (type == 'L' && size <= LongestHeader) {
            longName = QString::fromUtf8(field(archive.read(size), 0, static_cast<int>(size)));
        } else if (type == 'x' && size <= LongestHeader) {
            readPax(archive.read(size), longName, longSize);
        } else if (isFile) {
            const QByteArray prefix = block.mid(257, 6) == QByteArray("ustar\0", 6)
                                          ? field(block, 345, 155)
                                          : QByteArray();
            const QString plain = QString::fromUtf8((prefix.isEmpty() ? prefix : prefix + '/') +
                                                    field(block, 0, 100));
            entries.append({longName.isEmpty() ? plain : longName, position, size});
        }
        if (type != 'L' && type != 'x') {
            longName.clear();
            longSize = -1;
        }
        position += (size + BlockBytes - 1) / BlockBytes * BlockBytes;
    }
    return entries;
}
