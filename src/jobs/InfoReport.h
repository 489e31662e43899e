// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "wvfile/WvTypes.h"

#include <QJsonObject>
#include <QList>
#include <QString>

struct SampleCheck;

/// One row of the information report.
struct InfoRow
{
    enum class Kind {
        File,
        Segment, ///< the name of a segment
        Detail,  ///< belongs to the segment above
    };

    QString label;
    QString value;
    Kind kind = Kind::File;
};

/// The rows on the file itself.
[[nodiscard]] QList<InfoRow> fileRows(const WvFileSummary &summary);

/// The rows on the segments of a multi-segment waveform; empty for a plain one.
[[nodiscard]] QList<InfoRow> segmentRows(const WvFileSummary &summary);

/// The rows on what the samples were measured to be.
[[nodiscard]] QList<InfoRow> checkRows(const SampleCheck &check);

/// The report as plain text, one row a line, with the rows of the check if there is one.
[[nodiscard]] QString infoText(const WvFileSummary &summary, const SampleCheck *check = nullptr);

/// The summary under the names of its fields.
[[nodiscard]] QJsonObject infoJson(const WvFileSummary &summary);

/// The check under the names that scripts know; figures without samples are null.
[[nodiscard]] QJsonObject checkJson(const SampleCheck &check);

/// Scans the tags of a file. False, with the reason logged, if they can't be read, or if the file
/// is no waveform, of which the reason says what it is.
[[nodiscard]] bool scanWaveform(const QString &fileName, WvFileSummary &summary);
