// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "IqSample.h"

#include <array>
#include <span>

/// The density of samples in the I/Q plane on a grid of 51 by 51 cells; the middle cell lies about
/// zero and is twice as wide as the others.
class ConstellationGrid
{
public:
    static constexpr int Size = 51;
    static constexpr double EmptyDb = -150;

    /// Counts the samples, I divided by scaleI and Q by scaleQ; what then lies outside -1 to 1 is
    /// left out. The scales must not be 0.
    void compute(std::span<const IqSample> samples, double scaleI, double scaleQ);

    /// Adds samples to those counted so far.
    void append(std::span<const IqSample> samples, double scaleI, double scaleQ);

    void clear();

    /// Samples in a cell; the row grows with I, the column with Q.
    [[nodiscard]] double count(int row, int column) const { return m_counts[indexOf(row, column)]; }

    /// Samples for the area of a plain cell: noise would show a cross through zero otherwise.
    [[nodiscard]] double density(int row, int column) const;

    /// The density relative to the greatest one, 0 dB for that. The colour range is used in full: a
    /// single sample among many lies a little above its bottom, where the empty cell is.
    [[nodiscard]] double levelDb(int row, int column) const;

    /// The row or column of a part that was divided by its scale and lies within -1 to 1.
    [[nodiscard]] static int cellOf(double value);

private:
    [[nodiscard]] static std::size_t indexOf(int row, int column)
    {
        return static_cast<std::size_t>(row) * Size + static_cast<std::size_t>(column);
    }

    std::array<double, std::size_t{Size} * Size> m_counts{};
    double m_greatest = 0;
};
