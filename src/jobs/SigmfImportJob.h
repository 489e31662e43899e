// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "ImportJob.h"

#include "import/SigmfFileAccess.h"
#include "streams/RunLengthDevice.h"
#include "streams/TempStream.h"

struct SigmfImportRequest
{
    QString inputFile;
    ImportTarget target;
    int channel = 1;           ///< counted from 1
    bool clockFromFile = true; ///< the recording's sample rate, held to the permitted clocks
};

/// Makes a waveform from a SigMF recording, with its markers and texts.
class SigmfImportJob : public ImportJob
{
    Q_OBJECT

public:
    explicit SigmfImportJob(SigmfImportRequest request, QObject *parent = nullptr);

private:
    [[nodiscard]] std::optional<qint64> readInput(TempStream &data, qint64 limit) override;
    [[nodiscard]] BufferedIO *foundMarkers() override
    {
        return m_hasMarkers ? &m_markers : nullptr;
    }
    [[nodiscard]] BufferedIO *unknownTags() override
    {
        return m_hasTags ? m_tags.stream() : nullptr;
    }
    [[nodiscard]] bool keepTexts(const SigmfMetadata &metadata);

    SigmfImportRequest m_request;
    bool m_hasMarkers = false;
    bool m_hasTags = false;
    RunLengthDevice m_markerBytes;
    BufferedIO m_markers{1024 * 1024}; // destroyed before its device
    TempStream m_tags{1024 * 1024};
};
