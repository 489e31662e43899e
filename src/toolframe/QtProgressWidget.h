// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <QBasicTimer>
#include <QWidget>

/// A progress bar that moves while work goes on: stripes run along the filled part, so that a slow
/// job can be told from one that hangs. Without a known progress a block wanders along the bar.
class QtProgressWidget : public QWidget
{
    Q_OBJECT

public:
    explicit QtProgressWidget(QWidget *parent = nullptr);

    /// Progress in percent, -1 while unknown.
    [[nodiscard]] int value() const { return m_value; }

    /// 0 to 100; values above are taken as 100, values below 0 as unknown.
    void setValue(int percent);

    [[nodiscard]] QSize sizeHint() const override;

protected:
    void paintEvent(QPaintEvent *event) override;
    void timerEvent(QTimerEvent *event) override;
    void showEvent(QShowEvent *event) override;
    void hideEvent(QHideEvent *event) override;

private:
    [[nodiscard]] QRectF filledPart(const QRectF &bar) const;

    int m_value = -1;
    int m_phase = 0; ///< steps of the movement since the bar was shown
    QBasicTimer m_timer;
};
