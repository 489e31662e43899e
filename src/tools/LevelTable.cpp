// SPDX-License-Identifier: Apache-2.0
#include "LevelTable.h"

#include <QGridLayout>
#include <QLabel>

#include <array>

namespace {

constexpr int ColumnCount = 3;

QString noValue()
{
    return "---";
}

} // namespace

LevelTable::LevelTable(QWidget *parent)
    : QWidget(parent)
    , m_grid(new QGridLayout(this))
{
    m_grid->setContentsMargins(0, 0, 0, 0);
    m_grid->setHorizontalSpacing(12);
    const std::array<const char *, ColumnCount> heads{"Peak", "RMS", "Crest"};
    for (int column = 0; column < ColumnCount; ++column) {
        auto *head = new QLabel(QLatin1String(heads[static_cast<std::size_t>(column)]), this);
        head->setAlignment(Qt::AlignRight);
        m_grid->addWidget(head, 0, column + 1);
    }
    m_grid->setColumnStretch(0, 1);
}

void LevelTable::setSignals(const QStringList &names)
{
    for (int row = 0; row < names.size(); ++row) {
        m_grid->addWidget(new QLabel(names[row], this), row + 1, 0);
        for (int column = 0; column < ColumnCount; ++column) {
            auto *value = new QLabel(noValue(), this);
            value->setAlignment(Qt::AlignRight);
            value->setTextInteractionFlags(Qt::TextSelectableByMouse);
            value->setMinimumWidth(value->fontMetrics().horizontalAdvance("-100.00 dB"));
            m_grid->addWidget(value, row + 1, column + 1);
        }
    }
}

void LevelTable::setLevels(int row, const LevelSums &sums, qint64 samples)
{
    if (samples < 1 || sums.peak <= 0) {
        for (int column = 0; column < ColumnCount; ++column) {
            setText(row, column, noValue());
        }
        return;
    }
    const double peakDb = -levelOffset(sums.peakLevel());
    const double rmsDb = -levelOffset(sums.rmsLevel(samples));
    const std::array<double, ColumnCount> values{peakDb, rmsDb, peakDb - rmsDb};
    for (int column = 0; column < ColumnCount; ++column) {
        // Adding 0 turns a rounded -0.00 into 0.00.
        const double rounded =
            std::round(values[static_cast<std::size_t>(column)] * 100) / 100 + 0.0;
        setText(row, column, QString("%1 dB").arg(rounded, 0, 'f', 2));
    }
}

void LevelTable::clear()
{
    for (int row = 0; row + 1 < m_grid->rowCount(); ++row) {
        setLevels(row, {}, 0);
    }
}

QString LevelTable::text(int row, int column) const
{
    const QLayoutItem *item = m_grid->itemAtPosition(row + 1, column + 1);
    return item != nullptr ? static_cast<QLabel *>(item->widget())->text() : QString();
}

void LevelTable::setText(int row, int column, const QString &text)
{
    if (const QLayoutItem *item = m_grid->itemAtPosition(row + 1, column + 1)) {
        static_cast<QLabel *>(item->widget())->setText(text);
    }
}
