// SPDX-License-Identifier: Apache-2.0
#include "OutputFile.h"

#include <QFile>
#include <QFileInfo>
#include <QSaveFile>

#include <utility>

#include <sys/stat.h>

namespace {

constexpr const char *FileExistsText = "A file of this name exists already";

/// Where a chain of links leads; a ring of them gives one of its links.
QString linkTarget(const QString &fileName)
{
    constexpr int LongestChain = 40;
    QFileInfo file(fileName);
    for (int links = 0; file.isSymLink() && links < LongestChain; ++links) {
        file.setFile(file.symLinkTarget());
    }
    return file.filePath();
}

} // namespace

OutputFile::OutputFile(QString fileName, Existing existing)
    : m_fileName(std::move(fileName))
    , m_existing(existing)
{
}

OutputFile::~OutputFile() = default;

bool OutputFile::open()
{
    m_problem.clear();
    // A chain of links keeps its last one, and a link to nowhere gets its file where it leads.
    m_fileName = linkTarget(m_fileName);
    const QFileInfo target(m_fileName);
    if (m_existing == Existing::Kept && target.exists()) {
        m_problem = FileExistsText;
        return false;
    }
    if (target.isSymLink() || (target.exists() && !target.isFile())) {
        m_file = std::make_unique<QFile>(m_fileName);
        return m_file->open(QIODevice::WriteOnly | QIODevice::Truncate | QIODevice::Unbuffered);
    }
    auto file = std::make_unique<QSaveFile>(m_fileName);
    file->setDirectWriteFallback(true);
    const bool opened = file->open(QIODevice::WriteOnly | QIODevice::Unbuffered);
    m_file = std::move(file);
    return opened;
}

bool OutputFile::isOpen() const
{
    return m_file && m_file->isOpen();
}

bool OutputFile::write(std::span<const char> bytes)
{
    // On a full disk the part that still fits is written without an error; the next write tells the
    // reason.
    while (!bytes.empty()) {
        const qint64 written = m_file->write(bytes.data(), static_cast<qint64>(bytes.size()));
        if (written <= 0) {
            return false;
        }
        bytes = bytes.subspan(static_cast<size_t>(written));
    }
    return true;
}

bool OutputFile::commit()
{
    if (auto *file = qobject_cast<QSaveFile *>(m_file.get())) {
        return m_existing == Existing::Kept ? commitBesides(*file) : file->commit();
    }
    const bool written = m_file->flush();
    m_file->close();
    return written;
}

/// The name is taken first, by an empty file, which the system refuses where one stands.
bool OutputFile::commitBesides(QSaveFile &file)
{
    QFile reserved(m_fileName);
    if (!reserved.open(QIODevice::WriteOnly | QIODevice::NewOnly)) {
        m_problem = QFileInfo::exists(m_fileName) ? FileExistsText : reserved.errorString();
        return false;
    }
    reserved.close();
    if (file.commit()) {
        return true;
    }
    m_problem = file.errorString();
    reserved.remove();
    return false;
}

QString OutputFile::errorString() const
{
    if (!m_problem.isEmpty()) {
        return m_problem;
    }
    return m_file ? m_file->errorString() : QString();
}

bool isSameFile(const QString &one, const QString &other)
{
    struct stat first = {};
    struct stat second = {};
    return stat(QFile::encodeName(one).constData(), &first) == 0 &&
           stat(QFile::encodeName(other).constData(), &second) == 0 &&
           first.st_dev == second.st_dev && first.st_ino == second.st_ino;
}
