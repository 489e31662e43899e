// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <QString>

class QSettings;

/// How numbers stand in a file.
enum class DataFormat { Integer = 0, Rational = 1, Hexadecimal = 2 };

/// Width of a number.
enum class DataPrecision { Bits8 = 0, Bits14 = 1, Bits16 = 2, Bits32 = 3, Bits64 = 4 };

/// What happens to the level of imported samples.
enum class ImportScaling {
    None = 0, ///< stays; samples beyond full scale are clipped
    Down = 1, ///< scaled to full scale if the peak lies beyond it
    Auto = 2, ///< scaled to full scale
};

/// How the numbers of a file become values.
struct ValueFormat
{
    DataFormat dataFormat = DataFormat::Integer;
    DataPrecision precision = DataPrecision::Bits16;
    bool isSigned = true;
    bool bigEndian = false; ///< of binary files
};

/// The input of the generic import.
struct WvImportJob
{
    QString file1; ///< I and Q of each sample, or I alone
    QString file2; ///< Q, if it is used
    bool useFile2 = false;
    bool binary = false;
    ValueFormat format;
    ImportScaling scaling = ImportScaling::Down;
};

/// All that the tool keeps between its uses, and that a preset holds.
struct ImportPreset
{
    WvImportJob job;
    QString outputFile;
    QString comment;
    QString copyright;
    double clockHz = 100e6;
};

/// Writes the keys of a preset into the open group.
void writePreset(QSettings &settings, const ImportPreset &preset);

/// Reads the keys of the open group; those that are missing or mean nothing leave their value.
void readPreset(const QSettings &settings, ImportPreset &preset);

/// Writes a preset into a file of its own. False if that fails; the reason has been logged.
[[nodiscard]] bool savePreset(const QString &fileName, const ImportPreset &preset);

/// Reads a preset of savePreset(); keys outside its group count as well.
[[nodiscard]] bool loadPreset(const QString &fileName, ImportPreset &preset);
