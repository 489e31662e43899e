// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <QDialog>
#include <QElapsedTimer>
#include <QString>
#include <QTimer>

class QLabel;
class QPushButton;
class QtProgressWidget;

/// The modal window of a running job: what is done, how far it is, and a cancel button.
///
/// It lives as long as the job. From its construction on it keeps clicks and keys from all other
/// windows; it shows itself after half a second only, so that short jobs don't flicker. It never
/// ends the job by itself: a click, Esc or the window's close button give canceled(), once, and
/// the job ends at its next tick. Jobs that don't serve the event loop get it served by setValue().
class QtProgressDialog : public QDialog
{
    Q_OBJECT

public:
    static constexpr int DelayMs = 500;
    static constexpr int TickMs = 100; ///< setValue() serves the event loop once in this time

    explicit QtProgressDialog(const QString &labelText, QWidget *parent = nullptr,
                              const QString &cancelText = "Cancel");
    ~QtProgressDialog() override;

    /// The dialog of the job that is running in this program, shown or not; null if none is.
    [[nodiscard]] static QtProgressDialog *running();

    [[nodiscard]] bool wasCanceled() const { return m_canceled; }
    [[nodiscard]] QString labelText() const;

    /// Progress in percent, -1 while unknown.
    [[nodiscard]] int value() const;

public slots:
    /// Sets the progress in percent, below 0 for unknown.
    void setValue(int percent);

    void setLabelText(const QString &text);

    /// A new step of the same job: its label, with progress and times starting over unless bytes
    /// are counted.
    void startStep(const QString &labelText);

    /// How far a transfer is, in bytes; its rate and the remaining time are shown from the second
    /// call on.
    void setBytes(qint64 done, qint64 total);

    /// Makes way for a question: gives the input free and hides until resume().
    void suspend();
    void resume();

    /// Does what the cancel button does.
    void reject() override;

signals:
    void canceled();

protected:
    bool eventFilter(QObject *watched, QEvent *event) override;
    void closeEvent(QCloseEvent *event) override;

private:
    void appear();
    void startBlocking();
    void stopBlocking();
    void showTimes();
    [[nodiscard]] QString transferText() const;

    QLabel *m_label = nullptr;
    QLabel *m_times = nullptr;
    QtProgressWidget *m_bar = nullptr;
    QPushButton *m_cancelButton = nullptr;
    QTimer m_delay;
    QTimer m_clock;
    QElapsedTimer m_sinceStart;
    QElapsedTimer m_sinceStep;
    QElapsedTimer m_sinceTick;
    QElapsedTimer m_sinceBytes;
    qint64 m_bytesAtStart = 0; ///< of the measurement of the rate
    qint64 m_bytesDone = 0;
    qint64 m_bytesTotal = 0; ///< 0 when no bytes are counted
    bool m_canceled = false;
    bool m_blocking = false;
    bool m_inTick = false;
};
