// SPDX-License-Identifier: Apache-2.0
#include "RemoteEntry.h"

#include <QtAlgorithms>

#include <utility>

struct RemoteEntry::Data
{
    Data() = default;
    ~Data()
    {
        qDeleteAll(children);
        qDeleteAll(staged);
    }
    Data(const Data &) = delete;
    Data &operator=(const Data &) = delete;

    void numberChildren()
    {
        for (qsizetype i = 0; i < children.size(); ++i) {
            children.at(i)->m_data->row = static_cast<int>(i);
        }
    }

    RemoteEntryInfo info;
    RemoteEntry *parent = nullptr;
    QList<RemoteEntry *> children;
    QList<RemoteEntry *> staged;
    int row = 0;
    bool read = true;
    bool reading = false;
    bool readError = false;
    bool expanded = false;
    QString fullPath;
    QString iconName;
};

namespace {

QString iconFor(const RemoteEntryInfo &info)
{
    const QString &name = info.name;
    if (info.isDirectory) {
        const bool isTop = name.startsWith('/') || (name.size() > 1 && name.at(1) == ':');
        return isTop && info.owner != "DIR" ? "drive" : "folder";
    }
    if (info.owner == "BIN" && name.endsWith(".wv", Qt::CaseInsensitive)) {
        return "file_waveform";
    }
    if (info.owner == "ASC") {
        return "file_ascii";
    }
    return info.owner == "SET" ? "file_settings" : "file_binary";
}

} // namespace

RemoteEntry::RemoteEntry(RemoteEntry *parent)
    : RemoteEntry(RemoteEntryInfo{}, parent)
{
}

RemoteEntry::RemoteEntry(const RemoteEntryInfo &info, RemoteEntry *parent)
    : m_data(std::make_shared<Data>())
{
    m_data->info = info;
    m_data->parent = parent;
    m_data->read = !info.isDirectory;
    if (info.isValid()) {
        m_data->iconName = iconFor(info);
    }
    if (info.isDirectory) {
        m_data->children.append(new RemoteEntry(this));
    }
}

const RemoteEntryInfo &RemoteEntry::info() const
{
    return m_data->info;
}

RemoteEntry *RemoteEntry::parent() const
{
    return m_data->parent;
}

const QList<RemoteEntry *> &RemoteEntry::children() const
{
    return m_data->children;
}

int RemoteEntry::row() const
{
    return m_data->row;
}

QString RemoteEntry::fullPath() const
{
    if (m_data->fullPath.isEmpty()) {
        QString path = m_data->parent != nullptr ? m_data->parent->fullPath() : QString();
        path += m_data->info.name;
        if (m_data->info.isDirectory && !m_data->info.name.endsWith('/')) {
            path += '/';
        }
        m_data->fullPath = path;
    }
    return m_data->fullPath;
}

QString RemoteEntry::iconName() const
{
    return m_data->iconName;
}

bool RemoteEntry::isRead() const
{
    return m_data->read;
}

void RemoteEntry::setRead(bool read)
{
    m_data->read = read;
}

bool RemoteEntry::isReading() const
{
    return m_data->reading;
}

void RemoteEntry::setReading(bool reading)
{
    m_data->reading = reading;
}

bool RemoteEntry::hasReadError() const
{
    return m_data->readError;
}

void RemoteEntry::setReadError(bool failed)
{
    m_data->readError = failed;
}

bool RemoteEntry::isExpanded() const
{
    return m_data->expanded;
}

void RemoteEntry::setExpanded(bool expanded)
{
    m_data->expanded = expanded;
}

void RemoteEntry::stage(std::unique_ptr<RemoteEntry> child)
{
    m_data->staged.append(child.release());
}

const QList<RemoteEntry *> &RemoteEntry::staged() const
{
    return m_data->staged;
}

void RemoteEntry::publishStaged(const QList<RemoteEntry *> &order)
{
    Q_ASSERT(order.size() == m_data->staged.size());
    m_data->staged.clear();
    m_data->children.append(order);
    m_data->numberChildren();
}

QList<RemoteEntry *> RemoteEntry::takeFirstChildren(qsizetype count)
{
    QList<RemoteEntry *> taken = m_data->children.first(count);
    m_data->children.remove(0, count);
    m_data->numberChildren();
    return taken;
}

void RemoteEntry::reorderChildren(const QList<RemoteEntry *> &order)
{
    Q_ASSERT(order.size() == m_data->children.size());
    m_data->children = order;
    m_data->numberChildren();
}
