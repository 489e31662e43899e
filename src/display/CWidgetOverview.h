// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "CWidgetBase.h"
#include "view/Overview.h"

/// Shows the envelope and the markers of a whole waveform; a click chooses a place in it.
class CWidgetOverview : public CWidgetBase
{
    Q_OBJECT

public:
    explicit CWidgetOverview(QWidget *parent = nullptr);

    /// What to show; a clock of 0 labels the axis in samples.
    void setOverview(const Overview &overview, double clockHz);

    /// Marks the samples that another display shows.
    void setRange(qint64 first, qint64 count);

signals:
    /// A click, with the sample of the waveform below the mouse.
    void sampleChosen(qlonglong sample);

protected:
    void drawPlot(QPainter &painter, const QRectF &area) override;
    void writeData(QTextStream &stream) override;
    [[nodiscard]] bool hasData() const override { return m_overview.isComplete(); }
    void mousePressEvent(QMouseEvent *event) override;

private:
    Overview m_overview;
    double m_clockHz = 0;
    qint64 m_first = 0;
    qint64 m_count = 0;
};
