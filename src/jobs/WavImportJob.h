// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "ImportJob.h"

#include "import/WavFileAccess.h"

#include <optional>

struct WavImportRequest
{
    QString inputFile;
    ImportTarget target;
    bool clockFromFile = true; ///< the file's sample rate, held to the permitted clocks
};

/// Makes a waveform from a WAVE file.
class WavImportJob : public ImportJob
{
    Q_OBJECT

public:
    explicit WavImportJob(WavImportRequest request, QObject *parent = nullptr);

    /// Opens and checks a file; nothing, with the reason logged, if it can't be imported.
    [[nodiscard]] static std::optional<WavHeader> readHeader(WavFileAccess &file,
                                                             const QString &fileName);

private:
    [[nodiscard]] std::optional<qint64> readInput(TempStream &data, qint64 limit) override;

    WavImportRequest m_request;
};
