// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "log/Tracer.h"

#include <QStringList>

/// The log since the last call, each line with its level in front: "4 Reading failed.". Lines of
/// another level are left out.
inline QStringList takeLog(unsigned levels = Tracer::Warning | Tracer::Error | Tracer::Severe)
{
    QStringList lines;
    for (const auto &[stamped, level] : Tracer::takeEntries()) {
        if ((static_cast<unsigned>(level) & levels) != 0) {
            lines.append(QString::number(level) + ' ' + stamped.mid(stamped.indexOf("  ") + 2));
        }
    }
    return lines;
}
