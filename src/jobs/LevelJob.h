// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "EditJob.h"

#include <optional>

/// Target levels of a copy, in dB.
struct LevelRequest
{
    static constexpr double MinDb = -50;
    static constexpr double MaxDb = 50;

    QString inputFile;
    OutputOptions output;
    std::optional<double> peakDb;       ///< level of the peak; nothing: as measured
    std::optional<double> peakToRmsDb;  ///< crest factor; nothing: as measured
    std::optional<double> clockHz = {}; ///< clock of the result; nothing: that of the source
};

/// Why a crest factor in dB shouldn't be written for samples with the measured one, as a sentence;
/// empty if it may. An instrument sets the RMS level of its output by it.
[[nodiscard]] QString crestProblem(double wantedDb, double measuredDb);

/// Copies a waveform with new level tags; its samples stay as they are. The samples keep their
/// length and clock, so unknown tags come along.
class LevelJob : public EditJob
{
    Q_OBJECT

public:
    explicit LevelJob(LevelRequest request, QObject *parent = nullptr);

private:
    [[nodiscard]] bool edit() override;

    LevelRequest m_request;
};
