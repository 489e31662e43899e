// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "log/Tracer.h"

#include <QStringList>

/// What is logged during the life of the object, without the time stamps: "4|Cannot open file." for
/// an error. Debug lines only on request.
class CapturedLog
{
public:
    explicit CapturedLog(unsigned mask = Tracer::DefaultMask)
    {
        Tracer::setMask(mask);
        static_cast<void>(Tracer::takeEntries());
    }

    ~CapturedLog() { Tracer::setMask(Tracer::DefaultMask); }
    CapturedLog(const CapturedLog &) = delete;
    CapturedLog &operator=(const CapturedLog &) = delete;

    /// The lines so far; they are forgotten.
    [[nodiscard]] QStringList take()
    {
        QStringList lines;
        for (const Tracer::Entry &entry : Tracer::takeEntries()) {
            lines << QString("%1|%2").arg(entry.second).arg(withoutStamp(entry.first));
        }
        return lines;
    }

    /// As above, the lines of some levels alone.
    [[nodiscard]] QStringList take(int levels)
    {
        QStringList lines;
        for (const QString &line : take()) {
            if ((line.section('|', 0, 0).toInt() & levels) != 0) {
                lines << line;
            }
        }
        return lines;
    }

    static QString withoutStamp(const QString &line)
    {
        // A time of day holds no two blanks in a row.
        return line.mid(line.indexOf("  ") + 2);
    }
};
