// SPDX-License-Identifier: Apache-2.0
#include "base/ProgressClock.h"
#include "jobs/ToolJob.h"
#include "support/files.h"
#include "support/logreader.h"
#include "support/modals.h"
#include "toolframe/QtProgressDialog.h"
#include "toolframe/questions.h"
#include "toolframe/runjob.h"

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
    void asksBeforeOverwriting();
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

void TestRunJob::asksBeforeOverwriting()
{
    const TestFolder folder;
    QVERIFY(folder.store("taken.wv", {}));
    QVERIFY(confirmOverwrite(nullptr, folder.path("new.wv")));
    for (const bool agreed : {true, false}) {
        (void)takeLog();
        Seen seen;
        QVERIFY(
            withModal([&] { QCOMPARE(confirmOverwrite(nullptr, folder.path("taken.wv")), agreed); },
                      answer(agreed ? "Yes" : "No", seen)));
        QCOMPARE(seen.title, "Overwrite File");
        QCOMPARE(takeMessages(), agreed ? QStringList() : QStringList("User break."));
    }
}

QTEST_MAIN(TestRunJob)
#include "tst_runjob.moc"
