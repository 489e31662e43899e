// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "RemoteEntry.h"

#include <QList>
#include <QObject>
#include <QPointer>
#include <QStringList>
#include <QUrl>

class VisaDevice;

/// Holds the tree of an instrument's files and reads its folders. Reading runs in the calling
/// thread, and the signals go out before the call returns.
class instrIO : public QObject
{
    Q_OBJECT

public:
    explicit instrIO(QObject *parent = nullptr);
    ~instrIO() override;

    /// Not owned; may be null, and may be destroyed before this object. The tree stays until
    /// refresh().
    void setDevice(VisaDevice *device);
    [[nodiscard]] VisaDevice *device() const;

    /// Wildcards for the names of files, one of which has to match a whole name without regard to
    /// case; none means all files. Folders always pass. For reads from now on.
    void setNameFilters(const QStringList &filters) { m_nameFilters = filters; }

    /// Builds the top folders anew; every entry of the old tree is gone. Without an open device
    /// there are none, and no signal is sent.
    void refresh();

    /// Reads a folder, unless it is read or is being read. What was found waits in the entry while
    /// readingDone() is sent, and replaces its children at the latest then.
    void read(RemoteEntry *entry);

    [[nodiscard]] bool rootsRead() const { return m_rootsRead; }
    [[nodiscard]] const QList<RemoteEntry *> &roots() const { return m_roots; }
    [[nodiscard]] QUrl url() const { return m_url; }

signals:
    /// Null stands for the top folders.
    void readingDone(RemoteEntry *entry);
    void readingFailed(RemoteEntry *entry);

private:
    [[nodiscard]] bool isOpen() const;
    [[nodiscard]] bool isInTree(const RemoteEntry *entry) const;
    [[nodiscard]] bool matchesFilters(const QString &name) const;
    void fail(RemoteEntry *entry);

    bool m_rootsRead = false;
    QPointer<VisaDevice> m_device;
    QList<RemoteEntry *> m_roots;
    QUrl m_url;
    QStringList m_nameFilters;
};
