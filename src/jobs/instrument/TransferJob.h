// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "InstrumentJob.h"

/// Copies one file between the disk and an instrument by a CopyJob, under a name of its own at the
/// target.
class TransferJob final : public InstrumentJob
{
    Q_OBJECT

public:
    enum class Direction { Get, Put };

    /// `remote` with "/" or as the instrument writes it. An existing file is replaced on either
    /// side; a local one stays as it was after a failure.
    TransferJob(InstrumentRef instrument, Direction direction, QString local, QString remote,
                QObject *parent = nullptr);

protected:
    [[nodiscard]] bool talk(VisaDevice &device) override;

private:
    Direction m_direction;
    QString m_local;
    QString m_remote;
};
