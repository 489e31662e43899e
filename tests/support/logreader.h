// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "log/Tracer.h"

#include <QStringList>

/// Levels of lines that tell of something wrong.
inline constexpr unsigned Complaints = Tracer::Warning | Tracer::Error | Tracer::Severe;

/// The waiting lines of the log at these levels, without the time of day and with the level in
/// front: "4|Cannot open file." for an error. Those of other levels are forgotten as well.
[[nodiscard]] QStringList takeLog(unsigned levels = Complaints);

/// As above, for a log with one kind of line: "Cannot open file."
[[nodiscard]] QStringList takeMessages(unsigned levels = Tracer::Error | Tracer::Warning);

/// A log that starts empty and, with a mask of its own, keeps debug lines or drops others; the
/// usual mask comes back at its end.
class CapturedLog
{
public:
    explicit CapturedLog(unsigned mask = Tracer::DefaultMask);
    ~CapturedLog();
    CapturedLog(const CapturedLog &) = delete;
    CapturedLog &operator=(const CapturedLog &) = delete;

    /// As takeLog(), of every level by default.
    [[nodiscard]] QStringList take(unsigned levels = Tracer::DebugMask);
};
