// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "view/IqSample.h"

#include <QSize>
#include <QString>
#include <QStringList>

#include <functional>
#include <span>

class QPainter;
class QTextStream;
struct SpectrumScene;

/// The kinds of pictures by their suffixes, without the point.
[[nodiscard]] QStringList pictureSuffixes();

/// The bytes of a picture of one of these kinds, of a plot of a size in logical pixels, enlarged
/// `ratio` times with all its lines and texts; empty if there is no memory for it.
[[nodiscard]] QByteArray plotPicture(const QString &suffix, const QSize &size, double ratio,
                                     const std::function<void(QPainter &)> &paint);

/// Paints a plot of a size in logical pixels into a file, of a kind by its suffix; PNG has `ratio`
/// device pixels to a logical one. On failure the log names the file and the reason, false is
/// returned and an existing file stays as it was.
[[nodiscard]] bool savePlotPicture(const QString &fileName, const QSize &size, double ratio,
                                   const std::function<void(QPainter &)> &paint);

/// Writes a table into a file. Same failures.
[[nodiscard]] bool savePlotData(const QString &fileName,
                                const std::function<void(QTextStream &)> &write);

/// The samples as a table "sample,i,q,markers" with nine digits; positions count from `first`.
void writeSampleTable(QTextStream &stream, std::span<const IqSample> samples,
                      std::span<const quint8> markers, qint64 first);

/// The shown lines as a table: the trace as "frequency_hz,level_db" with its maximum, or for the
/// waterfall one row a line, its position in front. Without a clock the frequency is a share of the
/// clock.
void writeSpectrumTable(QTextStream &stream, const SpectrumScene &scene);

/// The name with the suffix, unless it has one of the known suffixes (or this one) already.
[[nodiscard]] QString withSuffix(const QString &fileName, const QString &suffix,
                                 const QStringList &known);
