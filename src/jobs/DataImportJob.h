// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "ImportJob.h"

#include "wvfile/WvTypes.h"

struct DataImportRequest
{
    WvImportJob input; ///< its scaling counts, not that of the target
    ImportTarget target;
    /// A clock that the text names counts. Without one, and with a target clock of 0, the job
    /// fails.
    bool clockFromFile = true;
    qint64 limit = 0; ///< the most samples; 0 for all
};

/// Makes a waveform from text or raw numbers.
class DataImportJob : public ImportJob
{
    Q_OBJECT

public:
    explicit DataImportJob(DataImportRequest request, QObject *parent = nullptr);

    /// Comment and copyright that the text holds.
    [[nodiscard]] const WvWriteJob &tags() const { return m_tags; }

private:
    [[nodiscard]] std::optional<qint64> readInput(TempStream &data, qint64 limit) override;
    [[nodiscard]] bool scale(TempStream &data, qint64 samples) override;
    void reportSaving() override;

    DataImportRequest m_request;
    WvWriteJob m_tags;
};
