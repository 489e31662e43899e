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
    std::optional<double> peakDb;      ///< level of the peak; nothing: that of the source's tag
    std::optional<double> peakToRmsDb; ///< nothing: from the source's tag and its samples
};

/// Copies a waveform with new level tags; its samples stay as they are. The samples keep their
/// length and clock, so unknown tags come along.
class LevelJob : public EditJob
{
    Q_OBJECT

public:
    explicit LevelJob(LevelRequest request, QObject *parent = nullptr);

private:
    [[nodiscard]] bool edit() override;
    [[nodiscard]] bool defaultPeakToRms(double &peakToRmsDb);
    [[nodiscard]] bool write(double peakDb, double peakToRmsDb);

    LevelRequest m_request;
};
