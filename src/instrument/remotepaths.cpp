// SPDX-License-Identifier: Apache-2.0
#include "remotepaths.h"

#include <QHostAddress>
#include <QRegularExpression>
#include <QStringList>

#include <algorithm>

namespace {

constexpr QChar Backslash('\\');

bool isSeparator(QChar character)
{
    return character == '/' || character == Backslash;
}

} // namespace

bool isFolderPath(QStringView path)
{
    return path.endsWith('/');
}

QString withoutEndSlash(const QString &path)
{
    qsizetype length = path.size();
    while (length > 1 && isSeparator(path.at(length - 1))) {
        --length;
    }
    return path.left(length);
}

QString entryName(const QString &path)
{
    return withoutEndSlash(path).section('/', -1);
}

QString parentFolder(const QString &path)
{
    const QString entry = withoutEndSlash(path);
    return entry == "/" ? entry : entry.left(entry.lastIndexOf('/') + 1);
}

QString folderOf(const QString &path)
{
    return path.left(path.lastIndexOf('/') + 1);
}

bool staysBelow(const QString &relativePath)
{
    const QStringList parts = relativePath.split('/');
    return !parts.contains("..") && !parts.contains(QString());
}

bool hasForbiddenCharacter(QStringView name)
{
    return std::any_of(name.begin(), name.end(), [](QChar character) {
        return QStringView(u"*#+/\\&'\"?%").contains(character);
    });
}

QString sendingProblem(const QString &name)
{
    const auto found = std::find_if(name.cbegin(), name.cend(), [](QChar character) {
        return QStringView(u"'\"*?\\").contains(character);
    });
    return found == name.cend() ? QString()
                                : QString("The name \"%1\" holds the character %2, which has a "
                                          "meaning in the commands of an instrument.")
                                      .arg(name, *found);
}

QString pathProblem(const QString &path)
{
    if (path.isEmpty()) {
        return "the path on the instrument is empty";
    }
    return {};
}

QString fullPathProblem(const QString &path)
{
    const RemotePath parts = splitPath(path);
    const bool isName =
        !parts.fileName.isEmpty() && parts.fileName != "." && parts.fileName != "..";
    const bool isFull = isName && parts.directory != parts.drive;
    return !pathProblem(path).isEmpty() || isFull ? pathProblem(path)
                                                  : "'" + path + "' is no full path";
}

QString nativePath(const QString &path, QChar separator)
{
    return QString(path).replace('/', separator);
}

QString slashPath(const QString &path, QChar separator)
{
    return QString(path).replace(separator, '/');
}

RemotePath splitPath(const QString &path)
{
    RemotePath parts;
    if (path.size() > 1 && path.at(1) == ':') {
        parts.drive = path.left(2);
    }
    qsizetype separator = path.lastIndexOf('/');
    if (separator < 0) {
        separator = path.lastIndexOf(Backslash);
    }
    // A drive without a folder, as in "D:file.wv", is the folder that is current there.
    const qsizetype nameBegin = separator < 0 ? parts.drive.size() : separator + 1;
    parts.directory = path.left(nameBegin);
    parts.fileName = path.mid(nameBegin);
    const qsizetype point = parts.fileName.lastIndexOf('.');
    parts.baseName = point < 0 ? parts.fileName : parts.fileName.left(point);
    parts.suffix = point < 0 ? QString() : parts.fileName.mid(point + 1);
    return parts;
}

QString joinRemotePath(const QString &parent, const QString &name, QChar separator)
{
    const auto unified = [separator](QString text) {
        return text.replace('/', separator).replace(Backslash, separator);
    };
    QString head = unified(parent);
    while (head.endsWith(separator)) {
        head.chop(1);
    }
    QString tail = unified(name);
    while (tail.startsWith(separator)) {
        tail.remove(0, 1);
    }
    return head + separator + tail;
}

QString commandString(QString text)
{
    return '\'' + text.replace('\'', "''") + '\'';
}

bool isSameName(const QString &one, const QString &other, bool unixFileSystem)
{
    return one.compare(other, unixFileSystem ? Qt::CaseSensitive : Qt::CaseInsensitive) == 0;
}

QStringList resourceSections(const QString &resource)
{
    static const QRegularExpression separator("::(?![^\\[]*\\])");
    return resource.split(separator);
}

QString hostOf(const QString &resource)
{
    const QString host = resourceSections(resource).value(1);
    return host.startsWith('[') && host.endsWith(']') ? host.mid(1, host.size() - 2) : host;
}

QString networkHead(const QString &host)
{
    return "TCPIP::" + (host.contains(':') ? '[' + host + ']' : host) + "::";
}

QString plainResource(const QString &resource)
{
    QStringList parts = resourceSections(resource.trimmed().toUpper());
    // A number that is left out is 0, a kind that is left out INSTR.
    if (!parts.first().isEmpty() && !parts.first().back().isDigit()) {
        parts.first() += '0';
    }
    if (parts.last() != "INSTR" && parts.last() != "SOCKET") {
        parts.append("INSTR");
    }
    if (parts.first().startsWith("TCPIP") && parts.size() == 3 && parts.last() == "INSTR") {
        parts.insert(2, "INST0");
    }
    return parts.join("::");
}

QList<RemoteFileEntry> parseCatalogue(const QString &answer)
{
    QList<RemoteFileEntry> entries;
    const qsizetype firstQuote = answer.indexOf('"');
    if (firstQuote < 0) {
        return entries;
    }
    const QStringList parts = answer.mid(firstQuote).split("\",\"");
    for (QString part : parts) {
        part.remove('"');
        if (part.count(',') < 2 || part.startsWith('.')) {
            continue;
        }
        const qsizetype lastComma = part.lastIndexOf(',');
        const qsizetype typeComma = part.lastIndexOf(',', lastComma - 1);
        bool isNumber = false;
        RemoteFileEntry entry;
        // What stands before the two last commas is the name, which may hold commas itself.
        entry.name = part.left(typeComma);
        entry.type = part.mid(typeComma + 1, lastComma - typeComma - 1);
        entry.size = part.mid(lastComma + 1).toLongLong(&isNumber);
        if (isNumber && !entry.name.isEmpty() && !entry.type.isEmpty()) {
            entries.append(entry);
        }
    }
    return entries;
}

QString resourceOf(const QString &text)
{
    QString trimmed = text.trimmed();
    const bool isAddress = QHostAddress(trimmed).protocol() == QAbstractSocket::IPv6Protocol ||
                           trimmed.startsWith('[');
    if (trimmed.isEmpty() || (trimmed.contains("::") && !isAddress)) {
        return trimmed;
    }
    return networkHead(trimmed.startsWith('[') ? hostOf("::" + trimmed) : trimmed) + "INSTR";
}
