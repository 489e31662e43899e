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
    void appearsAfterHalfASecond();
    void appearsWithoutAnEventLoop();
    void inputIsKeptFromOtherWindowsMeanwhile();
    void cancelsOnce_data();
    void cancelsOnce();
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

void TestProgressDialog::appearsAfterHalfASecond()
{
    QElapsedTimer timer;
    timer.start();
    QtProgressDialog dialog("Working...");
    QVERIFY(QApplication::overrideCursor());
    QVERIFY(QTest::qWaitFor([&] { return dialog.isVisible(); }, 5000));
    QVERIFY(timer.elapsed() >= QtProgressDialog::DelayMs);
    QVERIFY(dialog.isModal());
    QVERIFY(!QApplication::overrideCursor());
    QCOMPARE(dialog.labelText(), "Working...");
}

void TestProgressDialog::appearsWithoutAnEventLoop()
{
    // A worker that reports only, as the signal generators do.
    QtProgressDialog dialog("Working...");
    QElapsedTimer timer;
    timer.start();
    while (!dialog.isVisible() && timer.elapsed() < 5000) {
        dialog.setValue(static_cast<int>(timer.elapsed() / 50));
    }
    QVERIFY(dialog.isVisible());
    // And its cancel button is heard.
    QTimer::singleShot(0, &dialog, [&] {
        QTest::mouseClick(dialog.findChild<QPushButton *>("pb_cancel"), Qt::LeftButton);
    });
    while (!dialog.wasCanceled() && timer.elapsed() < 10000) {
        dialog.setValue(50);
    }
    QVERIFY(dialog.wasCanceled());
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

void TestProgressDialog::cancelsOnce_data()
{
    using Way = std::function<void(QtProgressDialog &)>;
    QTest::addColumn<Way>("way");
    QTest::newRow("button") << Way([](QtProgressDialog &dialog) {
        QTest::mouseClick(dialog.findChild<QPushButton *>("pb_cancel"), Qt::LeftButton);
    });
    QTest::newRow("Esc") << Way(
        [](QtProgressDialog &dialog) { QTest::keyClick(&dialog, Qt::Key_Escape); });
    QTest::newRow("window button") << Way([](QtProgressDialog &dialog) { dialog.close(); });
}

void TestProgressDialog::cancelsOnce()
{
    using Way = std::function<void(QtProgressDialog &)>;
    QFETCH(Way, way);
    QtProgressDialog dialog("Working...");
    QVERIFY(QTest::qWaitFor([&] { return dialog.isVisible(); }, 5000));
    QSignalSpy canceled(&dialog, &QtProgressDialog::canceled);
    way(dialog);
    way(dialog);
    QCOMPARE(canceled.count(), 1);
    QVERIFY(dialog.wasCanceled());
    QVERIFY2(dialog.isVisible(), "the job, not the user, ends the dialog");
    QVERIFY(!dialog.findChild<QPushButton *>("pb_cancel")->isEnabled());
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
