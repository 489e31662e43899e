// SPDX-License-Identifier: Apache-2.0
#include "QtProgressDialog.h"

#include "QtProgressWidget.h"

#include "appearance/lineicon.h"
#include "base/vectorstate.h"

#include <QApplication>
#include <QCloseEvent>
#include <QLabel>
#include <QPushButton>
#include <QVBoxLayout>

namespace {

// Before this much is known an estimate of the remaining time jumps about.
constexpr qint64 EstimateAfterMs = 2000;
constexpr int EstimateFromPercent = 3;

QString minutesAndSeconds(qint64 milliseconds)
{
    const qint64 seconds = (milliseconds + 500) / 1000;
    return QString("%1:%2").arg(seconds / 60).arg(seconds % 60, 2, 10, QChar('0'));
}

bool isUserInput(const QEvent &event)
{
    switch (event.type()) {
    case QEvent::MouseButtonPress:
    case QEvent::MouseButtonRelease:
    case QEvent::MouseButtonDblClick:
    case QEvent::Wheel:
    case QEvent::ContextMenu:
    case QEvent::KeyPress:
    case QEvent::KeyRelease:
    case QEvent::TouchBegin:
    case QEvent::TouchUpdate:
    case QEvent::TouchEnd:
    case QEvent::TabletPress:
    case QEvent::DragEnter:
    case QEvent::Drop:
    case QEvent::Close:
        return event.spontaneous();
    case QEvent::Shortcut: // made by the toolkit out of a key
        return true;
    default:
        return false;
    }
}

} // namespace

QtProgressDialog::QtProgressDialog(const QString &labelText, QWidget *parent,
                                   const QString &cancelText)
    : QDialog(parent)
    , m_label(new QLabel(labelText))
    , m_times(new QLabel)
    , m_bar(new QtProgressWidget)
    , m_cancelButton(new QPushButton(cancelText))
{
    setWindowTitle(parent ? parent->window()->windowTitle() : QCoreApplication::applicationName());
    setWindowModality(Qt::ApplicationModal);
    setMinimumWidth(420);

    m_label->setObjectName("l_label");
    m_label->setTextFormat(Qt::PlainText);
    m_label->setWordWrap(true);
    m_times->setObjectName("l_times");
    m_times->setForegroundRole(QPalette::PlaceholderText);
    m_bar->setObjectName("w_progress");
    m_cancelButton->setObjectName("pb_cancel");
    m_cancelButton->setIcon(lineIcon("cancel"));
    m_cancelButton->setToolTip("Stop this operation");

    auto *layout = new QVBoxLayout(this);
    layout->setContentsMargins(16, 16, 16, 12);
    layout->setSpacing(10);
    layout->addWidget(m_label);
    layout->addWidget(m_bar);
    layout->addWidget(m_times);
    layout->addWidget(m_cancelButton, 0, Qt::AlignRight);

    connect(m_cancelButton, &QPushButton::clicked, this, &QtProgressDialog::reject);
    connect(&m_delay, &QTimer::timeout, this, &QtProgressDialog::appear);
    connect(&m_clock, &QTimer::timeout, this, &QtProgressDialog::showTimes);
    m_delay.setSingleShot(true);
    m_delay.setTimerType(Qt::PreciseTimer);
    m_delay.start(DelayMs);
    m_sinceStart.start();
    m_sinceStep.start();
    m_sinceTick.start();
    startBlocking();
}

QtProgressDialog::~QtProgressDialog()
{
    stopBlocking();
}

QtProgressDialog *QtProgressDialog::running()
{
    const QList<QWidget *> windows = QApplication::topLevelWidgets();
    for (QWidget *window : windows) {
        if (auto *progress = qobject_cast<QtProgressDialog *>(window)) {
            return progress;
        }
    }
    return nullptr;
}

QString QtProgressDialog::labelText() const
{
    return m_label->text();
}

int QtProgressDialog::value() const
{
    return m_bar->value();
}

void QtProgressDialog::setValue(int percent)
{
    m_bar->setValue(percent);
    if (m_inTick || m_sinceTick.elapsed() < TickMs) {
        return;
    }
    m_inTick = true;
    if (m_blocking && m_sinceStart.elapsed() >= DelayMs) {
        appear();
    }
    QCoreApplication::processEvents();
    clearVectorState();
    m_sinceTick.start();
    m_inTick = false;
}

void QtProgressDialog::setLabelText(const QString &text)
{
    m_label->setText(text);
}

void QtProgressDialog::startStep(const QString &labelText)
{
    setLabelText(labelText);
    // Bytes are counted over all steps of a job, and so is then its progress.
    if (m_bytesTotal == 0) {
        m_bar->setValue(-1);
        m_sinceStep.start();
    }
    showTimes();
}

void QtProgressDialog::setBytes(qint64 done, qint64 total)
{
    m_bytesTotal = total;
    if (!m_sinceBytes.isValid()) {
        m_sinceBytes.start();
        m_bytesAtStart = done;
    }
    m_bytesDone = done;
}

void QtProgressDialog::reject()
{
    if (m_canceled) {
        return;
    }
    m_canceled = true;
    m_cancelButton->setEnabled(false);
    m_times->setText("Cancelling...");
    emit canceled();
}

void QtProgressDialog::closeEvent(QCloseEvent *event)
{
    // The job decides when it ends.
    event->ignore();
    reject();
}

bool QtProgressDialog::eventFilter(QObject *watched, QEvent *event)
{
    if (m_blocking && isUserInput(*event)) {
        event->ignore();
        return true;
    }
    return QDialog::eventFilter(watched, event);
}

void QtProgressDialog::appear()
{
    m_delay.stop();
    stopBlocking();
    m_clock.start(500);
    showTimes();
    show();
}

void QtProgressDialog::suspend()
{
    m_delay.stop();
    m_clock.stop();
    stopBlocking();
    hide();
}

void QtProgressDialog::resume()
{
    startBlocking();
    m_sinceStart.start();
    m_sinceStep.start();
    m_sinceBytes.invalidate();
    m_delay.start(DelayMs);
}

void QtProgressDialog::startBlocking()
{
    if (!m_blocking) {
        m_blocking = true;
        qApp->installEventFilter(this);
        QApplication::setOverrideCursor(Qt::BusyCursor);
    }
}

void QtProgressDialog::stopBlocking()
{
    if (m_blocking) {
        m_blocking = false;
        qApp->removeEventFilter(this);
        QApplication::restoreOverrideCursor();
    }
}

void QtProgressDialog::showTimes()
{
    if (m_canceled) {
        return;
    }
    QString text = QString("Elapsed %1").arg(minutesAndSeconds(m_sinceStart.elapsed()));
    if (m_bytesTotal > 0 && m_sinceBytes.isValid()) {
        m_times->setText(text + transferText());
        return;
    }
    const qint64 step = m_sinceStep.elapsed();
    if (value() >= EstimateFromPercent && value() < 100 && step >= EstimateAfterMs) {
        text += QString(", about %1 left").arg(minutesAndSeconds(step * (100 - value()) / value()));
    }
    m_times->setText(text);
}

QString QtProgressDialog::transferText() const
{
    constexpr double Megabyte = 1024.0 * 1024.0;
    const auto megabytes = [](double bytes) { return QString::number(bytes / Megabyte, 'f', 1); };
    const auto done = static_cast<double>(m_bytesDone);
    const auto total = static_cast<double>(m_bytesTotal);
    QString text = QString(", %1 of %2 MB").arg(megabytes(done), megabytes(total));
    const auto elapsed = static_cast<double>(m_sinceBytes.elapsed());
    const double moved = done - static_cast<double>(m_bytesAtStart);
    if (moved <= 0 || elapsed <= 0) {
        return text;
    }
    text += QString(" at %1 MB/s").arg(megabytes(1000.0 * moved / elapsed));
    if (m_sinceBytes.elapsed() >= EstimateAfterMs) {
        text += QString(", about %1 left")
                    .arg(minutesAndSeconds(static_cast<qint64>((total - done) * elapsed / moved)));
    }
    return text;
}
