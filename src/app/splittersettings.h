// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <QString>

class QSettings;
class QSplitter;

// The sizes of a splitter's parts, in pixels, in the settings: under the prefix followed by 0, 1,
// 2, ... Fewer than two that can be read leave the splitter as it was built.

void readSplitter(const QSettings &settings, const QString &prefix, QSplitter &splitter);
void writeSplitter(QSettings &settings, const QString &prefix, const QSplitter &splitter);
