// SPDX-License-Identifier: Apache-2.0
#include "base/ProgressClock.h"
#include "jobs/ToolJob.h"
#include "support/files.h"
#include "support/logreader.h"
#include "support/modals.h"
#include "toolframe/QtProgressDialog.h"
#include "toolframe/QtProgressWidget.h"
#include "toolframe/runjob.h"

#include <QApplication>
#include <QElapsedTimer>
#include <QPushButton>
#include <QSignalSpy>
#include <QTest>
#include <QTextEdit>

namespace {

/// Reports, works on until it is told to end, and ends as it was told to.
class SampleJob : public ToolJob
{
public:
    enum class End { Success, WaitForCancel };

    explicit SampleJob(End end)
        : m_end(end)
    {
        setEnding({"Done", "Failed"});
    }

    bool work() override
    {
        emit stepStarted("Reading Waveform...");
        emit report(ReportLine::heading("Reading waveform"));
        emit report(ReportLine::row("Clock Rate", "48 kHz"));
        if (m_end == End::WaitForCancel) {
            std::atomic<bool> cancelled{false};
            connect(this, &ToolJob::cancelRequested, [&] { cancelled = true; });
            ProgressClock clock([this](int percent) { emit ProgressUpdate(percent); }, cancelled);
            while (!clock.shouldStop(10)) {
            }
            return false;
        }
        return m_end == End::Success;
    }

private:
    End m_end;
};

} // namespace

class TestRunJob : public QObject
{
    Q_OBJECT

private slots:
    void reportKeepsItsLayout();
    void cancelButtonEndsTheJob();
    void shortJobsShowNothing();
    void appearsWithoutAnEventLoop();
    void inputIsKeptFromOtherWindowsMeanwhile();
    void stepsStartOver();
    void barMovesAndFills();
};

void TestRunJob::reportKeepsItsLayout()
{
    QTextEdit report;
    SampleJob job(SampleJob::End::Success);
    QCOMPARE(runJob(job, nullptr, &report), JobOutcome::Finished);
    QCOMPARE(report.toPlainText(), "Reading waveform\n Clock Rate: \t48 kHz\n\nDone");
    QTextCursor cursor = report.document()->find("Done");
    QCOMPARE(cursor.charFormat().foreground().color(), QColor("#00C000"));
    QVERIFY(cursor.charFormat().fontWeight() >= QFont::Bold);
    // The job is not bound to the report any longer.
    emit job.report(ReportLine::plain("late"));
    QVERIFY(!report.toPlainText().contains("late"));
}

void TestRunJob::cancelButtonEndsTheJob()
{
    SampleJob job(SampleJob::End::WaitForCancel);
    QString label;
    int value = 0;
    whenModal([](QWidget &window) { return qobject_cast<QtProgressDialog *>(&window) != nullptr; },
              [&](QWidget &window) {
                  const auto &dialog = dynamic_cast<QtProgressDialog &>(window);
                  label = dialog.labelText();
                  value = dialog.value();
                  QTest::keyClick(&window, Qt::Key_Escape);
              });
    QCOMPARE(runJob(job, nullptr, nullptr), JobOutcome::Cancelled);
    QCOMPARE(label, "Reading Waveform...");
    QCOMPARE(value, 10);
}

void TestRunJob::shortJobsShowNothing()
{
    QElapsedTimer timer;
    timer.start();
    bool shown = false;
    {
        QtProgressDialog dialog("Working...");
        for (int i = 0; i < 1000; ++i) {
            dialog.setValue(i / 10);
            shown = shown || dialog.isVisible();
        }
    }
    if (timer.elapsed() >= QtProgressDialog::DelayMs) {
        QSKIP("this machine took too long for a short job");
    }
    QVERIFY(!shown);
    QVERIFY(!QApplication::overrideCursor());
}

void TestRunJob::appearsWithoutAnEventLoop()
{
    // A worker that reports only, as the signal generators do.
    QElapsedTimer timer;
    timer.start();
    QtProgressDialog dialog("Working...");
    QVERIFY(QApplication::overrideCursor());
    while (!dialog.isVisible() && timer.elapsed() < 5000) {
        dialog.setValue(static_cast<int>(timer.elapsed() / 50));
    }
    QVERIFY(dialog.isVisible() && dialog.isModal());
    QVERIFY(timer.elapsed() >= QtProgressDialog::DelayMs);
    QVERIFY(!QApplication::overrideCursor());
    // And its cancel button is heard, once; the job, not the user, ends the dialog.
    QSignalSpy canceled(&dialog, &QtProgressDialog::canceled);
    QTimer::singleShot(0, &dialog, [&] {
        QTest::mouseClick(dialog.findChild<QPushButton *>("pb_cancel"), Qt::LeftButton);
        QTest::keyClick(&dialog, Qt::Key_Escape);
        dialog.close();
    });
    while (!dialog.wasCanceled() && timer.elapsed() < 10000) {
        dialog.setValue(50);
    }
    QCOMPARE(canceled.count(), 1);
    QVERIFY(dialog.isVisible());
    QVERIFY(!dialog.findChild<QPushButton *>("pb_cancel")->isEnabled());
}

void TestRunJob::inputIsKeptFromOtherWindowsMeanwhile()
{
    QPushButton other("Other");
    other.show();
    other.activateWindow();
    QVERIFY(QTest::qWaitForWindowActive(&other));
    QSignalSpy clicked(&other, &QPushButton::clicked);
    {
        const QtProgressDialog dialog("Working...");
        QVERIFY(!dialog.isVisible());
        QTest::mouseClick(other.windowHandle(), Qt::LeftButton, {}, other.rect().center());
        QTest::keyClick(other.windowHandle(), Qt::Key_Space);
        QCOMPARE(clicked.count(), 0);
    }
    QTest::mouseClick(other.windowHandle(), Qt::LeftButton, {}, other.rect().center());
    QCOMPARE(clicked.count(), 1);
}

void TestRunJob::stepsStartOver()
{
    QtProgressDialog dialog("Reading Waveform...");
    dialog.setValue(80);
    QCOMPARE(dialog.value(), 80);
    dialog.startStep("Saving...");
    QCOMPARE(dialog.labelText(), "Saving...");
    QCOMPARE(dialog.value(), -1);
    dialog.setValue(250);
    QCOMPARE(dialog.value(), 100);
    dialog.setValue(-7);
    QCOMPARE(dialog.value(), -1);
}

void TestRunJob::barMovesAndFills()
{
    QtProgressWidget bar;
    bar.resize(400, 24);
    const auto filledColumns = [&] {
        const QImage image = bar.grab().toImage();
        const qreal ratio = image.devicePixelRatio();
        const QColor empty = bar.palette().color(QPalette::Base);
        int count = 0;
        for (int x = 0; x < bar.width(); ++x) {
            // Above the text.
            count += image.pixelColor(QPoint(x, 3) * ratio) != empty ? 1 : 0;
        }
        return count;
    };
    bar.setValue(25);
    QVERIFY(qAbs(filledColumns() - 100) <= 4);
    bar.setValue(75);
    QVERIFY(qAbs(filledColumns() - 300) <= 4);

    bar.show();
    QVERIFY(QTest::qWaitForWindowExposed(&bar));
    const QImage before = bar.grab().toImage();
    QVERIFY(QTest::qWaitFor([&] { return bar.grab().toImage() != before; }, 5000));
}

QTEST_MAIN(TestRunJob)
#include "tst_runjob.moc"
