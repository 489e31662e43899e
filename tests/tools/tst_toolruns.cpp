// SPDX-License-Identifier: Apache-2.0
#include "jobs/filebytes.h"
#include "toolwindow.h"

#include "display/CWidgetTimeline.h"
#include "display/QtNumericEdit.h"
#include "tools/DlgResample.h"
#include "tools/DlgView.h"
#include "tools/DlgWvCreate.h"
#include "tools/ViewFrame.h"

#include <QComboBox>
#include <QDeadlineTimer>
#include <QDir>
#include <QLabel>
#include <QStackedWidget>
#include <QTemporaryDir>
#include <QTextEdit>

#include <memory>

using namespace filebytes;
using namespace toolwindow;

namespace {

constexpr auto redLine = "color:#c00000";

QByteArray tone(int samples)
{
    QByteArray block;
    for (int i = 0; i < samples; ++i) {
        block += words({i % 2 != 0 ? 20000 : -20000, i % 4 > 1 ? 20000 : -20000});
    }
    return wvFile("{TYPE: TGX-WV,0}{CLOCK:1000000}", block);
}

QTextEdit &reportOf(QWidget &dialog)
{
    return *child<QTextEdit>(dialog, "te_result");
}

} // namespace

/// Runs of the tools that are stopped, fail, or come in a row.
class TestToolRuns : public QObject
{
    Q_OBJECT

private slots:
    void initTestCase();
    void init();
    void cancelledConversionLeavesNothing();
    void cancelledCreationSparesTheFile();
    void fullDiskShowsTheRedLine_data();
    void fullDiskShowsTheRedLine();
    void refusalKeepsTheFile();
    void secondToneFollowsTheVariant_data();
    void secondToneFollowsTheVariant();
    void viewRefusesAndKeeps_data();
    void viewRefusesAndKeeps();
    void viewForgetsTheFileBefore();
    void viewPlaysToTheEnd();
    void viewTellsOfMoves();

private:
    [[nodiscard]] QString path(const QString &name) const { return m_folder->filePath(name); }

    std::unique_ptr<QTemporaryDir> m_folder;
    QTemporaryDir m_temporary; // where the jobs keep their streams
};

void TestToolRuns::initTestCase()
{
    qputenv("TMPDIR", QFile::encodeName(m_temporary.path()));
}

void TestToolRuns::init()
{
    m_folder = std::make_unique<QTemporaryDir>();
    QVERIFY(store(path("tone.wv"), tone(4000)));
    (void)Tracer::takeEntries();
}

void TestToolRuns::cancelledConversionLeavesNothing()
{
    // A hole in a file, long enough for a run of seconds.
    constexpr qint64 samples = 10'000'000;
    QVERIFY(store(path("long.wv"), "{TYPE: TGX-WV,0}{CLOCK:10000000}{WAVEFORM-" +
                                       QByteArray::number(4 * samples + 1) + ": #"));
    QVERIFY(QFile::resize(path("long.wv"), 4 * samples + 1000));
    DlgResample dialog;
    QVERIFY(dialog.startModule(path("long.wv")));
    dialog.show();
    click(dialog, "pb_next");
    type(child<QtNumericEdit>(dialog, "le_target_clock"), "200M");
    click(dialog, "pb_next");
    cancelNextJob();
    click(dialog, "pb_next");
    QVERIFY(reportOf(dialog).toPlainText().endsWith("Resampling failed"));
    QVERIFY(reportOf(dialog).toHtml().contains(redLine));
    QVERIFY(takeLog(Tracer::Error).contains("*** Action aborted by user."));
    QVERIFY(!QFile::exists(path("long_resample.wv")));
    QVERIFY(QDir(m_temporary.path()).isEmpty(QDir::Files));

    // The window goes on as if nothing had been.
    QVERIFY(dialog.isVisible());
    click(dialog, "pb_prev");
    click(dialog, "pb_prev");
    type(child<QtNumericEdit>(dialog, "le_target_clock"), "1M");
    click(dialog, "pb_next");
    click(dialog, "pb_next");
    QVERIFY(reportOf(dialog).toPlainText().endsWith("Resampling completed"));
    QVERIFY(QFile::exists(path("long_resample.wv")));
}

void TestToolRuns::cancelledCreationSparesTheFile()
{
    const QByteArray before = load(path("tone.wv"));
    DlgWvCreate dialog;
    QVERIFY(dialog.startModule(path("tone.wv")));
    dialog.show();
    for (int page = 0; page < 3; ++page) {
        click(dialog, "pb_next");
    }
    // A creation is too short for a user to cancel; slow lines of the log make it long.
    Tracer listener;
    connect(&listener, &Tracer::TraceDataAvailable, this, [] {
        for (const QString &line : takeLog(Tracer::Information)) {
            const QDeadlineTimer moment(line.startsWith("Creating waveform file") ? 600 : 150);
            while (!moment.hasExpired()) {
            }
        }
    });
    QString question;
    answerNextQuestion(QMessageBox::Yes, &question);
    cancelNextJob();
    click(dialog, "pb_next");
    QVERIFY(reportOf(dialog).toPlainText().endsWith("Creation failed"));
    QVERIFY(load(path("tone.wv")) == before);
    QCOMPARE(QDir(m_folder->path()).entryList(QDir::Files | QDir::Hidden), QStringList("tone.wv"));
    QVERIFY(dialog.isVisible() && child<QAbstractButton>(dialog, "pb_prev")->isEnabled());
}

void TestToolRuns::fullDiskShowsTheRedLine_data()
{
    QTest::addColumn<bool>("creates");
    QTest::addColumn<QString>("words");
    QTest::newRow("create") << true << "Creation failed";
    QTest::newRow("resample") << false << "Resampling failed";
}

void TestToolRuns::fullDiskShowsTheRedLine()
{
    QFETCH(bool, creates);
    QFETCH(QString, words);
    std::unique_ptr<DlgBase> dialog;
    if (creates) {
        dialog = std::make_unique<DlgWvCreate>();
        QVERIFY(dialog->startModule({}));
    } else {
        dialog = std::make_unique<DlgResample>();
        QVERIFY(dialog->startModule(path("tone.wv")));
    }
    dialog->show();
    for (int page = 0; page < (creates ? 3 : 2); ++page) {
        click(*dialog, "pb_next");
    }
    type(child<QLineEdit>(*dialog, "le_outfile"), "/dev/full");
    QString question;
    answerNextQuestion(QMessageBox::Yes, &question);
    click(*dialog, "pb_next");
    QVERIFY(!question.isEmpty());
    QVERIFY(reportOf(*dialog).toPlainText().endsWith(words));
    QVERIFY(reportOf(*dialog).toHtml().contains(redLine));
    QCOMPARE(takeLog(Tracer::Error),
             (QStringList{"Error writing output file: No space left on device",
                          "Waveform generation failed."}));
    QVERIFY(QDir(m_temporary.path()).isEmpty(QDir::Files));
    QVERIFY(child<QAbstractButton>(*dialog, "pb_prev")->isEnabled());
}

void TestToolRuns::refusalKeepsTheFile()
{
    const QByteArray before = load(path("tone.wv"));
    DlgResample dialog;
    QVERIFY(dialog.startModule(path("tone.wv")));
    dialog.show();
    click(dialog, "pb_next");
    click(dialog, "pb_next");
    type(child<QLineEdit>(dialog, "le_outfile"), path("tone.wv"));
    QString question;
    answerNextQuestion(QMessageBox::No, &question);
    click(dialog, "pb_next");
    QCOMPARE(question,
             QString("The target file already exists.\nDo you want to overwrite this file?"));
    QCOMPARE(reportOf(dialog).toPlainText(), QString("Resampling aborted"));
    QCOMPARE(takeLog(Tracer::Error), QStringList("User break."));
    QVERIFY(load(path("tone.wv")) == before);

    // An empty name asks nothing and does nothing.
    click(dialog, "pb_prev");
    child<QLineEdit>(dialog, "le_outfile")->clear();
    click(dialog, "pb_next");
    QCOMPARE(takeLog(Tracer::Error), QStringList("Output file name is empty."));
    QVERIFY(reportOf(dialog).toPlainText().isEmpty());
}

void TestToolRuns::secondToneFollowsTheVariant_data()
{
    QTest::addColumn<QString>("waveform");
    QTest::addColumn<int>("variant");
    QTest::addColumn<bool>("enabled");
    QTest::addColumn<QStringList>("fields");
    const QStringList fm{"le_modfreq_2", "le_dev_2"};
    const QStringList am{"le_ammodfreq_2", "le_amdepth_2"};
    QTest::newRow("fm, one") << "FM" << 0 << false << fm;
    QTest::newRow("fm, two") << "FM" << 1 << true << fm;
    QTest::newRow("am, both sidebands") << "AM" << 5 << false << am;
    QTest::newRow("am, two") << "AM" << 6 << true << am;
    QTest::newRow("am, two without carrier") << "AM" << 7 << true << am;
}

void TestToolRuns::secondToneFollowsTheVariant()
{
    QFETCH(QString, waveform);
    QFETCH(int, variant);
    QFETCH(QStringList, fields);
    DlgWvCreate dialog;
    dialog.show();
    child<QComboBox>(dialog, "cb_waveform")->setCurrentText(waveform);
    child<QComboBox>(dialog, "cb_wtype")->setCurrentIndex(variant);
    click(dialog, "pb_next");
    for (const QString &field : fields) {
        QTEST(child<QWidget>(dialog, field.toLatin1())->isEnabled(), "enabled");
    }
}

void TestToolRuns::viewRefusesAndKeeps_data()
{
    QTest::addColumn<QByteArray>("content");
    QTest::addColumn<QString>("words");
    QTest::newRow("nothing") << QByteArray() << "No tag mark found! Probably incorrect format.";
    QTest::newRow("another kind") << QByteArray("RIFF1234WAVE")
                                  << "No tag mark found! Probably incorrect format.";
    QTest::newRow("no samples") << wvFile("{TYPE: TGX-WV,0}{CLOCK:1e6}{SAMPLES:0}", {})
                                << "Invalid number of samples! Use value > 0.";
    QTest::newRow("wrong length") << tone(100).replace("WAVEFORM-401", "WAVEFORM-4001")
                                  << "Cannot read enough data from xWAVEFORM tag!";
}

void TestToolRuns::viewRefusesAndKeeps()
{
    QFETCH(QByteArray, content);
    QVERIFY(store(path("bad.wv"), content));
    DlgView view;
    QVERIFY(view.startModule(path("tone.wv")));
    view.show();
    (void)Tracer::takeEntries();
    QVERIFY(!view.startModule(path("bad.wv")));
    QTEST(takeLog(Tracer::Error).value(0), "words");
    QCOMPARE(view.window().sampleCount(), 4000);
    QCOMPARE(view.windowTitle(), QString("View Waveform - tone.wv"));
    click(view, "pb_zoomin");
    QCOMPARE(view.window().points(), 2000);
    view.close();
    QVERIFY(QDir(m_temporary.path()).isEmpty(QDir::Files));
}

void TestToolRuns::viewForgetsTheFileBefore()
{
    QVERIFY(store(path("short.wv"), tone(511)));
    DlgView view;
    QVERIFY(view.startModule(path("tone.wv")));
    view.show();
    child<ViewFrame>(view, "w_view")->set_csr_data(100, 0.5, 0.5);
    view.fix_ref_csr(true);
    const auto *timeline = child<CWidgetTimeline>(view, "w_timeline");
    QCOMPARE(timeline->scene().cursors, (std::array<qint64, 2>{100, 100}));
    QVERIFY(view.startModule(path("short.wv")));
    QCOMPARE(timeline->scene().cursors, (std::array<qint64, 2>{-1, -1}));
    QCOMPARE(timeline->scene().total, 511);
    QCOMPARE(child<QLabel>(view, "l_csr_sample")->text(), QString("---"));
    QCOMPARE(child<QLabel>(view, "l_delta_samples")->text(), QString("---"));
    QCOMPARE(child<QLabel>(view, "l_file_time")->text(), QString("511 us"));
    QVERIFY(takeLog(Tracer::Error).isEmpty());
}

void TestToolRuns::viewPlaysToTheEnd()
{
    QVERIFY(store(path("long.wv"), tone(5600)));
    DlgView view;
    QVERIFY(view.startModule(path("long.wv")));
    view.show();
    click(view, "pb_play");
    QTRY_COMPARE(view.window().first(), 600); // 250, 500, and what is left
    child<ViewFrame>(view, "w_view")->slot_playstep();
    QCOMPARE(view.window().first(), 600);
    QVERIFY(takeLog(Tracer::Error).isEmpty());
}

void TestToolRuns::viewTellsOfMoves()
{
    QVERIFY(store(path("long.wv"), tone(20000)));
    DlgView view;
    QVERIFY(view.startModule(path("long.wv")));
    view.show();
    (void)Tracer::takeEntries();
    for (const char *button : {"pb_forward", "pb_forward_little", "pb_reverse_little", "pb_reverse",
                               "pb_reverse", "pb_end", "pb_start"}) {
        click(view, button);
    }
    QStringList starts;
    for (const QString &line : takeLog(Tracer::Information)) {
        starts << line.section("New start sample: ", 1);
    }
    QCOMPARE(starts, (QStringList{"5000", "5250", "5000", "0", "0", "15000", "0"}));

    // The limits of the frequency view count in that view alone.
    auto *mode = child<QComboBox>(view, "cb_ViewMode");
    for (int index = 0; index < mode->count(); ++index) {
        mode->setCurrentIndex(index);
        QCOMPARE(child<QLabel>(view, "l_fmin")->isEnabled(), index == 5);
        QCOMPARE(child<QLabel>(view, "l_fmax")->isEnabled(), index == 5);
    }
    QCOMPARE(child<QLabel>(view, "l_fmax")->text(), QString("500 kHz"));
}

QTEST_MAIN(TestToolRuns)
#include "tst_toolruns.moc"
