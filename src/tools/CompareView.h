// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "view/IqSample.h"

#include <QList>
#include <QStringList>
#include <QWidget>

class CWidgetIQTrace;
class LevelTable;
class QButtonGroup;
class QHBoxLayout;

/// Signals that belong together, such as before and after a filter: one of them as a trace, chosen
/// by buttons, and the levels of all. The trace keeps its scales when another one is chosen.
class CompareView : public QWidget
{
    Q_OBJECT

public:
    explicit CompareView(QWidget *parent = nullptr);

    /// Names the signals; the last one is shown at first.
    void setSignals(const QStringList &names);

    /// Clock rate in Hz, for the time axis.
    void setClock(double hz);

    /// Shows the signals, as many as there are names.
    void setSamples(const QList<IqList> &samples);
    void clear();

    [[nodiscard]] int shown() const;

private:
    void refresh();

    QHBoxLayout *m_choice;
    QButtonGroup *m_buttons;
    CWidgetIQTrace *m_trace;
    LevelTable *m_levels;
    QList<IqList> m_samples;
};
