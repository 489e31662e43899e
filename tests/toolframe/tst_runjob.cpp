// SPDX-License-Identifier: Apache-2.0
#include "base/ProgressClock.h"
#include "jobs/ToolJob.h"
#include "log/Tracer.h"
#include "toolframe/QtProgressDialog.h"
#include "toolframe/questions.h"
#include "toolframe/runjob.h"

#include <QApplication>
#include <QFile>
#include <QMessageBox>
#include <QPushButton>
#include <QTemporaryDir>
#include <QTest>
#include <QTextEdit>
#include <QTimer>

namespace {

/// Reports, works on until it is told to end, and ends as it was told to.
class SampleJob : public ToolJob
{
public:
    enum class End { Success, Failure, WaitForCancel };

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

/// Does something to the next modal window of a class that comes up.
template <typename Window>
void onNext(QTimer &timer, const std::function<void(Window &)> &action)
{
    QObject::connect(&timer, &QTimer::timeout, [&timer, action] {
        if (auto *window = qobject_cast<Window *>(QApplication::activeModalWidget())) {
            timer.stop();
            action(*window);
        }
    });
    timer.start(10);
}

} // namespace

class TestRunJob : public QObject
{
    Q_OBJECT

private slots:
    void outcomes();
    void reportKeepsItsLayout();
    void cancelButtonEndsTheJob();
    void asksBeforeOverwriting_data();
    void asksBeforeOverwriting();
    void newFilesNeedNoQuestion();
};

void TestRunJob::outcomes()
{
    SampleJob good(SampleJob::End::Success);
    QCOMPARE(runJob(good, nullptr, nullptr), JobOutcome::Finished);
    SampleJob bad(SampleJob::End::Failure);
    QCOMPARE(runJob(bad, nullptr, nullptr), JobOutcome::Failed);
}

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
    QTimer timer;
    onNext<QtProgressDialog>(timer, [&](QtProgressDialog &dialog) {
        label = dialog.labelText();
        value = dialog.value();
        QTest::keyClick(&dialog, Qt::Key_Escape);
    });
    QCOMPARE(runJob(job, nullptr, nullptr), JobOutcome::Cancelled);
    QCOMPARE(label, "Reading Waveform...");
    QCOMPARE(value, 10);
}

void TestRunJob::asksBeforeOverwriting_data()
{
    QTest::addColumn<QMessageBox::StandardButton>("button");
    QTest::addColumn<bool>("agreed");
    QTest::newRow("yes") << QMessageBox::Yes << true;
    QTest::newRow("no") << QMessageBox::No << false;
}

void TestRunJob::asksBeforeOverwriting()
{
    QFETCH(QMessageBox::StandardButton, button);
    QFETCH(bool, agreed);
    QTemporaryDir folder;
    QFile file(folder.filePath("taken.wv"));
    QVERIFY(file.open(QIODevice::WriteOnly));
    (void)Tracer::takeEntries();
    QString title;
    QString text;
    QTimer timer;
    onNext<QMessageBox>(timer, [&](QMessageBox &box) {
        title = box.windowTitle();
        text = box.text();
        QTest::mouseClick(box.button(button), Qt::LeftButton);
    });
    QCOMPARE(confirmOverwrite(nullptr, file.fileName()), agreed);
    QCOMPARE(title, "Overwrite File");
    QCOMPARE(text, "The target file already exists.\nDo you want to overwrite this file?");
    const QList<Tracer::Entry> lines = Tracer::takeEntries();
    QCOMPARE(lines.size(), agreed ? 0 : 1);
    QVERIFY(agreed || lines.first().first.endsWith("  User break."));
}

void TestRunJob::newFilesNeedNoQuestion()
{
    QTemporaryDir folder;
    QVERIFY(confirmOverwrite(nullptr, folder.filePath("new.wv")));
}

QTEST_MAIN(TestRunJob)
#include "tst_runjob.moc"
