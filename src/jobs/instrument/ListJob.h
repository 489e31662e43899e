// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "InstrumentJob.h"

#include "instrument/RemoteFileEntry.h"

#include <QList>

/// Reads a folder of an instrument, or all that lies below it.
class ListJob final : public InstrumentJob
{
    Q_OBJECT

public:
    /// `path` with "/" or as the instrument writes it.
    ListJob(InstrumentRef instrument, QString path, bool recursive, QObject *parent = nullptr);

    /// Of a recursive list, the names are paths below the folder, with "/".
    [[nodiscard]] const QList<RemoteFileEntry> &entries() const { return m_entries; }

protected:
    [[nodiscard]] bool talk(VisaDevice &device) override;

private:
    QString m_path;
    bool m_recursive;
    QList<RemoteFileEntry> m_entries;
};
