// SPDX-License-Identifier: Apache-2.0
// The instruments that the window finds, and what it shows of them.
#include "InstrListTest.h"

#include "instrument/FakeInstrument.h"
#include "instrument/LogRecorder.h"
#include "instrument/VisaDevice.h"
#include "support/rows.h"
#include "toolframe/QtProgressDialog.h"

#include <QApplication>
#include <QTest>
#include <QTimer>

namespace {

constexpr unsigned allLevels = Tracer::DefaultMask;

} // namespace

class TestDlgInstrConfig : public InstrListTest
{
    Q_OBJECT

private slots:
    void addsByResource();
    void refusesWhatDoesNotAnswer();
    void capabilities();
    void scansGpib();
    void scansUsbInVain();
    void marksStates();
    void leavesBusyInstrumentAlone();
    void seesInstrumentReturn();
    void seesInstrumentReplaced();
    void cancelledRefreshShowsTheRest();
};

void TestDlgInstrConfig::addsByResource()
{
    QVERIFY(hintIsVisible());
    type(generator);
    QCOMPARE(rows(), QStringList{"online|TGX-870, 100001|GPIB0|"});
    QVERIFY(!hintIsVisible());
    QCOMPARE(m_changes->size(), 1);
    InstrConfigEntry expected = entry("TGX-870", "100001", generator);
    expected.folder = "Manually Added";
    QCOMPARE(m_dialog->instruments(), QList<InstrConfigEntry>{expected});
    QCOMPARE(item(0)->checkState(0), Qt::Checked);

    // Nothing of it stays open.
    VisaDevice pane;
    QVERIFY(!pane.isOpenElsewhere("TGX-870", "100001"));

    click("pb_add");
    QCOMPARE(takeLog(allLevels).last(), "1 The instrument 'TGX-870, 100001' was already added.");
    QCOMPARE(m_dialog->instruments().size(), 1);
    QCOMPARE(rows().size(), 1);

    // In use by a pane, not even a session is opened.
    QVERIFY(pane.openResource(generator));
    (void)takeLog(allLevels);
    click("pb_add");
    QCOMPARE(takeLog(allLevels),
             (QStringList{"1 Trying to open device 'GPIB0::28::INSTR'...",
                          "1 The instrument 'TGX-870, 100001' was already added."}));
}

void TestDlgInstrConfig::refusesWhatDoesNotAnswer()
{
    type("");
    QCOMPARE(takeLog(allLevels), QStringList{});
    struct Row
    {
        const char *name; ///< the text
        QString resource;
    };
    forRows<Row>({{"127.0.0.99", "TCPIP::127.0.0.99::INSTR"}, {"nonsense::", "nonsense::"}},
                 [this](const Row &row) {
                     type(row.name);
                     const QStringList log = takeLog(allLevels);
                     QCOMPARE(log.first(), "1 Trying to open device '" + row.resource + "'...");
                     QCOMPARE(log.last(), "4 The device '" + row.resource + "' was not added.");
                     QVERIFY2(status().contains(row.resource), qPrintable(status()));
                 });
    QCOMPARE(m_changes->size(), 0);
    QVERIFY(m_dialog->instruments().isEmpty());
    QVERIFY(hintIsVisible());
    QVERIFY(!QApplication::overrideCursor());
}

void TestDlgInstrConfig::capabilities()
{
    const FakeInstrument fake;
    fake->identity = "Halvorn,TGX-810,TGX810/7/01,1.0";
    fake->options = "TGX810-R12,TGX810-R23,TGX810-P1,TGX810-P2,TGX810-K1";
    type("GPIB0::1::INSTR");
    QCOMPARE(item(0)->text(0), "TGX-810, 7");
    const QStringList expected{"VISA resource|GPIB0::1::INSTR",
                               "Firmware|1.0",
                               "User data|D:",
                               "RF 1|100.0 kHz - 2.2 GHz",
                               "RF 2|100.0 kHz - 3.0 GHz",
                               "BB1 size|64 MS",
                               "BB1 max. clock|40 MHz",
                               "BB1 bandwidth|100 MHz",
                               "BB2 size|16 MS",
                               "BB2 max. clock|40 MHz",
                               "BB2 bandwidth|100 MHz"};
    QCOMPARE(childRows(), expected);
    click("pb_refresh");
    QCOMPARE(childRows(), expected);
    // An instrument without these has no such rows.
    fake->identity = "Halvorn,PAX-630,100005/003,5.10";
    fake->options = "PAX630-K1,";
    click("pb_refresh");
    QCOMPARE(childRows(),
             (QStringList{"VISA resource|GPIB0::1::INSTR", "Firmware|5.10", "User data|D:"}));
}

void TestDlgInstrConfig::scansGpib()
{
    type(otherGenerator);
    m_changes->clear();
    (void)takeLog();
    click("pb_scan_gpib");
    QCOMPARE(rows(),
             (QStringList{"online|TGX-810, 200002|GPIB0|", "online|TGX-870, 100001|GPIB0|"}));
    QCOMPARE(m_dialog->instruments().at(0).folder, "Manually Added");
    QCOMPARE(m_dialog->instruments().at(1).folder, "GPIB Scan");
    QCOMPARE(m_changes->size(), 1);
    QVERIFY(takeLog(allLevels).contains("1 The instrument 'TGX-810, 200002' was already added."));
    QCOMPARE(status(), "The scan found 1 new instrument.");
    // The scan's own sessions are gone: a refresh finds nothing busy.
    click("pb_refresh");
    QCOMPARE(stateOf(item(1)), "online");
}

void TestDlgInstrConfig::scansUsbInVain()
{
    const FakeInstrument fake;
    click("pb_scan_usb");
    const QStringList log = takeLog(allLevels);
    QVERIFY2(log.contains("1 Scanning for local USB devices..."), qPrintable(log.join('\n')));
    QVERIFY(log.contains("1 No devices found."));
    QCOMPARE(m_changes->size(), 0);
    QVERIFY(hintIsVisible());
    // And with one.
    fake->resources = {"USB0::0x7FE3::0x0048::100001::INSTR"};
    click("pb_scan_usb");
    QCOMPARE(rows(), QStringList{"online|TGX-870, 100001|USB0|"});
    QCOMPARE(m_dialog->instruments().at(0).folder, "USB Scan");
}

void TestDlgInstrConfig::marksStates()
{
    InstrConfigEntry unchecked = entry("TGX-810", "200002", otherGenerator);
    unchecked.enabled = false;
    unchecked.comment = "right bench";
    InstrConfigEntry incomplete = entry("TGX-850", "", "GPIB0::11::INSTR");
    fill({entry("TGX-870", "100001", generator), unchecked, entry("TGX-840", "300003", silent),
          incomplete});
    QCOMPARE(rows(), (QStringList{"online|TGX-870, 100001|GPIB0|",
                                  "offline|TGX-810, 200002|GPIB0|right bench",
                                  "offline|TGX-840, 300003|GPIB0|"}));
    QCOMPARE(childRows(1), QStringList{"VISA resource|" + otherGenerator});
    QCOMPARE(childRows(2), QStringList{"VISA resource|" + silent});
    QCOMPARE(item(1)->checkState(0), Qt::Unchecked);
    // What isn't checked isn't asked, and nothing is lost.
    QVERIFY(!takeLog(allLevels).contains("1 Opening VISA device '" + otherGenerator + "'"));
    QCOMPARE(m_dialog->instruments().size(), 4);
}

void TestDlgInstrConfig::leavesBusyInstrumentAlone()
{
    VisaDevice pane;
    QVERIFY(pane.openResource(generator));
    fill({entry("TGX-870", "100001", generator), entry("TGX-810", "200002", otherGenerator)});
    QCOMPARE(rows(), (QStringList{"busy|TGX-870, 100001|GPIB0|", "online|TGX-810, 200002|GPIB0|"}));
    QCOMPARE(childRows(0), QStringList{"VISA resource|" + generator});
    const QStringList log = takeLog(allLevels);
    QCOMPARE(log.filter("Opening VISA device '" + generator).size(), 1); // the pane's own
    QVERIFY(pane.isOpen());
    pane.closeResource();
    click("pb_refresh");
    QCOMPARE(stateOf(item(0)), "online");
}

void TestDlgInstrConfig::seesInstrumentReturn()
{
    const FakeInstrument fake;
    fake.failCall("viOpen", -1);
    fill({entry("TGX-870", "100001", generator)});
    QCOMPARE(stateOf(item(0)), "offline");
    item(0)->setExpanded(true);
    tree()->setCurrentItem(item(0)->child(0));
    fake->status = nullptr;
    click("pb_refresh");
    QCOMPARE(stateOf(item(0)), "online");
    QCOMPARE(m_changes->size(), 1);
    // The user's view of the list stays.
    QVERIFY(item(0)->isExpanded());
    QCOMPARE(tree()->currentItem(), item(0));
}

void TestDlgInstrConfig::seesInstrumentReplaced()
{
    fill({entry("TGX-840", "300003", generator)});
    QCOMPARE(rows(), QStringList{"online|TGX-870, 100001|GPIB0|"});
    QCOMPARE(m_dialog->instruments(),
             QList<InstrConfigEntry>{entry("TGX-870", "100001", generator)});
    QVERIFY(takeLog().contains(
        "2 At 'GPIB0::28::INSTR' there is now the instrument 'TGX-870, 100001'."));
}

void TestDlgInstrConfig::cancelledRefreshShowsTheRest()
{
    // Slow enough for the progress dialog to come, each of them.
    for (const QString &resource : {generator, otherGenerator}) {
        VisaDevice device;
        QVERIFY(device.openResource(resource));
        QVERIFY(device.sendCommand(":SYST:FAUL 'slow-answer',200"));
    }
    (void)takeLog();
    bool cancelled = false;
    QTimer poll;
    connect(&poll, &QTimer::timeout, this, [&] {
        auto *progress = qobject_cast<QtProgressDialog *>(QApplication::activeModalWidget());
        if (progress != nullptr && progress->isVisible()) {
            cancelled = true;
            QVERIFY(progress->labelText().contains("TGX-810, 200002"));
            // Slots that come in now wait for no second round.
            m_dialog->instr_refresh();
            m_dialog->instr_scan_gpib();
            m_dialog->instr_clearlist();
            QTest::keyClick(progress, Qt::Key_Escape);
        }
    });
    poll.start(0);
    fill({entry("TGX-870", "100001", generator), entry("TGX-810", "200002", otherGenerator)});
    QVERIFY(cancelled);
    QCOMPARE(rows(),
             (QStringList{"online|TGX-870, 100001|GPIB0|", "offline|TGX-810, 200002|GPIB0|"}));
    QCOMPARE(takeLog(allLevels).filter("Opening VISA device").size(), 1);
    QCOMPARE(m_dialog->instruments().size(), 2);
    QVERIFY(!QApplication::overrideCursor());
}

QTEST_MAIN(TestDlgInstrConfig)
#include "tst_dlginstrconfig.moc"
