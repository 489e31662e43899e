// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "EditJob.h"
#include "SampleReadJob.h"

#include "streams/RunLengthDevice.h"
#include "streams/TempStream.h"

/// The piece of a file that becomes a file of its own.
struct CropRequest
{
    SampleRange range;
    OutputOptions output;
};

/// Cuts a piece out of a waveform as it stands, with its markers, the texts and the unknown tags;
/// the level tags are those of the piece.
class CropJob : public EditJob
{
    Q_OBJECT

public:
    explicit CropJob(CropRequest request, QObject *parent = nullptr);

private:
    [[nodiscard]] bool edit() override;
    [[nodiscard]] SampleReading wantedReading() const override { return SampleReading::Located; }
    [[nodiscard]] bool copy(qint64 begin, qint64 count);

    CropRequest m_request;
    TempStream m_data;
    RunLengthDevice m_markerBytes;
    BufferedIO m_markers{1024 * 1024}; // destroyed before its device
    LevelSums m_levels;
};
