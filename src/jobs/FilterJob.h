// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "EditJob.h"

#include "dsp/filtertable.h"

#include <optional>

struct FilterRequest
{
    static constexpr double MinBandwidthHz = 1000;
    static constexpr int MinLength = 5;
    static constexpr int MaxLength = 201;

    QString inputFile;
    OutputOptions output;
    FilterKind kind = FilterKind::Rectangular;
    int window = 0;                    ///< window kind, 0 to 6
    int length = 150;                  ///< samples
    double parameter = 0.22;           ///< roll-off, or B*T of a Gauss filter
    std::optional<double> bandwidthHz; ///< one-sided; nothing: 0.4 of the source's clock
    std::optional<double> clockHz;     ///< of the file written; nothing: that of the source

    /// The filter for a waveform of this clock.
    [[nodiscard]] FilterSettings settings(double sourceClockHz) const;

    /// Why a waveform of this clock can't be filtered so; empty if it can.
    [[nodiscard]] QString problem(double sourceClockHz) const;
};

/// Permitted parameters of a filter kind; none for a kind that takes no parameter.
struct ParameterRange
{
    double min;
    double max;
};
[[nodiscard]] std::optional<ParameterRange> parameterRange(FilterKind kind);

/// Filters a waveform as a loop, at the same length and peak level; markers and unknown tags stay
/// as they are.
class FilterJob : public EditJob
{
    Q_OBJECT

public:
    explicit FilterJob(FilterRequest request, QObject *parent = nullptr);

private:
    [[nodiscard]] bool edit() override;

    FilterRequest m_request;
    TempStream m_data;
};
