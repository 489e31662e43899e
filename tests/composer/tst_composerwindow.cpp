// SPDX-License-Identifier: Apache-2.0
#include "composer/compositiontext.h"
#include "composer/ui/CWidgetTrackEdit.h"
#include "composer/ui/DlgComposer.h"
#include "composer/ui/DlgProgress.h"
#include "display/QtNumericEdit.h"
#include "support/accessible.h"
#include "support/files.h"
#include "support/modals.h"
#include "support/wvbytes.h"

#include <QCheckBox>
#include <QComboBox>
#include <QDropEvent>
#include <QFile>
#include <QLabel>
#include <QLineEdit>
#include <QMimeData>
#include <QPushButton>
#include <QRadioButton>
#include <QSignalSpy>
#include <QTest>
#include <QTextEdit>
#include <QUrl>

/// The window by its events, on files of 1000 and 4000 samples at 1 MHz.
class tst_composerwindow : public QObject
{
    Q_OBJECT

private slots:
    void initTestCase();
    void init();
    void cleanup();
    void fromNothingToFile();
    void undoAndRedo();
    void fullUndoStack();
    void boxesAndCursor();
    void segmentSettings();
    void targetSettings();
    void dragging();
    void dropping();
    void zooming();
    void questions();
    void autosave();
    void reportsOfARun();
    void sixteenTracks();

private:
    template <typename Widget>
    [[nodiscard]] Widget *find(const char *name) const
    {
        return m_window->findChild<Widget *>(QLatin1String(name));
    }
    void press(const char *button) const
    {
        QTest::mouseClick(find<QPushButton>(button), Qt::LeftButton);
    }
    void insert(const char *file, qint64 at) const;
    [[nodiscard]] QPoint pointAt(int track, qint64 sample) const;
    [[nodiscard]] QString names() const;

    TestFolder m_folder;
    std::unique_ptr<DlgComposer> m_window;
    CWidgetTrackEdit *m_tracks = nullptr;
};

void tst_composerwindow::initTestCase()
{
    // A folder of its own: another run on this machine keeps changes, too.
    qputenv("XDG_DATA_HOME", m_folder.path("data").toLocal8Bit());
    QVERIFY(m_folder.store("short.wv", toneFile(1000)));
    QVERIFY(m_folder.store("long.wv", toneFile(4000)));
}

void tst_composerwindow::init()
{
    QFile::remove(DlgComposer::autosaveFile());
    m_window = std::make_unique<DlgComposer>();
    QVERIFY(m_window->startModule(m_folder.path() + '/'));
    m_window->show();
    QVERIFY(QTest::qWaitForWindowExposed(m_window.get()));
    m_tracks = &m_window->tracks();
}

void tst_composerwindow::cleanup()
{
    m_window.reset();
}

void tst_composerwindow::insert(const char *file, qint64 at) const
{
    m_tracks->setCsrSample(static_cast<double>(at));
    find<QLineEdit>("le_wvname")->setText(m_folder.path(file));
    press("pb_insert");
}

QPoint tst_composerwindow::pointAt(int track, qint64 sample) const
{
    const TrackGeometry geometry = m_tracks->geometryOfTracks();
    return {geometry.xOf(sample) + 1, geometry.row(track).center().y()};
}

/// The document with the names of files alone.
QString tst_composerwindow::names() const
{
    return textOf(m_tracks->composition()).remove(m_folder.path() + '/');
}

void tst_composerwindow::fromNothingToFile()
{
    for (int track = 0; track < 3; ++track) {
        press("pb_addtrack");
    }
    // One file on all tracks, then another behind it on the third alone.
    insert("short.wv", 0);
    for (int track = 0; track < 2; ++track) {
        const QRect row = m_tracks->geometryOfTracks().row(track);
        QTest::mouseClick(m_tracks, Qt::LeftButton, {},
                          {row.left() + TrackGeometry::EnableWidth + 8, row.center().y()});
    }
    insert("long.wv", 1000);
    QCOMPARE(names(), "-short.wv@0:0+1000|-short.wv@0:0+1000|short.wv@0:0+1000 "
                      "long.wv@1000:0+4000");
    QCOMPARE(find<QLabel>("l_duration")->text(), "Signal Duration: 5 ms");
    QVERIFY(!m_tracks->composition().segment(2, 1)->selected); // the cursor stands behind it
    QVERIFY(m_window->isWindowModified());
    m_tracks->setTargetName(m_folder.path("result.wv"));
    press("pb_create");
    auto *progress = m_window->findChild<DlgProgress *>();
    QVERIFY(progress);
    QVERIFY(progress->isVisible());
    QVERIFY(progress->findChild<QTextEdit *>("te_messages")
                ->toPlainText()
                .contains("Job Completed at"));
    QTest::mouseClick(progress->findChild<QPushButton *>("pb_close"), Qt::LeftButton);
    QCOMPARE(tag(m_folder.load("result.wv"), "SAMPLES"), "5000");
}

void tst_composerwindow::undoAndRedo()
{
    press("pb_addtrack");
    insert("short.wv", 0);
    auto *undo = find<QPushButton>("pb_undo");
    QCOMPARE(undo->text(), "Undo (2)");
    m_tracks->setCsrSample(10);
    QTest::keyClick(m_tracks, Qt::Key_Delete);
    QCOMPARE(names(), "");
    QTest::mouseClick(undo, Qt::LeftButton);
    QCOMPARE(names(), "short.wv@0:0+1000");
    QTest::keyClick(m_tracks, Qt::Key_Z, Qt::ControlModifier);
    QTest::keyClick(m_tracks, Qt::Key_Z, Qt::ControlModifier);
    QCOMPARE(m_tracks->composition().trackCount(), 0);
    QVERIFY(!undo->isEnabled());
    QTest::keyClick(m_tracks, Qt::Key_Y, Qt::ControlModifier);
    QTest::keyClick(m_tracks, Qt::Key_Y, Qt::ControlModifier);
    QCOMPARE(names(), "short.wv@0:0+1000");
}

/// The oldest states stay, and the last changes are undone together with the 256th.
void tst_composerwindow::fullUndoStack()
{
    press("pb_addtrack");
    for (int i = 1; i <= 260; ++i) {
        m_tracks->setCsrSample(i);
        m_tracks->set_wvend();
    }
    QCOMPARE(find<QPushButton>("pb_undo")->text(), "Undo (256)");
    QCOMPARE(m_tracks->composition().target.lSamples, 260);
    m_tracks->popUndo();
    QCOMPARE(m_tracks->composition().target.lSamples, 254);
    m_tracks->redo();
    QCOMPARE(m_tracks->composition().target.lSamples, 260);
}

void tst_composerwindow::boxesAndCursor()
{
    press("pb_addtrack");
    insert("short.wv", 0);
    const QRect row = m_tracks->geometryOfTracks().row(0);
    QTest::mouseClick(m_tracks, Qt::LeftButton, {}, {row.left() + 10, row.center().y()});
    QVERIFY(!m_tracks->composition().tracks().front().bEnable);
    QSignalSpy cursor(m_tracks, &CWidgetTrackEdit::mouse_xcsr);
    QTest::mouseClick(m_tracks, Qt::LeftButton, {}, pointAt(0, 500));
    QVERIFY(std::abs(m_tracks->cursor() - 500) < 20);
    QVERIFY(m_tracks->composition().segment(0, 0)->selected);
    QCOMPARE(find<QtNumericEdit>("le_csr_sample")->getValInt(), m_tracks->cursor());
    QTest::mouseClick(m_tracks, Qt::LeftButton, Qt::ControlModifier, pointAt(0, 950));
    QCOMPARE(m_tracks->cursor(), 1000);
    QCOMPARE(cursor.count(), 2);
    auto *time = find<QtNumericEdit>("le_csr_time");
    time->selectAll();
    QTest::keyClicks(time, "250u");
    QTest::keyClick(time, Qt::Key_Return);
    QCOMPARE(m_tracks->cursor(), 250);
}

void tst_composerwindow::segmentSettings()
{
    press("pb_addtrack");
    insert("long.wv", 0);
    insert("short.wv", 6000);
    m_tracks->zoomFit();
    const auto open = [this](const Answer &answer) {
        return withModal(
            [this] { QTest::mouseDClick(m_tracks, Qt::LeftButton, {}, pointAt(0, 1000)); }, answer);
    };
    QVERIFY(open([](QWidget &dialog) {
        QCOMPARE(dialog.windowTitle(), "Segment Settings - Track 1");
        QCOMPARE(barriers(dialog).join(", "), QString());
        const auto field = [&](const char *name) {
            return dialog.findChild<QtNumericEdit *>(QLatin1String(name));
        };
        const auto type = [&](const char *name, const char *text) {
            field(name)->selectAll();
            QTest::keyClicks(field(name), text);
            QTest::keyClick(field(name), Qt::Key_Return);
        };
        QCOMPARE(field("le_pos_sample")->max(), 2000.0); // 4000 samples before 6000
        type("le_startsample", "100");
        QCOMPARE(field("le_usedsamples")->getVal(), 3900.0);
        type("le_usedsamples", "500");
        type("le_pos_time", "1.5m");
        QCOMPARE(field("le_pos_sample")->getVal(), 1500.0);
        type("le_levoffset", "6");
        type("le_freqoffset", "2k");
        type("le_fadein", "100u");
        dialog.findChild<QComboBox *>("cb_fadein")->setCurrentIndex(FadeRaisedCosine);
        dialog.findChild<QRadioButton *>("rb_wraparound")->click();
        dialog.findChild<QCheckBox *>("cb_markers")->click();
        ::press("OK")(dialog);
    }));
    QCOMPARE(names(), "long.wv@1500:100+500~ short.wv@6000:0+1000");
    const ComposerSegment &segment = *m_tracks->composition().segment(0, 0);
    QCOMPARE(segment.dLOfs, 6.0);
    QCOMPARE(segment.dFOfs, 2000.0);
    QCOMPARE(segment.dFadeIn, 100e-6);
    QCOMPARE(segment.iFadeIn, qint32{FadeRaisedCosine});
    QVERIFY(segment.bMkr);
    m_tracks->popUndo();
    QVERIFY(open([](QWidget &dialog) { ::press("Cancel")(dialog); }));
    QCOMPARE(names(), "long.wv@0:0+4000 short.wv@6000:0+1000");
}

void tst_composerwindow::targetSettings()
{
    press("pb_addtrack");
    insert("long.wv", 0);
    QVERIFY(withModal([this] { press("pb_settings"); },
                      [](QWidget &dialog) {
                          QCOMPARE(barriers(dialog).join(", "), QString());
                          dialog.findChild<QRadioButton *>("rb_fixed")->click();
                          auto *clock = dialog.findChild<QtNumericEdit *>("le_clockrate");
                          clock->selectAll();
                          QTest::keyClicks(clock, "2M");
                          QTest::keyClick(clock, Qt::Key_Return);
                          dialog.findChild<QRadioButton *>("rb_user")->click();
                          dialog.findChild<QRadioButton *>("rb_samples")->click();
                          auto *samples = dialog.findChild<QtNumericEdit *>("le_targetsamples");
                          samples->selectAll();
                          QTest::keyClicks(samples, "3000"); // not taken by a key: OK does it
                          ::press("OK")(dialog);
                      }));
    const ComposerTarget &target = m_tracks->composition().target;
    QCOMPARE(target.dUsrClk, 2e6);
    QCOMPARE(target.lSamples, 3000);
    QCOMPARE(target.iLenMode, qint32{UserDefinedLength});
    QVERIFY(!target.bClk);
    QCOMPARE(find<QLabel>("l_rate")->text(), "Sample Rate: 2 MHz");
}

void tst_composerwindow::dragging()
{
    press("pb_addtrack");
    insert("short.wv", 0);
    insert("short.wv", 2000);
    m_tracks->zoomFit();
    const auto drag = [this](qint64 from, qint64 to, Qt::KeyboardModifiers keys) {
        QTest::mousePress(m_tracks, Qt::LeftButton, {}, pointAt(0, from));
        QMouseEvent move(QEvent::MouseMove, pointAt(0, to), m_tracks->mapToGlobal(pointAt(0, to)),
                         Qt::NoButton, Qt::LeftButton, keys);
        QCoreApplication::sendEvent(m_tracks, &move);
        QTest::mouseRelease(m_tracks, Qt::LeftButton, keys, pointAt(0, to));
    };
    drag(2500, 2000, {});
    const qint64 moved = m_tracks->composition().segment(0, 1)->lTarget;
    QVERIFY2(std::abs(moved - 1500) < 20, qPrintable(QString::number(moved)));
    drag(moved + 500, 1550, Qt::ControlModifier);
    QCOMPARE(names(), "short.wv@0:0+1000 short.wv@1000:0+1000");
    drag(1500, 200, {}); // the neighbour holds it up
    QCOMPARE(names(), "short.wv@0:0+1000 short.wv@1000:0+1000");
    m_tracks->popUndo();
    QCOMPARE(m_tracks->composition().segment(0, 1)->lTarget, moved);
}

void tst_composerwindow::dropping()
{
    press("pb_addtrack");
    QMimeData data;
    data.setUrls({QUrl::fromLocalFile(m_folder.path("short.wv")),
                  QUrl::fromLocalFile(m_folder.path("other.txt"))});
    QDragEnterEvent enter({5, 5}, Qt::CopyAction, &data, Qt::LeftButton, {});
    QCoreApplication::sendEvent(m_tracks, &enter);
    QVERIFY(enter.isAccepted());
    QDropEvent drop({5, 5}, Qt::CopyAction, &data, Qt::LeftButton, {});
    QCoreApplication::sendEvent(m_tracks, &drop);
    QCOMPARE(names(), "short.wv@0:0+1000");
}

void tst_composerwindow::zooming()
{
    press("pb_addtrack");
    insert("short.wv", 0);
    QCOMPARE(m_tracks->viewEnd(), 2e-3); // twice the first segment
    m_tracks->setCsrSample(500);
    press("pb_zoomin");
    QCOMPARE(m_tracks->viewStart(), 250e-6);
    QCOMPARE(m_tracks->viewEnd(), 1250e-6);
    press("pb_zoomout");
    QCOMPARE(m_tracks->viewStart(), 0.0);
    QCOMPARE(m_tracks->viewEnd(), 2e-3);
    press("pb_zoomfit");
    QCOMPARE(m_tracks->viewEnd(), 1e-3);
}

void tst_composerwindow::questions()
{
    press("pb_addtrack");
    Seen seen;
    QVERIFY(withModal([this] { press("pb_close"); }, answer("Cancel", seen)));
    QCOMPARE(seen.title, "Composer");
    QCOMPARE(seen.text, "The waveform has been modified.\nDo you want to save your changes?");
    QVERIFY(m_window->isVisible());
    QVERIFY(withModal([this] { press("pb_clearall"); }, answer("Cancel", seen)));
    QCOMPARE(m_tracks->composition().trackCount(), 1);
    QVERIFY(withModal([this] { press("pb_clearall"); }, answer("Delete", seen)));
    QCOMPARE(seen.text, "Do you really want to delete everything.\nThis action can not be undone.");
    QCOMPARE(m_tracks->composition().trackCount(), 0);
    QVERIFY(
        withModal([this] { QTest::keyClick(m_window.get(), Qt::Key_Escape); }, ::press("Discard")));
    QVERIFY(!m_window->isVisible());
}

/// A window that never closed leaves its changes to the next one.
void tst_composerwindow::autosave()
{
    press("pb_addtrack");
    insert("short.wv", 0);
    QTRY_VERIFY(QFile::exists(DlgComposer::autosaveFile()));
    QVERIFY(!DlgComposer::hasLeftWork());
    m_window.reset();
    QVERIFY(DlgComposer::hasLeftWork());
    m_window = std::make_unique<DlgComposer>();
    m_tracks = &m_window->tracks();
    QVERIFY(withModal([this] { QVERIFY(m_window->startModule(m_folder.path() + '/')); },
                      ::press("Yes")));
    QCOMPARE(names(), "short.wv@0:0+1000");
    QVERIFY(m_window->isWindowModified());
    m_window->show();
    QVERIFY(withModal([this] { m_window->close(); }, ::press("Discard")));
    QVERIFY(!QFile::exists(DlgComposer::autosaveFile()));
}

void tst_composerwindow::reportsOfARun()
{
    press("pb_addtrack");
    m_tracks->setTargetName(m_folder.path("none.wv"));
    press("pb_create");
    auto *progress = m_window->findChild<DlgProgress *>();
    QVERIFY(progress);
    QVERIFY(progress->findChild<QTextEdit *>("te_messages")
                ->toPlainText()
                .contains("no enabled track has a segment"));
    QVERIFY(progress->findChild<QPushButton *>("pb_close")->isEnabled());
    QVERIFY(!progress->findChild<QPushButton *>("pb_cancel")->isEnabled());
    QVERIFY(!QFile::exists(m_folder.path("none.wv")));
}

/// The most tracks and long names still have their room.
void tst_composerwindow::sixteenTracks()
{
    const QString longName = "a waveform with a name that is far too long for its block.wv";
    QVERIFY(m_folder.store(longName, toneFile(3000)));
    const QByteArray segment = "<Segment sName='%1' lSamples='3000' dSrcClk='1e6' lUsed='";
    const QByteArray track = "<Track bEnable='1'>" + segment + "3000' dFadeIn='3e-4'/>" + segment +
                             "1500' lTarget='6000' bWrap='1'/></Track>";
    const QByteArray xml = "<Settings><TargetWv sName='out.wv' lSamples='9000' dTime='0.009'/>" +
                           track.repeated(16).replace("%1", longName.toUtf8());
    QVERIFY(m_folder.store("many.cms", xml + "</Settings>"));
    QVERIFY(m_window->startModule(m_folder.path("many.cms")));
    QCOMPARE(m_tracks->composition().trackCount(), 16);
    const TrackGeometry geometry = m_tracks->geometryOfTracks();
    QVERIFY(geometry.rowHeight() >= m_tracks->fontMetrics().height());
    QVERIFY(geometry.row(15).bottom() < m_tracks->height() - m_tracks->fontMetrics().height());
}

QTEST_MAIN(tst_composerwindow)
#include "tst_composerwindow.moc"
