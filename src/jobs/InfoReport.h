// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "wvfile/WvTypes.h"

#include <QJsonObject>
#include <QList>
#include <QString>

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

/// The report as plain text, one row a line.
[[nodiscard]] QString infoText(const WvFileSummary &summary);

/// The summary under the names of its fields.
[[nodiscard]] QJsonObject infoJson(const WvFileSummary &summary);
