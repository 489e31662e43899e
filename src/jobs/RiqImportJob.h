// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "ImportJob.h"

class RiqFileAccess;
struct RiqEntry;

struct RiqImportRequest
{
    int packet = 1; ///< counted from 1
    ImportTarget target;
    bool clockFromFile = true; ///< the packet's sample rate, held to the permitted clocks
};

/// Makes a waveform from one packet of a recording, whose directory has been read.
class RiqImportJob : public ImportJob
{
    Q_OBJECT

public:
    /// The reader outlives the job; its file is opened once more and closed in the end.
    RiqImportJob(RiqFileAccess &file, RiqImportRequest request, QObject *parent = nullptr);

    /// The comment that is proposed for a waveform from this packet.
    [[nodiscard]] static QString proposedComment(const RiqEntry &entry);

private:
    [[nodiscard]] std::optional<qint64> readInput(TempStream &data, qint64 limit) override;

    RiqFileAccess &m_file;
    RiqImportRequest m_request;
};
