// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "jobs/ToolJob.h"

#include <QHostAddress>
#include <QList>
#include <QString>
#include <QStringList>

struct OperationControl;

/// What one step of an examination has found.
struct DoctorStep
{
    QString step;
    bool ok = false;
    QString text;   ///< what was found
    QString advice; ///< what to do; empty where nothing is to be done
};

/// Walks the way to an instrument step by step, and tells for each what it found: name, route, the
/// three ports, the port mapper, a session by each road that is open, what the instrument says it
/// is, its error queue (which is emptied), and the rights on USB devices. Fails if there is no way.
class DoctorJob final : public ToolJob
{
    Q_OBJECT

public:
    /// A host name or an address.
    explicit DoctorJob(QString host, QObject *parent = nullptr);

    [[nodiscard]] const QList<DoctorStep> &steps() const { return m_steps; }

protected:
    [[nodiscard]] bool work() override;

private:
    void note(const QString &step, bool ok, const QString &text, const QString &advice = {});
    void findRoute(const QHostAddress &address);
    void askPortMapper(const QHostAddress &address);
    [[nodiscard]] QStringList roads(const QList<bool> &areOpen) const;
    [[nodiscard]] bool talk(const QStringList &resources);
    void findUsbRights();

    QString m_host;
    QList<DoctorStep> m_steps;
};
