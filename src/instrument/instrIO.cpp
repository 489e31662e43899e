// SPDX-License-Identifier: Apache-2.0
#include "instrIO.h"

#include "VisaDevice.h"
#include "remotepaths.h"

#include <QMetaMethod>
#include <QRegularExpression>

#include <algorithm>
#include <utility>

namespace {

void stageAll(RemoteEntry *folder, const QList<RemoteFileEntry> &entries)
{
    for (const RemoteFileEntry &entry : entries) {
        const RemoteEntryInfo info{.name = entry.name,
                                   .size = entry.size,
                                   .isDirectory = entry.isDirectory(),
                                   .isFile = !entry.isDirectory(),
                                   .owner = entry.type};
        folder->stage(std::make_unique<RemoteEntry>(info, folder));
    }
}

} // namespace

instrIO::instrIO(QObject *parent)
    : QObject(parent)
{
}

instrIO::~instrIO()
{
    qDeleteAll(m_roots);
}

void instrIO::setDevice(VisaDevice *device)
{
    m_device = device;
}

VisaDevice *instrIO::device() const
{
    return m_device;
}

bool instrIO::isOpen() const
{
    return m_device != nullptr && m_device->isOpen();
}

bool instrIO::isInTree(const RemoteEntry *entry) const
{
    while (entry->parent() != nullptr) {
        entry = entry->parent();
    }
    return std::find(m_roots.cbegin(), m_roots.cend(), entry) != m_roots.cend();
}

bool instrIO::matchesFilters(const QString &name) const
{
    return m_nameFilters.isEmpty() ||
           std::any_of(m_nameFilters.cbegin(), m_nameFilters.cend(), [&](const QString &filter) {
               return QRegularExpression(QRegularExpression::wildcardToRegularExpression(filter),
                                         QRegularExpression::CaseInsensitiveOption)
                   .match(name)
                   .hasMatch();
           });
}

void instrIO::refresh()
{
    m_rootsRead = false;
    const QList<RemoteEntry *> old = std::exchange(m_roots, {});
    if (isOpen()) {
        for (const QString &root : m_device->rootDirectories()) {
            m_roots.append(new RemoteEntry(
                {.name = root, .size = 0, .isDirectory = true, .isFile = false, .owner = "ROOT"},
                nullptr));
        }
        m_rootsRead = true;
        emit readingDone(nullptr);
    }
    qDeleteAll(old);
}

void instrIO::read(RemoteEntry *entry)
{
    if (entry == nullptr || entry->isRead() || entry->isReading()) {
        return;
    }
    // The tree may have been replaced, and the device lost, since the entry was shown.
    if (!isInTree(entry) || !isOpen()) {
        fail(entry);
        return;
    }
    entry->setReading(true);
    const QString path = nativePath(entry->fullPath(), m_device->pathSeparator());
    QList<RemoteFileEntry> entries;
    if (!m_device->listDirectory(entries, path)) {
        fail(entry);
        return;
    }
    // Folders first, each kind in the order of the catalogue.
    const auto filesBegin = std::stable_partition(
        entries.begin(), entries.end(), [](const RemoteFileEntry &e) { return e.isDirectory(); });
    entries.erase(
        std::remove_if(filesBegin, entries.end(),
                       [this](const RemoteFileEntry &e) { return !matchesFilters(e.name); }),
        entries.end());
    stageAll(entry, entries);
    entry->setRead(true);
    entry->setReadError(false);
    entry->setReading(false);
    emit readingDone(entry);
    if (!isSignalConnected(QMetaMethod::fromSignal(&instrIO::readingDone))) {
        // No model is there to take the new children.
        const qsizetype oldCount = entry->children().size();
        entry->publishStaged(QList<RemoteEntry *>(entry->staged()));
        qDeleteAll(entry->takeFirstChildren(oldCount));
    }
}

void instrIO::fail(RemoteEntry *entry)
{
    entry->setReading(false);
    entry->setReadError(true);
    emit readingFailed(entry);
}
