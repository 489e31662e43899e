// SPDX-License-Identifier: Apache-2.0
#include "jobs/jobrun.h"
#include "toolwindow.h"

#include "support/files.h"
#include "support/logreader.h"
#include "support/modals.h"
#include "support/rows.h"
#include "support/wvbytes.h"
#include "tools/DlgResample.h"
#include "tools/DlgView.h"
#include "tools/DlgWvCreate.h"
#include "tools/ViewFrame.h"

#include "display/CWidgetIQTrace.h"
#include "display/CWidgetOverview.h"
#include "display/CWidgetSpectrum.h"
#include "display/CWidgetTimeline.h"
#include "display/QtNumericEdit.h"
#include "wvfile/HvFileIO.h"

#include <QComboBox>
#include <QDeadlineTimer>
#include <QLabel>
#include <QMessageBox>
#include <QPushButton>
#include <QSettings>
#include <QSignalSpy>
#include <QStackedWidget>
#include <QTest>
#include <QTextEdit>

#include <cmath>
#include <memory>

using namespace toolwindow;

namespace {

QTextEdit &reportOf(QWidget &dialog)
{
    return *child<QTextEdit>(dialog, "te_result");
}

int pageOf(QWidget &dialog)
{
    return child<QStackedWidget>(dialog, "sw_assist")->currentIndex();
}

ViewFrame &frameOf(QWidget &dialog)
{
    return *child<ViewFrame>(dialog, "w_view");
}

QString textOf(QWidget &dialog, const char *label)
{
    return child<QLabel>(dialog, label)->text();
}

} // namespace

class TestTools : public QObject
{
    Q_OBJECT

private slots:
    void init();
    void resampleFollowsTheFieldThatDecides();
    void typedValuesAreTakenByKeys();
    void cancelledConversionLeavesNothing();
    void creationOverwritesUnlessCancelled();
    void refusalKeepsTheFile();
    void createShowsWhatTheFieldsMake();
    void createKeepsItsSettings();
    void viewMovesZoomsAndPlays();
    void viewCursorsShowValuesAndDistance();
    void viewRefusesAndKeeps();

private:
    [[nodiscard]] QString path(const QString &name) const { return m_folder->path(name); }

    std::unique_ptr<TestFolder> m_folder;
    StreamFolder m_streams;
};

void TestTools::init()
{
    m_folder = std::make_unique<TestFolder>();
    QVERIFY(m_folder->store("tone.wv", toneFile(4000)));
    (void)takeLog();
}

void TestTools::resampleFollowsTheFieldThatDecides()
{
    DlgResample dialog;
    QVERIFY(dialog.startModule(path("tone.wv")));
    dialog.show();
    QCOMPARE(textOf(dialog, "l_src_samples"), QString("4000"));
    QCOMPARE(child<QLineEdit>(dialog, "le_outfile")->text(), path("tone_resample.wv"));
    click(dialog, "pb_next");
    auto *clock = child<QtNumericEdit>(dialog, "le_target_clock");
    auto *samples = child<QtNumericEdit>(dialog, "le_target_samples");
    type(clock, "1.5M");
    QCOMPARE(samples->getValInt(), 6000); // 1.5 MHz / 1 MHz * 4000
    QVERIFY(!samples->isEnabled());
    click(dialog, "rb_samples");
    QVERIFY(!clock->isEnabled());
    type(samples, "2000");
    QCOMPARE(clock->getVal(), 500e3);
    QCOMPARE(child<QtNumericEdit>(dialog, "le_clockrate")->getVal(), 500e3);
    // A target that no waveform can have keeps the wizard where it is.
    type(samples, "268435456");
    QVERIFY(!textOf(dialog, "l_warn").isEmpty());
    click(dialog, "pb_next");
    QCOMPARE(pageOf(dialog), 1);
}

void TestTools::typedValuesAreTakenByKeys()
{
    // The mnemonic of Next leaves the focus, and with it the typed text, where it is.
    for (const int key : {int(Qt::Key_Return), int(Qt::Key_N)}) {
        DlgResample dialog;
        QVERIFY(dialog.startModule(path("tone.wv")));
        dialog.show();
        dialog.activateWindow();
        QVERIFY(QTest::qWaitForWindowActive(&dialog));
        const Qt::KeyboardModifiers modifiers = key == Qt::Key_N ? Qt::AltModifier : Qt::NoModifier;
        QTest::keyClick(dialog.windowHandle(), Qt::Key_Return);
        QCOMPARE(pageOf(dialog), 1);
        auto *clock = child<QtNumericEdit>(dialog, "le_target_clock");
        clock->setFocus();
        clock->selectAll();
        QTest::keyClicks(clock, "3M");
        QTest::keyClick(dialog.windowHandle(), static_cast<Qt::Key>(key), modifiers);
        QTRY_COMPARE(pageOf(dialog), 2);
        QCOMPARE(dialog.options().target.clockHz, 3e6);
        QTest::keyClick(dialog.windowHandle(), Qt::Key_P, Qt::AltModifier);
        QTRY_COMPARE(pageOf(dialog), 1);
        // One that won't do keeps its page, as it does by mouse.
        click(dialog, "rb_samples");
        auto *samples = child<QtNumericEdit>(dialog, "le_target_samples");
        samples->setFocus();
        samples->selectAll();
        QTest::keyClicks(samples, "268435456");
        QTest::keyClick(dialog.windowHandle(), static_cast<Qt::Key>(key), modifiers);
        QTRY_VERIFY(!textOf(dialog, "l_warn").isEmpty());
        QCOMPARE(pageOf(dialog), 1);
    }
}

void TestTools::cancelledConversionLeavesNothing()
{
    // A hole in a file, long enough for a run of seconds on any machine.
    constexpr qint64 samples = 2'000'000;
    QVERIFY(m_folder->store("long.wv", "{TYPE: TGX-WV,0}{CLOCK:1000000}{WAVEFORM-" +
                                           QByteArray::number(4 * samples + 1) + ": #"));
    QVERIFY(QFile::resize(path("long.wv"), 4 * samples + 1000));
    DlgResample dialog;
    QVERIFY(dialog.startModule(path("long.wv")));
    dialog.show();
    click(dialog, "pb_next");
    type(child<QtNumericEdit>(dialog, "le_target_clock"), "100M");
    click(dialog, "pb_next");
    cancelNextJob();
    click(dialog, "pb_next");
    QVERIFY(reportOf(dialog).toPlainText().endsWith("Cancelled"));
    QVERIFY(child<QPushButton>(dialog, "pb_view")->isHidden());
    QVERIFY(!reportOf(dialog).toHtml().contains("color:#c00000")); // as a failure has it
    QVERIFY(!QFile::exists(path("long_resample.wv")));
    QVERIFY(m_streams.isEmpty());

    // The window goes on as if nothing had been.
    QVERIFY(dialog.isVisible());
    click(dialog, "pb_prev");
    click(dialog, "pb_prev");
    type(child<QtNumericEdit>(dialog, "le_target_clock"), "100k");
    click(dialog, "pb_next");
    click(dialog, "pb_next");
    QVERIFY(reportOf(dialog).toPlainText().endsWith("Resampling completed"));
    QVERIFY(QFile::exists(path("long_resample.wv")));
    QSignalSpy wanted(&dialog, &DlgBase::openRequested);
    click(dialog, "pb_view");
    QCOMPARE(wanted.value(0).value(0).toString(), path("long_resample.wv"));
}

void TestTools::creationOverwritesUnlessCancelled()
{
    const QByteArray before = m_folder->load("tone.wv");
    DlgWvCreate dialog;
    QVERIFY(dialog.startModule(path("tone.wv")));
    dialog.show();
    for (int page = 0; page < 3; ++page) {
        click(dialog, "pb_next");
    }
    // A creation is too short for a user to cancel; slow lines of the log make it long.
    Tracer listener;
    connect(&listener, &Tracer::TraceDataAvailable, this, [] {
        for (const QString &line : takeMessages(Tracer::Information)) {
            const QDeadlineTimer moment(line.startsWith("Creating waveform file") ? 600 : 20);
            while (!moment.hasExpired()) {
            }
        }
    });
    whenModal(press("Yes"));
    cancelNextJob();
    click(dialog, "pb_next");
    QVERIFY(reportOf(dialog).toPlainText().endsWith("Cancelled"));
    QVERIFY(m_folder->load("tone.wv") == before);
    QCOMPARE(m_folder->entries(), QStringList("tone.wv"));
    QVERIFY(dialog.isVisible() && child<QAbstractButton>(dialog, "pb_prev")->isEnabled());
    disconnect(&listener, nullptr, this, nullptr);
    click(dialog, "pb_prev");
    QVERIFY(withModal([&] { click(dialog, "pb_next"); }, press("Yes")));
    QVERIFY(reportOf(dialog).toPlainText().contains("Signal creation completed"));
    QCOMPARE(tag(m_folder->load("tone.wv"), "SAMPLES"), "1000"); // the 10 kHz sine
}

void TestTools::refusalKeepsTheFile()
{
    const QByteArray before = m_folder->load("tone.wv");
    DlgResample dialog;
    QVERIFY(dialog.startModule(path("tone.wv")));
    dialog.show();
    click(dialog, "pb_next");
    click(dialog, "pb_next");
    type(child<QLineEdit>(dialog, "le_outfile"), path("tone.wv"));
    Seen seen;
    QString details;
    const auto refuse = [&](QWidget &box) {
        details = dynamic_cast<QMessageBox &>(box).informativeText();
        answer("No", seen)(box);
    };
    QVERIFY(withModal([&] { click(dialog, "pb_next"); }, refuse));
    QCOMPARE(seen.text, "The target file already exists.\nDo you want to overwrite this file?");
    QVERIFY(details.startsWith(path("tone.wv") + " (")); // which one, its size and date
    QCOMPARE(reportOf(dialog).toPlainText(), QString("Resampling aborted"));
    QCOMPARE(takeMessages(Tracer::Error), QStringList("User break."));
    QVERIFY(m_folder->load("tone.wv") == before);

    // An empty name asks nothing and does nothing.
    click(dialog, "pb_prev");
    child<QLineEdit>(dialog, "le_outfile")->clear();
    click(dialog, "pb_next");
    QCOMPARE(takeMessages(Tracer::Error), QStringList("Output file name is empty."));
    QVERIFY(reportOf(dialog).toPlainText().isEmpty());
}

void TestTools::createShowsWhatTheFieldsMake()
{
    DlgWvCreate dialog;
    QVERIFY(dialog.startModule(path("tone.wv")));
    dialog.show();
    child<QComboBox>(dialog, "cb_waveform")->setCurrentText("FM");
    click(dialog, "pb_next");
    // Not a button, of which one closes.
    QVERIFY(dialog.focusWidget() == child<QtNumericEdit>(dialog, "le_modfreq"));
    const auto *facts = child<QLabel>(dialog, "l_sketch");
    QTRY_COMPARE(facts->text(), "1024 samples at 1.024 MHz, peak / RMS 0.00 dB");
    type(child<QtNumericEdit>(dialog, "le_dev"), "40M");
    QTRY_COMPARE(facts->text(),
                 "The required ARB clock rate exceeds the upper limit. Check settings.");
}

void TestTools::createKeepsItsSettings()
{
    {
        DlgWvCreate dialog;
        dialog.show();
        child<QComboBox>(dialog, "cb_waveform")->setCurrentText("FM");
        child<QComboBox>(dialog, "cb_wtype")->setCurrentText("Two Tone");
        click(dialog, "pb_next");
        type(child<QtNumericEdit>(dialog, "le_modfreq"), "7k");
        QSettings settings(path("settings.ini"), QSettings::IniFormat);
        dialog.writeSettings(settings);
        QCOMPARE(settings.value("WvCreate/ver").toDouble(), 1.0);
        QCOMPARE(settings.value("WvCreate/fm.modf").toDouble(), 7000.0);
    }
    DlgWvCreate dialog;
    QSettings settings(path("settings.ini"), QSettings::IniFormat);
    dialog.readSettings(settings);
    QCOMPARE(child<QComboBox>(dialog, "cb_waveform")->currentText(), QString("FM"));
    QCOMPARE(child<QComboBox>(dialog, "cb_wtype")->currentText(), QString("Two Tone"));
    QCOMPARE(child<QtNumericEdit>(dialog, "le_modfreq")->getVal(), 7000.0);
    QCOMPARE(child<QtNumericEdit>(dialog, "le_freq")->getVal(), 10000.0);
}

void TestTools::viewMovesZoomsAndPlays()
{
    QVERIFY(m_folder->store("long.wv", toneFile(20000)));
    DlgView view;
    QVERIFY(view.startModule(path("long.wv")));
    view.show();
    QCOMPARE(view.window().points(), 5000);
    QVERIFY(QTest::qWaitForWindowActive(&view));
    const auto press = [&view](Qt::Key key, Qt::KeyboardModifiers with = {}) {
        QTest::keyClick(view.focusWidget() != nullptr ? view.focusWidget() : &view, key, with);
    };
    // A twentieth of the view is a small step; a move beyond the file goes to its end.
    forRows({{"forward", Qt::Key_PageDown, 5000},
             {"a little", Qt::Key_Right, 5250},
             {"back a little", Qt::Key_Left, 5000},
             {"back", Qt::Key_PageUp, 0},
             {"before the start", Qt::Key_PageUp, 0},
             {"end", Qt::Key_End, 15000},
             {"beyond the end", Qt::Key_PageDown, 15000},
             {"start", Qt::Key_Home, 0}},
            [&](Qt::Key key, int first) {
                press(key);
                QCOMPARE(view.window().first(), first);
            });
    press(Qt::Key_Right, Qt::AltModifier);
    press(Qt::Key_Right, Qt::AltModifier);
    QCOMPARE(textOf(view, "l_csr_sample"), QString("9")); // a column of the trace further
    press(Qt::Key_A);
    auto *whole = child<CWidgetOverview>(view, "w_whole");
    QVERIFY(whole->isVisible() && child<CWidgetIQTrace>(view, "w_iqtrace")->isHidden());
    QTest::mouseClick(whole, Qt::LeftButton, {}, {whole->width() - 12, whole->height() / 2});
    QVERIFY(whole->isHidden());
    QCOMPARE(view.window().first(), 15000);
    const double zoomY = frameOf(view).trace().scene().zoomY;
    press(Qt::Key_Plus, Qt::ControlModifier);
    QVERIFY(frameOf(view).trace().scene().zoomY > zoomY);
    press(Qt::Key_Minus, Qt::ControlModifier);
    QCOMPARE(frameOf(view).trace().scene().zoomY, zoomY);
    press(Qt::Key_Plus);
    QCOMPARE(view.window().points(), 2000);
    QCOMPARE(view.window().first(), 16500); // the middle, 17500, stays
    frameOf(view).set_position(17700);
    press(Qt::Key_Space);
    QTRY_COMPARE(view.window().first(), 18000);
    frameOf(view).slot_playstep();
    QCOMPARE(view.window().first(), 18000);
    // The limits of the frequency view count in that view alone.
    auto *mode = child<QComboBox>(view, "cb_ViewMode");
    for (int index = 0; index < mode->count(); ++index) {
        mode->setCurrentIndex(index);
        QCOMPARE(child<QLabel>(view, "l_fmin")->isEnabled(), index == 5);
    }
}

void TestTools::viewCursorsShowValuesAndDistance()
{
    DlgView view;
    QVERIFY(view.startModule(path("tone.wv")));
    view.resize(1000, 720);
    view.show();
    QCOMPARE(textOf(view, "l_csr_time"), QString("---"));
    frameOf(view).set_csr_data(1000, 0.7, 0);
    click(view, "pb_fix_ref");
    frameOf(view).set_csr_data(3000, 0, 0.7);
    QCOMPARE(textOf(view, "l_csr_sample"), QString("3000"));
    QCOMPARE(textOf(view, "l_csr_time"), QString("3 ms"));
    QCOMPARE(textOf(view, "l_csr_mag"), QString("-3.10 dB"));
    QCOMPARE(textOf(view, "l_csr_phase"), QString("90.00 deg"));
    QCOMPARE(textOf(view, "l_delta_samples"), QString("2000"));
    QCOMPARE(textOf(view, "l_delta_time"), QString("2 ms"));
    // Screen readers hear of it at the plots.
    QCOMPARE(frameOf(view).trace().accessibleDescription(),
             QString("Cursor at sample 3000: I 0.000000, Q 0.700000"));
    auto *spectrum = child<CWidgetSpectrum>(view, "w_spectrum");
    spectrum->markPeak();
    (void)spectrum->picture();
    QVERIFY(spectrum->accessibleDescription().startsWith("Mkr  "));
    auto *trace = child<CWidgetIQTrace>(view, "w_iqtrace");
    QTest::mouseClick(trace, Qt::LeftButton, {}, trace->rect().center());
    QVERIFY(textOf(view, "l_csr_sample") != "3000");

    // Another file has no cursors.
    QVERIFY(m_folder->store("short.wv", toneFile(3)));
    QVERIFY(view.startModule(path("short.wv")));
    const auto *timeline = child<CWidgetTimeline>(view, "w_timeline");
    QCOMPARE(timeline->scene().cursors, (std::array<qint64, 2>{-1, -1}));
    QCOMPARE(timeline->scene().total, 3);
    QCOMPARE(textOf(view, "l_csr_sample"), QString("---"));
    QCOMPARE(trace->accessibleDescription(), QString());
    QCOMPARE(textOf(view, "l_delta_samples"), QString("---"));
    QCOMPARE(textOf(view, "l_file_time"), QString("3 us"));
    QVERIFY(!view.grab().isNull() && takeMessages(Tracer::Error).isEmpty());
}

void TestTools::viewRefusesAndKeeps()
{
    forRows({{"nothing", QByteArray(""), "No tag mark found! Probably incorrect format."},
             {"wrong length", toneFile(100).replace("WAVEFORM-401", "WAVEFORM-4001"),
              "Cannot read enough data from xWAVEFORM tag!"}},
            [&](const QByteArray &content, const QString &words) {
                QVERIFY(m_folder->store("bad.wv", content));
                DlgView view;
                QVERIFY(view.startModule(path("tone.wv")));
                view.show();
                (void)takeLog();
                QVERIFY(!view.startModule(path("bad.wv")));
                QCOMPARE(takeMessages(Tracer::Error).value(0), words);
                QCOMPARE(view.window().sampleCount(), 4000);
                QCOMPARE(view.windowTitle(), QString("View Waveform - tone.wv"));
                click(view, "pb_zoomin");
                QCOMPARE(view.window().points(), 2000);
                view.close();
                QVERIFY(m_streams.isEmpty());
            });
}

QTEST_MAIN(TestTools)
#include "tst_tools.moc"
