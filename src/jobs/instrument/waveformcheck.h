// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "instrument/InstrumentSummary.h"

#include <QByteArray>
#include <QString>
#include <QStringList>

#include <optional>

/// What is done about a waveform that an instrument can't play.
enum class WaveformCheck {
    None,   ///< nobody looks
    Warned, ///< told, and no obstacle
    Strict, ///< told, and nothing is sent or started
};

/// What counts of a waveform for an instrument that is to play it.
struct WaveformNeeds
{
    qint64 samples = 0;
    double clockHz = 0; ///< 0: not known
};

/// Whether the first bytes of a file are those of a waveform.
[[nodiscard]] bool isWaveformHead(const QByteArray &head);

/// The same for a file, without a word on one that is none or can't be read.
[[nodiscard]] bool isWaveformFile(const QString &fileName);

/// Of a waveform file; nothing, with the reason logged, if it is none.
[[nodiscard]] std::optional<WaveformNeeds> needsOf(const QString &fileName);

/// Of the tags that stand before the samples in the first bytes of a waveform file.
[[nodiscard]] WaveformNeeds needsOfHead(const QByteArray &head);

/// What is said of a clock above the bandwidth: most waveforms with one stay within it all the
/// same.
enum class Doubts { Told, LeftOut };

/// Why the instrument can't play a waveform: one text for each limit of its basebands that is
/// broken, of the baseband that comes nearest where there are two. Empty where it can, or where
/// nobody knows its limits.
[[nodiscard]] QStringList waveformProblems(const WaveformNeeds &needs,
                                           const InstrumentSummary &instrument,
                                           Doubts doubts = Doubts::Told);

/// The same for a file of the disk, with its name in front where it is one of many; empty for a
/// file that is no waveform.
[[nodiscard]] QStringList problemsOfFile(const QString &fileName,
                                         const InstrumentSummary &instrument, bool isOneOfMany,
                                         Doubts doubts = Doubts::Told);

/// A model with the largest basebands that it is sold with. Nothing if there is no such model.
[[nodiscard]] std::optional<InstrumentSummary> summaryOfModel(const QString &model);
