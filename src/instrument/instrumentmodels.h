// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <QString>
#include <QStringList>

#include <optional>

/// One row of the table of supported instruments.
struct InstrumentModel
{
    const char *name;       ///< sought in the model field of the "*IDN?" answer
    bool unixFileSystem;    ///< its paths use "/", otherwise the backslash
    const char *roots;      ///< with "|" between them; empty: no file system to browse
    const char *diskOption; ///< option that adds the root "/hdd/"; empty: none does
    bool basebandCoder;     ///< waveform commands begin with SOUR:BB:, its progress can be asked
    bool reserved;          ///< read by nothing
    bool analyzer;          ///< a source of captured samples
};

/// Frequency range of an RF path, Hz.
struct FrequencyRange
{
    double lower = 0;
    double upper = 0;
};

/// What a baseband generator can play.
struct BasebandLimits
{
    int size = 0;      ///< memory, samples
    int clock = 0;     ///< highest clock, Hz
    int bandwidth = 0; ///< Hz
};

/// The model index of an instrument that is in no row.
inline constexpr int NoModel = 99;

/// Number of the first row whose name occurs in the model field, with regard to case; NoModel if
/// there is none. The order of the rows decides where one name lies inside another.
[[nodiscard]] int findModel(const QString &modelField);

/// The row; null for NoModel.
[[nodiscard]] const InstrumentModel *modelRow(int index);

/// Top folders of the instrument's file system that hold waveforms.
[[nodiscard]] QStringList rootsOf(int modelIndex, const QString &options);

/// Range of RF path 1 or 2 by the options. Nothing if there is no such path.
[[nodiscard]] std::optional<FrequencyRange> rfRangeOf(int modelIndex, const QString &options,
                                                      int path);

/// Limits of baseband 1 or 2, counted by their place in the options. Nothing if there is no such
/// baseband.
[[nodiscard]] std::optional<BasebandLimits> basebandOf(int modelIndex, const QString &options,
                                                       int baseband);

/// The largest limits that any options give the first baseband of a model. Nothing if it has none.
[[nodiscard]] std::optional<BasebandLimits> largestBasebandOf(int modelIndex);

/// The serial number in field 2 of the "*IDN?" answer, whose two halves generators and analyzers
/// send in opposite order.
[[nodiscard]] QString serialOf(int modelIndex, const QString &field);
