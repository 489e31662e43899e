// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "InstrumentJob.h"

/// One operation on one file or folder of an instrument. Paths are with "/" or as the instrument
/// writes them, with or without a separator at the end.
class EntryJob final : public InstrumentJob
{
    Q_OBJECT

public:
    enum class Operation {
        MakeFolder,
        Rename,
        RemoveFile,   ///< done as well if there is no such file
        RemoveFolder, ///< an empty one
    };

    /// `newName` is that of Operation::Rename, in the same folder.
    EntryJob(InstrumentRef instrument, Operation operation, QString path, QString newName = {},
             QObject *parent = nullptr);

protected:
    [[nodiscard]] bool talk(VisaDevice &device) override;

private:
    Operation m_operation;
    QString m_path;
    QString m_newName;
};

/// Removes a folder of an instrument with all it holds. What was removed before a failure or a
/// cancel is gone.
class RemoveTreeJob final : public InstrumentJob
{
    Q_OBJECT

public:
    RemoveTreeJob(InstrumentRef instrument, QString path, QObject *parent = nullptr);

protected:
    [[nodiscard]] bool talk(VisaDevice &device) override;

private:
    QString m_path;
};
