// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "streams/levels.h"

#include <QStringList>
#include <QWidget>

class QGridLayout;

/// Peak, RMS and crest factor of signals that are to be compared, a row each.
class LevelTable : public QWidget
{
    Q_OBJECT

public:
    explicit LevelTable(QWidget *parent = nullptr);

    /// Names the signals, top to bottom.
    void setSignals(const QStringList &names);

    /// Shows the levels of a signal, in dB relative to full scale; "---" for silence.
    void setLevels(int row, const LevelSums &sums, qint64 samples);
    void clear();

    /// What is shown: column 0 peak, 1 RMS, 2 crest factor.
    [[nodiscard]] QString text(int row, int column) const;

private:
    void setText(int row, int column, const QString &text);

    QGridLayout *m_grid;
};
