// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "ImportJob.h"

struct MatImportRequest
{
    QString inputFile;
    QString variable;
    ImportTarget target;
};

/// Makes a waveform from a complex vector of a MATLAB file.
class MatImportJob : public ImportJob
{
    Q_OBJECT

public:
    explicit MatImportJob(MatImportRequest request, QObject *parent = nullptr);

private:
    [[nodiscard]] std::optional<qint64> readInput(TempStream &data, qint64 limit) override;

    MatImportRequest m_request;
};
