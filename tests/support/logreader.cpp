// SPDX-License-Identifier: Apache-2.0
#include "logreader.h"

namespace {

QStringList taken(unsigned levels, bool withLevel)
{
    QStringList lines;
    const QList<Tracer::Entry> entries = Tracer::takeEntries();
    for (const auto &[stamped, level] : entries) {
        if ((static_cast<unsigned>(level) & levels) != 0) {
            // A time of day holds no two blanks in a row.
            const QString text = stamped.mid(stamped.indexOf("  ") + 2);
            lines << (withLevel ? QString::number(level) + '|' + text : text);
        }
    }
    return lines;
}

} // namespace

QStringList takeLog(unsigned levels)
{
    return taken(levels, true);
}

QStringList takeMessages(unsigned levels)
{
    return taken(levels, false);
}

CapturedLog::CapturedLog(unsigned mask)
{
    Tracer::setMask(mask);
    static_cast<void>(Tracer::takeEntries());
}

CapturedLog::~CapturedLog()
{
    Tracer::setMask(Tracer::DefaultMask);
}

QStringList CapturedLog::take(unsigned levels)
{
    return takeLog(levels);
}
