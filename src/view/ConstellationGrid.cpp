// SPDX-License-Identifier: Apache-2.0
#include "ConstellationGrid.h"

#include "base/vectorstate.h"

#include <algorithm>
#include <cmath>
#include <cstddef>

namespace {

constexpr int Middle = ConstellationGrid::Size / 2;

} // namespace

int ConstellationGrid::cellOf(double value)
{
    return Middle - static_cast<int>(value * -Middle);
}

void ConstellationGrid::compute(std::span<const IqSample> samples, double scaleI, double scaleQ)
{
    clearVectorState();
    clear();
    append(samples, scaleI, scaleQ);
}

void ConstellationGrid::append(std::span<const IqSample> samples, double scaleI, double scaleQ)
{
    for (const IqSample &sample : samples) {
        const double i = sample.i / scaleI;
        const double q = sample.q / scaleQ;
        if (i >= -1 && i <= 1 && q >= -1 && q <= 1) {
            m_counts[indexOf(cellOf(i), cellOf(q))] += 1;
        }
    }
    m_greatest = 0;
    for (int row = 0; row < Size; ++row) {
        for (int column = 0; column < Size; ++column) {
            m_greatest = std::max(m_greatest, density(row, column));
        }
    }
}

void ConstellationGrid::clear()
{
    m_counts.fill(0);
    m_greatest = 0;
}

double ConstellationGrid::density(int row, int column) const
{
    const double width = row == Middle ? 2 : 1;
    const double height = column == Middle ? 2 : 1;
    return count(row, column) / (width * height);
}

double ConstellationGrid::levelDb(int row, int column) const
{
    const double cell = density(row, column);
    if (cell <= 0) {
        return EmptyDb;
    }
    // Half of the least that a cell can hold would be as dark as none.
    const double range = std::log(m_greatest * 8);
    return std::log(m_greatest / cell) / range * EmptyDb;
}
