// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "SampleReadJob.h"

#include "DumpJob.h"
#include "base/OutputFile.h"
#include "wvfile/SampleCoding.h"

#include <QStringList>

#include <optional>

/// Forms of a file for other programs, told by the suffix of its name.
enum class ExportFormat { Wav, Cf32, Cs16, Csv, Mat, Sigmf };

/// How a value is stored, where a format leaves a choice.
enum class ExportType { Float32, Int16, Int24 };

/// The names of the types, in their order, as users give them.
[[nodiscard]] QStringList exportTypeNames();

struct ExportRequest
{
    SampleRange range;
    QString outputFile;
    std::optional<ExportType> type; ///< nothing: that of the words in the file, if possible
    bool overwrite = true;
};

/// The format of a file name; nothing for a suffix that none has.
[[nodiscard]] std::optional<ExportFormat> exportFormat(const QString &fileName);

/// The suffixes of all formats.
[[nodiscard]] QStringList exportSuffixes();

/// The types among which the format of a file name leaves the choice; none if it has one form only.
[[nodiscard]] QList<ExportType> exportTypes(const QString &fileName);

/// Why name and type of the request don't go together, naming what is permitted; empty if they do.
[[nodiscard]] QString exportProblem(const ExportRequest &request);

/// The files that an export to this name writes.
[[nodiscard]] QStringList exportedFiles(const QString &fileName);

/// Writes a range of samples for other programs. What a format can't hold is told by a warning.
class ExportJob : public SampleReadJob
{
    Q_OBJECT

public:
    explicit ExportJob(ExportRequest request, QObject *parent = nullptr);

protected:
    [[nodiscard]] bool process(SourceWaveform &source, qint64 begin, qint64 count) override;

private:
    [[nodiscard]] bool writeBody(SourceWaveform &source, qint64 begin, qint64 count);
    [[nodiscard]] bool writeWav(SourceWaveform &source, qint64 begin, qint64 count);
    [[nodiscard]] bool writeMat(SourceWaveform &source, qint64 begin, qint64 count);
    [[nodiscard]] bool writeSigmf(SourceWaveform &source, qint64 begin, qint64 count);
    [[nodiscard]] bool writePlain(SourceWaveform &source, qint64 begin, qint64 count,
                                  DumpFormat format);
    [[nodiscard]] qint64 bytesPerSample() const;
    [[nodiscard]] bool put(const QByteArray &bytes);
    [[nodiscard]] bool commit();
    [[nodiscard]] QByteArray encoded(std::span<const float> values, ExportType type);
    [[nodiscard]] ExportType type() const { return m_request.type.value_or(ExportType::Int16); }

    ExportRequest m_request;
    OutputFile m_file;
    QString m_fileName;
    ClipCount m_clipped;
};
