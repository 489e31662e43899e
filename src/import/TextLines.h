// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "base/ProgressClock.h"

#include <QtGlobal>

#include <string_view>
#include <vector>

class QIODevice;

/// Lines of a text file, read in blocks. A line ends with CR, LF, CR LF or the file.
class TextLines
{
public:
    static constexpr size_t MaxLength = 1024; ///< characters of a line

    /// The device and the clock outlive the object.
    TextLines(QIODevice &device, ProgressClock &progress);

    /// Fetches the next line that isn't empty. False at the end of the file, or on a failure whose
    /// reason has been logged; hasFailed() tells which.
    [[nodiscard]] bool next(std::string_view &line);

    [[nodiscard]] bool hasFailed() const { return m_failed; }

    /// Number of the last line, from 1; empty ones count.
    [[nodiscard]] qint64 lineNumber() const { return m_lineNumber; }

private:
    [[nodiscard]] bool refill();
    bool fail(const QString &text);

    QIODevice &m_device;
    ProgressClock &m_progress;
    std::vector<char> m_buffer;
    size_t m_begin = 0;
    size_t m_end = 0;
    qint64 m_lineNumber = 0;
    bool m_atEnd = false;
    bool m_failed = false;
    bool m_afterReturn = false; ///< the last line ended with CR
};
