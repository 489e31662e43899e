// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <QDir>
#include <QObject>
#include <QString>

#include <atomic>

class ProgressClock;

/// Removes a local folder with all that lies in it. A link to a folder is removed as a link and
/// never followed. An object serves one removal.
class LocalTreeRemover : public QObject
{
    Q_OBJECT

public:
    /// All entries that a folder must not hold to count as empty: also hidden ones and links that
    /// lead nowhere.
    static constexpr QDir::Filters Everything =
        QDir::AllEntries | QDir::Hidden | QDir::System | QDir::NoDotAndDotDot;

    using QObject::QObject;

    /// Stops at the first entry that can't be removed, and on cancel; false then. What was removed
    /// by then is gone. Lets the event loop run every 100 ms.
    [[nodiscard]] bool remove(const QString &folder);

    /// After a failure: the entry that stopped it, and why.
    [[nodiscard]] QString failedPath() const { return m_failedPath; }
    [[nodiscard]] QString reason() const { return m_reason; }

public slots:
    void cancel();

signals:
    /// -1, since nobody has counted the entries.
    void ProgressUpdate(int iPercentage);

private:
    [[nodiscard]] bool removeContents(const QString &folder, ProgressClock &clock);
    bool fail(const QString &path, const QString &reason);

    std::atomic<bool> m_cancelled{false};
    QString m_failedPath;
    QString m_reason;
};
