// SPDX-License-Identifier: Apache-2.0
#include "foreignfile.h"

#include <QFile>
#include <QFileInfo>

#include <algorithm>

namespace {

struct Signature
{
    int position;
    QByteArrayView bytes;
    const char *kind;
};

constexpr int HeadSize = 4096;

QString kindBySignature(const QByteArray &head)
{
    static const Signature signatures[] = {
        {8, "WAVE", "a WAV sound file"},
        {0, "MATLAB 5.0", "a MATLAB file"},
        {0, "\x89HDF", "an HDF5 file, such as those of MATLAB 7.3"},
        {0, "\x89PNG", "a PNG picture"},
        {0, "\xFF\xD8\xFF", "a JPEG picture"},
        {0, "GIF8", "a GIF picture"},
        {0, "%PDF", "a PDF document"},
        {0, "PK\x03\x04", "a ZIP archive"},
        {0, "\x1F\x8B", "a gzip archive"},
        {0,
         "\x7F"
         "ELF",
         "a program"},
        {257, "ustar", "a tar archive, such as those of SigMF"},
    };
    for (const Signature &signature : signatures) {
        if (head.mid(signature.position, signature.bytes.size()) == signature.bytes) {
            return signature.kind;
        }
    }
    return {};
}

/// Letters in any encoding that keeps ASCII, without the bytes that texts don't hold.
bool isText(const QByteArray &head)
{
    return std::all_of(head.cbegin(), head.cend(), [](char byte) {
        const auto code = static_cast<unsigned char>(byte);
        return code >= 0x20 || byte == '\n' || byte == '\r' || byte == '\t' || byte == '\f';
    });
}

} // namespace

QString foreignKind(const QString &fileName)
{
    const QFileInfo info(fileName);
    if (info.isDir()) {
        return "a folder";
    }
    if (info.exists() && !info.isFile()) {
        return "a device or a pipe";
    }
    QFile file(fileName);
    if (!file.open(QIODevice::ReadOnly)) {
        return {};
    }
    const QByteArray head = file.read(HeadSize);
    if (head.isEmpty()) {
        return "empty";
    }
    if (head.startsWith("{TYPE")) {
        return {};
    }
    if (QString kind = kindBySignature(head); !kind.isEmpty()) {
        return kind;
    }
    const QByteArray start = head.trimmed();
    if (start.startsWith('{') && head.contains("\"core:")) {
        return "the metadata of a SigMF recording";
    }
    if (head.contains("<!DOCTYPE HV_Corvane_Waveform_Composer")) {
        return "a document of the Composer";
    }
    if (start.startsWith("<svg") || (start.startsWith("<?xml") && head.contains("<svg"))) {
        return "an SVG picture";
    }
    return isText(head) ? "text" : "binary data of another kind";
}
