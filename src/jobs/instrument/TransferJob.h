// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "InstrumentJob.h"

#include "base/OutputFile.h"

#include <QStringList>

/// Copies files between the disk and an instrument by a CopyJob for each, under a name of its own
/// at the target.
class TransferJob final : public InstrumentJob
{
    Q_OBJECT

public:
    enum class Direction { Get, Put };

    struct Request
    {
        Direction direction = Direction::Get;
        QStringList locals; ///< one to be written, or those to be sent
        QString remote; ///< with "/" or as the instrument writes it; a folder ends in a separator
        /// Of a local file. A remote one is replaced.
        OutputFile::Existing existing = OutputFile::Existing::Replaced;
        /// Of the waveforms to be sent.
        WaveformCheck check = WaveformCheck::None;
    };

    /// A local file stays as it was after a failure.
    TransferJob(InstrumentRef instrument, Request request, QObject *parent = nullptr);

protected:
    [[nodiscard]] bool talk(VisaDevice &device) override;

private:
    [[nodiscard]] bool areFit(const VisaDevice &device);
    [[nodiscard]] bool copy(VisaDevice &device, const QString &localName);

    Request m_request;
};
