// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <QObject>

class QWidget;

/// Notes how long after the start of the process a window was painted for the first time.
class FirstPaint : public QObject
{
    Q_OBJECT

public:
    /// The window hasn't been shown yet, and lives as long as this.
    explicit FirstPaint(QWidget &window);

    /// Milliseconds from the start of the process to the first complete paint; -1 before it, and
    /// if the start can't be told. The start is known to 10 ms.
    [[nodiscard]] qint64 ageMs() const { return m_ageMs; }

protected:
    bool eventFilter(QObject *watched, QEvent *event) override;

private:
    qint64 m_ageMs = -1;
    bool m_seen = false;
};
