// SPDX-License-Identifier: Apache-2.0
#include "OutputFile.h"

#include <QFile>
#include <QFileInfo>
#include <QSaveFile>

#include <utility>

OutputFile::OutputFile(QString fileName)
    : m_fileName(std::move(fileName))
{
}

OutputFile::~OutputFile() = default;

bool OutputFile::isReplaced() const
{
    const QFileInfo target(m_fileName);
    if (!target.exists()) {
        // The target of a link to nowhere is made where the link leads.
        return !target.isSymLink();
    }
    return target.isFile();
}

bool OutputFile::open()
{
    if (!isReplaced()) {
        m_file = std::make_unique<QFile>(m_fileName);
        return m_file->open(QIODevice::WriteOnly | QIODevice::Truncate | QIODevice::Unbuffered);
    }
    // A chain of links would lose its last one.
    const QString target = QFileInfo(m_fileName).canonicalFilePath();
    auto file = std::make_unique<QSaveFile>(target.isEmpty() ? m_fileName : target);
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
        return file->commit();
    }
    const bool written = m_file->flush();
    m_file->close();
    return written;
}

QString OutputFile::errorString() const
{
    return m_file ? m_file->errorString() : QString();
}
