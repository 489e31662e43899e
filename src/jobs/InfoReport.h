// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "wvfile/WvTypes.h"

#include <QJsonObject>
#include <QList>
#include <QString>

/// One row of the information report.
struct InfoRow
{
    QString label;
    QString value;
    bool heading = false; ///< a segment's name
};

/// Colours of the striped table, as CSS values ("#102030").
struct InfoColors
{
    QString text0;
    QString background0;
    QString text1;
    QString background1;
};

/// The rows on the file itself.
[[nodiscard]] QList<InfoRow> fileRows(const WvFileSummary &summary);

/// The rows on the segments of a multi-segment waveform; empty for a plain one.
[[nodiscard]] QList<InfoRow> segmentRows(const WvFileSummary &summary);

/// The report as HTML, with `folder` above the file name. Texts from the file are escaped.
[[nodiscard]] QString infoHtml(const WvFileSummary &summary, const QString &folder,
                               const InfoColors &colors);

/// The report as plain text, one row a line.
[[nodiscard]] QString infoText(const WvFileSummary &summary);

/// The summary under the names of its fields.
[[nodiscard]] QJsonObject infoJson(const WvFileSummary &summary);
