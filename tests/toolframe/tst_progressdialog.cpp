// SPDX-License-Identifier: Apache-2.0
#include "toolframe/QtProgressDialog.h"
#include "toolframe/QtProgressWidget.h"

#include <QApplication>
#include <QElapsedTimer>
#include <QLabel>
#include <QPushButton>
#include <QSignalSpy>
#include <QTest>

class TestProgressDialog : public QObject
{
    Q_OBJECT

private slots:
    void shortJobsShowNothing();
    void appearsWithoutAnEventLoop();
    void inputIsKeptFromOtherWindowsMeanwhile();
    void stepsStartOver();
    void barMovesAndFills();
};

void TestProgressDialog::shortJobsShowNothing()
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

void TestProgressDialog::appearsWithoutAnEventLoop()
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

void TestProgressDialog::inputIsKeptFromOtherWindowsMeanwhile()
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

void TestProgressDialog::stepsStartOver()
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

void TestProgressDialog::barMovesAndFills()
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

QTEST_MAIN(TestProgressDialog)
#include "tst_progressdialog.moc"
