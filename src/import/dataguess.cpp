// SPDX-License-Identifier: Apache-2.0
#include "dataguess.h"

#include "log/Tracer.h"

#include <QFile>
#include <QFileInfo>

#include <algorithm>

namespace {

/// The numbers of control characters that have long been taken for text here.
constexpr char ExtraControls[] = {9, 16, 19};

bool isLetterOrDigit(char c)
{
    return (c >= '0' && c <= '9') || (c >= 'a' && c <= 'z') || (c >= 'A' && c <= 'Z');
}

bool isTextByte(char c)
{
    constexpr char Others[] = {' ', '\n', '\v', '\f', '\r', '.', ',', '+', '-'};
    const auto isIn = [c](const auto &list) {
        return std::find(std::begin(list), std::end(list), c) != std::end(list);
    };
    return isLetterOrDigit(c) || isIn(Others) || isIn(ExtraControls);
}

/// A file that holds Q where this one holds I, told by one letter of the names.
QString findPartner(const QString &path)
{
    const QFileInfo info(path);
    const QString name = info.fileName();
    for (qsizetype i = name.size() - 1; i >= 0; --i) {
        if (name[i].toUpper() != 'I') {
            continue;
        }
        QString candidate = name;
        candidate[i] = name[i] == 'i' ? 'q' : 'Q';
        Tracer::Trace(Tracer::Information, QString("Trying to find file '%1'").arg(candidate));
        QString candidatePath = info.path() + '/' + candidate;
        if (QFileInfo(candidatePath).isFile()) {
            Tracer::Trace(Tracer::Information, "  File exists.");
            return candidatePath;
        }
    }
    return {};
}

QString hexDump(const QByteArray &bytes)
{
    constexpr qsizetype RowLength = 7;
    QString text;
    for (qsizetype row = 0; row < bytes.size(); row += RowLength) {
        const QByteArray part = bytes.mid(row, RowLength);
        QString line;
        QString characters;
        for (const char byte : part) {
            line += QString::asprintf("%02X ", static_cast<unsigned char>(byte));
            characters += isLetterOrDigit(byte) ? QLatin1Char(byte) : QLatin1Char('.');
        }
        text += line.leftJustified(3 * RowLength) + characters + '\n';
    }
    return text;
}

} // namespace

bool looksBinary(const QByteArray &head)
{
    return !std::all_of(head.begin(), head.end(), isTextByte);
}

bool guessData(const QString &fileName, DataGuess &guess)
{
    guess = DataGuess();
    guess.partner = findPartner(fileName);
    QFile file(fileName);
    if (!QFileInfo(fileName).isFile()) {
        return Tracer::fail("Primary input file does not exist.");
    }
    if (!file.open(QIODevice::ReadOnly)) {
        return Tracer::fail("Error opening input file.");
    }
    guess.head = file.read(DataGuess::HeadSize);
    Tracer::Trace(Tracer::Information,
                  QString("%1 bytes read from file %2.").arg(guess.head.size()).arg(fileName));
    guess.binary = looksBinary(guess.head);
    Tracer::Trace(Tracer::Information, guess.binary ? "File is BINARY." : "File is ASCII.");
    return true;
}

QString previewText(const QByteArray &head, bool binary)
{
    if (binary) {
        constexpr qsizetype ShownBytes = 80;
        return hexDump(head.left(ShownBytes));
    }
    constexpr qsizetype ShownLines = 100;
    QString text = QString::fromLatin1(head).replace("\r\n", "\n").replace('\r', '\n');
    return text.section('\n', 0, ShownLines - 1);
}
