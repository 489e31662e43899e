// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "composer/Composition.h"
#include "support/logreader.h"

#include <QRegularExpression>
#include <QStringList>

/// A document in one line: tracks divided by "|", one that isn't selected begins with "-", and
/// segments as NAME@TARGET:START+USED, with "/CLOCK" in MHz where it isn't 1 MHz, "~" behind a
/// wrap.
inline QString textOf(const Composition &document)
{
    QStringList tracks;
    for (const ComposerTrack &track : document.tracks()) {
        QStringList parts;
        for (const ComposerSegment &segment : track.segments) {
            QString text = QStringLiteral("%1@%2:%3+%4")
                               .arg(segment.sName)
                               .arg(segment.lTarget)
                               .arg(segment.lStart)
                               .arg(segment.lUsed);
            if (segment.dSrcClk != 1e6) {
                text += QStringLiteral("/%1").arg(segment.dSrcClk / 1e6);
            }
            parts.append(text + (segment.bWrap ? QStringLiteral("~") : QString()));
        }
        tracks.append((track.bSelect ? QString() : QStringLiteral("-")) +
                      parts.join(QLatin1Char(' ')));
    }
    return tracks.join(QLatin1Char('|'));
}

inline ComposerSegment segmentFromText(const QString &text)
{
    static const QRegularExpression pattern(
        QStringLiteral("^(\\w+)@(-?\\d+):(\\d+)\\+(\\d+)(?:/([\\d.]+))?(~?)$"));
    const QRegularExpressionMatch match = pattern.match(text);
    ComposerSegment segment;
    segment.sName = match.captured(1);
    segment.lTarget = match.captured(2).toLongLong();
    segment.lStart = match.captured(3).toLongLong();
    segment.lUsed = match.captured(4).toLongLong();
    segment.lSamples = segment.lStart + segment.lUsed;
    segment.dSrcClk = match.captured(5).isEmpty() ? 1e6 : match.captured(5).toDouble() * 1e6;
    segment.bWrap = !match.captured(6).isEmpty();
    return segment;
}

/// The document of a text, with a target clock of 1 MHz.
inline Composition documentOf(const QString &text)
{
    Composition document;
    const QStringList tracks = text.split(QLatin1Char('|'));
    for (const QString &line : tracks) {
        document.addTrack();
        ComposerTrack &track = *document.track(document.trackCount() - 1);
        track.bSelect = !line.startsWith(QLatin1Char('-'));
        const QStringList parts =
            line.mid(track.bSelect ? 0 : 1).split(QLatin1Char(' '), Qt::SkipEmptyParts);
        for (const QString &part : parts) {
            track.segments.push_back(segmentFromText(part));
        }
    }
    return document;
}

/// What has been logged since the last call, a line each.
inline QString loggedText()
{
    return takeMessages(Tracer::DebugMask).join(QLatin1Char('\n'));
}
