// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "WvTypes.h"

#include <QString>

class ByteSource;
class QIODevice;

/// Collects the tags of a waveform file and steps over its samples. HvFileIO opens the file; this
/// class knows the format alone, and so can scan from memory too.
class WvScanner
{
public:
    /// `summary` is cleared by the caller and outlives the scanner.
    explicit WvScanner(WvFileSummary &summary);

    /// Scans all of the device. Logs the reason and returns false on a tag that can't be read.
    [[nodiscard]] bool scan(QIODevice &device);

private:
    [[nodiscard]] bool readName(ByteSource &source, QString &name);
    [[nodiscard]] bool processTag(ByteSource &source, const QString &name);
    [[nodiscard]] bool processType(const QString &text);
    [[nodiscard]] bool processLevels(const QString &text);
    [[nodiscard]] bool processSegments(const QString &name, const QString &text);
    [[nodiscard]] bool processSampleBlock(ByteSource &source, const QString &name);
    void growSegments(qsizetype count);

    WvFileSummary &m_summary;
    bool m_clockFound = false;
    bool m_holdsSamples = false; ///< by its TYPE tag
    bool m_blockFound = false;
};
