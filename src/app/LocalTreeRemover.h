// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "jobs/ToolJob.h"

#include <QDir>
#include <QString>

class ProgressClock;

/// Removes a local folder with all that lies in it. A link to a folder is removed as a link and
/// never followed. Stops at the first
/// entry that can't be removed, and on cancel; what was removed by then is gone.
class LocalTreeRemover : public ToolJob
{
    Q_OBJECT

public:
    /// All entries that a folder must not hold to count as empty: also hidden ones and links that
    /// lead nowhere.
    static constexpr QDir::Filters Everything =
        QDir::AllEntries | QDir::Hidden | QDir::System | QDir::NoDotAndDotDot;

    explicit LocalTreeRemover(QString folder, QObject *parent = nullptr);

    /// After a failure: the entry that stopped it, and why.
    [[nodiscard]] QString failedPath() const { return m_failedPath; }
    [[nodiscard]] QString reason() const { return m_reason; }

protected:
    [[nodiscard]] bool work() override;

private:
    [[nodiscard]] bool removeContents(const QString &folder, ProgressClock &clock);
    bool fail(const QString &path, const QString &reason);

    QString m_folder;
    QString m_failedPath;
    QString m_reason;
};
