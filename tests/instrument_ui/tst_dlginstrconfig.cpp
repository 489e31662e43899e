// SPDX-License-Identifier: Apache-2.0
// The window of the instrument list, driven by mouse and keyboard, with simulated instruments.
#include "instrument/DlgInstrConfig.h"
#include "instrument/FakeInstrument.h"
#include "instrument/LogRecorder.h"
#include "instrument/VisaDevice.h"
#include "simulator/SimulatorProcess.h"
#include "toolframe/QtProgressDialog.h"

#include <QApplication>
#include <QDir>
#include <QFile>
#include <QInputDialog>
#include <QLabel>
#include <QLineEdit>
#include <QPushButton>
#include <QSettings>
#include <QSignalSpy>
#include <QStyle>
#include <QTest>
#include <QTimer>
#include <QTreeWidget>

namespace {

const QString generator = "GPIB0::28::INSTR";
const QString otherGenerator = "GPIB0::5::INSTR";
const QString silent = "GPIB0::9::INSTR";

constexpr unsigned allLevels = Tracer::DefaultMask;

InstrConfigEntry entry(const QString &model, const QString &serial, const QString &resource)
{
    return {.enabled = true,
            .model = model,
            .serial = serial,
            .resource = resource,
            .interface = resource.section("::", 0, 0),
            .comment = {},
            .folder = "GPIB Scan"};
}

/// "online", "busy" or "offline", by the picture that is shown.
QString stateOf(const QTreeWidgetItem *item)
{
    const QImage shown = item->icon(0).pixmap(16, 16).toImage();
    for (const QString state : {"online", "busy", "offline"}) {
        if (shown == QIcon(":/icons16/device_" + state + ".png").pixmap(16, 16).toImage()) {
            return state;
        }
    }
    return "unknown picture";
}

/// Waits until keys go to a window.
bool hasFocus(const QWidget &window)
{
    return QTest::qWaitFor([&] {
        const QWidget *focus = QApplication::focusWidget();
        return focus != nullptr && focus->window() == &window;
    });
}

} // namespace

class TestDlgInstrConfig : public QObject
{
    Q_OBJECT

private slots:
    void init();
    void cleanup();
    void addsByResource();
    void addsByHostName();
    void refusesWhatDoesNotAnswer_data();
    void refusesWhatDoesNotAnswer();
    void capabilities_data();
    void capabilities();
    void scansGpib();
    void scansUsbInVain();
    void marksStates();
    void leavesBusyInstrumentAlone();
    void seesInstrumentReturn();
    void seesInstrumentReplaced();
    void checks();
    void comments();
    void deletes();
    void cancelledRefreshShowsTheRest();
    void settings();
    void withoutVisa();
    void keys();
    void showsEverything();

private:
    void fill(const QList<InstrConfigEntry> &entries);
    void type(const QString &text);
    void click(const char *button);
    [[nodiscard]] QStringList rows() const;
    [[nodiscard]] QStringList childRows(int row = 0) const;
    [[nodiscard]] QTreeWidget *tree() const { return m_dialog->findChild<QTreeWidget *>(); }
    [[nodiscard]] QTreeWidgetItem *item(int row) const { return tree()->topLevelItem(row); }
    [[nodiscard]] bool hintIsVisible() const
    {
        return m_dialog->findChild<QLabel *>("l_hint")->isVisible();
    }
    [[nodiscard]] QString iniFile() const { return m_folder.filePath("corvane.ini"); }

    QTemporaryDir m_folder;
    std::unique_ptr<SimulatorProcess> m_simulator;
    std::unique_ptr<DlgInstrConfig> m_dialog;
    std::unique_ptr<QSignalSpy> m_changes;
};

void TestDlgInstrConfig::init()
{
    // Scripted instruments set it.
    qunsetenv("CORVANE_VISA_LIBRARY");
    m_simulator = std::make_unique<SimulatorProcess>();
    QVERIFY2(m_simulator->startConfig("[a]\nmodel=TGX-870\nserial=100001\nroot=%ROOT%/a\n"
                                      "gateway=0\ngpib=28\n"
                                      "[b]\nmodel=TGX-810\nserial=200002\nroot=%ROOT%/b\n"
                                      "gateway=0\ngpib=5\n",
                                      2),
             qPrintable(m_simulator->errorOutput()));
    const QString configuration = m_folder.filePath("visa.ini");
    QFile file(configuration);
    QVERIFY(file.open(QIODevice::WriteOnly));
    file.write(QString("[GPIB0]\nhost=127.0.0.1\nport=%1\naddresses=5,9,28\n")
                   .arg(m_simulator->gatewayPort())
                   .toLatin1());
    qputenv("CORVANE_VISA_CONFIG", QFile::encodeName(configuration));
    QFile::remove(iniFile());

    m_dialog = std::make_unique<DlgInstrConfig>();
    m_changes = std::make_unique<QSignalSpy>(m_dialog.get(), &DlgInstrConfig::instrumentsChanged);
    m_dialog->show();
    m_dialog->activateWindow();
    QVERIFY(QTest::qWaitForWindowActive(m_dialog.get()));
    (void)takeLog();
}

void TestDlgInstrConfig::cleanup()
{
    m_dialog.reset();
    m_simulator.reset();
}

/// Brings a list in by the settings, as at the start of the program.
void TestDlgInstrConfig::fill(const QList<InstrConfigEntry> &entries)
{
    InstrumentList list;
    for (const InstrConfigEntry &each : entries) {
        list.add(each);
    }
    QSettings settings(iniFile(), QSettings::IniFormat);
    settings.beginGroup("InstrConfig");
    list.write(settings);
    settings.endGroup();
    m_dialog->readSettings(settings);
    m_changes->clear();
}

void TestDlgInstrConfig::type(const QString &text)
{
    auto *line = m_dialog->findChild<QLineEdit *>("le_manual");
    line->setFocus();
    line->selectAll();
    QTest::keyClicks(line, text);
    QTest::keyClick(line, Qt::Key_Return);
}

void TestDlgInstrConfig::click(const char *button)
{
    QTest::mouseClick(m_dialog->findChild<QPushButton *>(button), Qt::LeftButton);
}

/// The top rows, "state|device|interface|comment".
QStringList TestDlgInstrConfig::rows() const
{
    QStringList texts;
    for (int row = 0; row < tree()->topLevelItemCount(); ++row) {
        const QTreeWidgetItem *each = item(row);
        texts.append(
            QStringList{stateOf(each), each->text(0), each->text(1), each->text(2)}.join('|'));
    }
    return texts;
}

QStringList TestDlgInstrConfig::childRows(int row) const
{
    QStringList texts;
    for (int i = 0; i < item(row)->childCount(); ++i) {
        texts.append(item(row)->child(i)->text(0) + '|' + item(row)->child(i)->text(1));
    }
    return texts;
}

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
    QVERIFY(takeLog(allLevels).contains("1 Trying to open device 'GPIB0::28::INSTR'..."));
    QCOMPARE(item(0)->flags(), Qt::ItemFlags(0x31));
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

void TestDlgInstrConfig::addsByHostName()
{
    SimulatorProcess simulator;
    if (!simulator.start({"--address", "127.0.0.94", "--root", simulator.root()})) {
        QSKIP("The port mapper's port needs special rights here.");
    }
    type(" 127.0.0.94 ");
    QCOMPARE(rows(), QStringList{"online|TGX-870, 100001|TCPIP|"});
    QCOMPARE(m_dialog->instruments().at(0).resource, "TCPIP::127.0.0.94::INSTR");
    // The same instrument by another interface is another entry.
    type(generator);
    QCOMPARE(m_dialog->instruments().size(), 2);
}

void TestDlgInstrConfig::refusesWhatDoesNotAnswer_data()
{
    QTest::addColumn<QString>("text");
    QTest::addColumn<QString>("resource");
    QTest::newRow("host that is off") << "127.0.0.99"
                                      << "TCPIP::127.0.0.99::INSTR";
    QTest::newRow("free address") << silent << silent;
    QTest::newRow("no resource") << "nonsense::"
                                 << "nonsense::";
    QTest::newRow("nothing") << ""
                             << "";
}

void TestDlgInstrConfig::refusesWhatDoesNotAnswer()
{
    QFETCH(const QString, text);
    QFETCH(const QString, resource);
    type(text);
    const QStringList log = takeLog(allLevels);
    if (resource.isEmpty()) {
        QCOMPARE(log, QStringList{});
    } else {
        QCOMPARE(log.first(), "1 Trying to open device '" + resource + "'...");
        QCOMPARE(log.last(), "4 The device '" + resource + "' was not added.");
        const QString told = m_dialog->findChild<QLabel *>("l_status")->text();
        QVERIFY2(told.contains(resource), qPrintable(told));
    }
    QCOMPARE(m_changes->size(), 0);
    QVERIFY(m_dialog->instruments().isEmpty());
    QVERIFY(hintIsVisible());
    QVERIFY(!QApplication::overrideCursor());
}

void TestDlgInstrConfig::capabilities_data()
{
    QTest::addColumn<QByteArray>("identity");
    QTest::addColumn<QByteArray>("options");
    QTest::addColumn<QString>("name");
    QTest::addColumn<QStringList>("expected");
    QTest::newRow("one path, disk")
        << QByteArray("Halvorn,TGX-870,TGX870/123456/01,2.11")
        << QByteArray("TGX870-R16,TGX870-P7,TGX870-P13,TGX870-K1") << "TGX-870, 123456"
        << QStringList{
               "VISA resource|GPIB0::1::INSTR", "Firmware|2.11",  "User data|/var/user/, /hdd/",
               "RF 1| 9.0 kHz - 6.0 GHz",       "BB1 size|32 MS", "BB1 max. clock|120 MHz",
               "BB1 bandwidth|150 MHz"};
    QTest::newRow("two paths") << QByteArray("Halvorn,TGX-810,TGX810/7/01,1.0")
                               << QByteArray("TGX810-R12,TGX810-R23,TGX810-P1,TGX810-P2,TGX810-K1")
                               << "TGX-810, 7"
                               << QStringList{"VISA resource|GPIB0::1::INSTR",
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
    QTest::newRow("analyzer") << QByteArray("Halvorn,PAX-630,100005/003,5.10")
                              << QByteArray("PAX630-K1,") << "PAX-630, 100005"
                              << QStringList{"VISA resource|GPIB0::1::INSTR", "Firmware|5.10",
                                             "User data|D:"};
}

void TestDlgInstrConfig::capabilities()
{
    QFETCH(const QByteArray, identity);
    QFETCH(const QByteArray, options);
    QFETCH(const QString, name);
    QFETCH(const QStringList, expected);
    const FakeInstrument fake;
    fake->identity = identity.toStdString();
    fake->options = options.toStdString();
    type("GPIB0::1::INSTR");
    QCOMPARE(item(0)->text(0), name);
    QCOMPARE(childRows(), expected);
    // A refresh shows the same.
    click("pb_refresh");
    QCOMPARE(childRows(), expected);
    QCOMPARE(m_dialog->instruments().size(), 1);
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
    QCOMPARE(m_dialog->findChild<QLabel *>("l_status")->text(), "The scan found 1 new instrument.");
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
    QVERIFY(log.contains("4 No devices found. viFindRsrc() returned an error."));
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

void TestDlgInstrConfig::checks()
{
    fill({entry("TGX-870", "100001", generator), entry("TGX-810", "200002", otherGenerator)});
    const QRect row = tree()->visualItemRect(item(1));
    const int size = tree()->style()->pixelMetric(QStyle::PM_IndicatorWidth);
    QTest::mouseClick(tree()->viewport(), Qt::LeftButton, {},
                      {row.left() + size / 2 + 2, row.center().y()});
    QCOMPARE(item(1)->checkState(0), Qt::Unchecked);
    QCOMPARE(m_changes->size(), 1);
    QVERIFY(m_dialog->instruments().at(0).enabled);
    QVERIFY(!m_dialog->instruments().at(1).enabled);
    tree()->setFocus();
    qDebug() << "CUR" << tree()->currentIndex() << tree()->hasFocus();
    QTest::keyClick(tree(), Qt::Key_Space);
    qDebug() << "CUR" << item(1)->checkState(0) << m_changes->size();
    QCOMPARE(m_changes->size(), 2);
    QVERIFY(m_dialog->instruments().at(1).enabled);
}

void TestDlgInstrConfig::comments()
{
    fill({entry("TGX-870", "100001", generator)});
    item(0)->setExpanded(true);
    bool asked = false;
    const auto answer = [&](const QString &text, Qt::Key key) {
        asked = false;
        QTimer::singleShot(0, m_dialog.get(), [&asked, text, key] {
            auto *box = qobject_cast<QInputDialog *>(QApplication::activeModalWidget());
            QVERIFY(box && hasFocus(*box));
            asked = true;
            QCOMPARE(box->windowTitle(), "Enter Comment");
            QCOMPARE(box->labelText(), "Enter optional comment");
            auto *line = box->findChild<QLineEdit *>();
            line->selectAll();
            QTest::keyClicks(line, text);
            QTest::keyClick(line, key);
        });
    };
    const auto doubleClick = [&](QTreeWidgetItem *target, int column) {
        const QPoint place = tree()->visualRect(tree()->indexFromItem(target, column)).center();
        QTest::mouseClick(tree()->viewport(), Qt::LeftButton, {}, place);
        QTest::mouseDClick(tree()->viewport(), Qt::LeftButton, {}, place);
    };
    answer("left bench", Qt::Key_Return);
    doubleClick(item(0), 1);
    QVERIFY(asked);
    QCOMPARE(item(0)->text(2), "left bench");
    QCOMPARE(m_dialog->instruments().at(0).comment, "left bench");
    QCOMPARE(m_changes->size(), 1);
    QVERIFY(item(0)->isExpanded());
    // Given up.
    answer("other", Qt::Key_Escape);
    doubleClick(item(0), 2);
    QVERIFY(asked);
    QCOMPARE(m_dialog->instruments().at(0).comment, "left bench");
    QCOMPARE(m_changes->size(), 1);
    // By a key, from a row below; emptied.
    tree()->setFocus();
    QVERIFY(hasFocus(*m_dialog));
    answer(" ", Qt::Key_Return);
    tree()->setCurrentItem(item(0)->child(0));
    QTest::keyClick(tree(), Qt::Key_F2);
    QVERIFY(asked);
    QCOMPARE(m_dialog->instruments().at(0).comment, " ");
    // The rows below have no comment.
    doubleClick(item(0)->child(0), 1);
    QVERIFY(!QApplication::activeModalWidget());
}

void TestDlgInstrConfig::deletes()
{
    const FakeInstrument fake;
    fake.failCall("viOpen", -1);
    const QList<InstrConfigEntry> all{entry("TGX-870", "100001", generator),
                                      entry("TGX-810", "200002", otherGenerator),
                                      entry("TGX-840", "300003", silent)};
    fill(all);
    QVERIFY(!m_dialog->findChild<QPushButton *>("pb_delete")->isEnabled());
    // From a row below, by the key; the next one is current then, or the one before the last.
    tree()->setFocus();
    item(0)->setExpanded(true);
    tree()->setCurrentItem(item(0)->child(0));
    QTest::keyClick(tree(), Qt::Key_Delete);
    QCOMPARE(m_dialog->instruments(), all.mid(1));
    QCOMPARE(tree()->currentItem()->text(0), "TGX-810, 200002");
    QCOMPARE(m_changes->size(), 1);
    tree()->setCurrentItem(item(1));
    click("pb_delete");
    QCOMPARE(m_dialog->instruments(), all.mid(1, 1));
    QCOMPARE(tree()->currentItem()->text(0), "TGX-810, 200002");
    click("pb_delete");
    QVERIFY(m_dialog->instruments().isEmpty());
    QVERIFY(hintIsVisible());
    QCOMPARE(m_changes->size(), 3);
    m_dialog->instr_removedevice();
    QCOMPARE(m_changes->size(), 3);

    QVERIFY(!m_dialog->findChild<QPushButton *>("pb_clear")->isEnabled());
    fill(all);
    click("pb_clear");
    QVERIFY(m_dialog->instruments().isEmpty());
    QVERIFY(hintIsVisible());
    QCOMPARE(m_changes->size(), 1);
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

void TestDlgInstrConfig::settings()
{
    fill({entry("TGX-870", "100001", generator), entry("TGX-840", "300003", silent)});
    m_dialog->setDefaultFolder("TGX-840", "300003", "/var/user/waves/");
    m_dialog->move(120, 90);
    m_dialog->resize(610, 470);
    auto *line = m_dialog->findChild<QLineEdit *>("le_manual");
    line->setText("bench.example");
    {
        QSettings settings(iniFile(), QSettings::IniFormat);
        m_dialog->writeSettings(settings);
    }
    QSettings settings(iniFile(), QSettings::IniFormat);
    QCOMPARE(settings.value("InstrConfig/manualrsc").toString(), "bench.example");
    QCOMPARE(settings.value("InstrConfig/folder1").toString(), "/var/user/waves/");
    QCOMPARE(settings.value("InstrConfig/instr2", "none").toString(), "");
    QCOMPARE(settings.childKeys(), QStringList{});
    DlgInstrConfig other;
    QVERIFY(!other.isModal());
    QSettings none(m_folder.filePath("none.ini"), QSettings::IniFormat);
    other.readSettings(none);
    QCOMPARE(other.size(), QSize(520, 580));
    QCOMPARE(other.pos(), QPoint(200, 200));
    const QSignalSpy changes(&other, &DlgInstrConfig::instrumentsChanged);
    other.readSettings(settings);
    QCOMPARE(changes.size(), 1);
    QVERIFY(settings.group().isEmpty());
    QCOMPARE(other.instruments(), m_dialog->instruments());
    QCOMPARE(other.size(), QSize(610, 470));
    QCOMPARE(other.pos(), QPoint(120, 90));
    QCOMPARE(other.findChild<QLineEdit *>("le_manual")->text(), "bench.example");
}

void TestDlgInstrConfig::withoutVisa()
{
    const FakeInstrument fake;
    VisaDevice first(true); // as the main window's, before the list is read
    m_dialog = std::make_unique<DlgInstrConfig>(true);
    m_changes = std::make_unique<QSignalSpy>(m_dialog.get(), &DlgInstrConfig::instrumentsChanged);
    m_dialog->show();
    fill({entry("TGX-870", "100001", "TCPIP::127.0.0.2::INSTR"),
          entry("TGX-810", "200002", otherGenerator)});
    QCOMPARE(rows(),
             (QStringList{"offline|TGX-870, 100001|TCPIP|", "offline|TGX-810, 200002|GPIB0|"}));
    click("pb_scan_gpib");
    type("GPIB0::1::INSTR");
    QCOMPARE(m_dialog->instruments().size(), 2);
    QCOMPARE(fake.takeCalls(), QStringList{});
}

void TestDlgInstrConfig::keys()
{
    fill({entry("TGX-870", "100001", generator)});
    auto *line = m_dialog->findChild<QLineEdit *>("le_manual");
    line->setText(otherGenerator);
    // Keys of the tree are no keys of the input line, and the other way about.
    line->setFocus();
    QTest::keyClick(line, Qt::Key_Home);
    QTest::keyClick(line, Qt::Key_Delete);
    QCOMPARE(line->text(), otherGenerator.mid(1));
    line->setText(otherGenerator);
    tree()->setFocus();
    tree()->setCurrentItem(item(0));
    QTimer::singleShot(0, m_dialog.get(), [] {
        QWidget *box = QApplication::activeModalWidget();
        QVERIFY(box && hasFocus(*box));
        QTest::keyClick(box, Qt::Key_Escape);
    });
    QTest::keyClick(tree(), Qt::Key_Return);
    QCOMPARE(m_dialog->instruments().size(), 1);
    // A label or a button of its own for each letter.
    QVERIFY(hasFocus(*m_dialog));
    QTest::keyClick(m_dialog.get(), Qt::Key_H, Qt::AltModifier);
    QTRY_COMPARE(QApplication::focusWidget(), line);
    QTest::keyClick(line, Qt::Key_L, Qt::AltModifier);
    QTRY_VERIFY(m_dialog->instruments().isEmpty());
    QTest::keyClick(line, Qt::Key_A, Qt::AltModifier);
    QTRY_COMPARE(m_dialog->instruments().size(), 1);
    QTest::keyClick(line, Qt::Key_Escape);
    QTRY_VERIFY(!m_dialog->isVisible());
}

void TestDlgInstrConfig::showsEverything()
{
    InstrConfigEntry third = entry("TGX-840", "300003", "TCPIP::127.0.0.99::INSTR");
    third.comment = "lent out";
    fill(
        {entry("TGX-870", "100001", generator), entry("TGX-810", "200002", otherGenerator), third});
    tree()->expandAll();
    tree()->setCurrentItem(item(0));
    // In the size that a new user gets, each text has its room.
    m_dialog->resize(520, 580);
    QVERIFY(QTest::qWaitForWindowExposed(m_dialog.get()));
    const QFontMetrics metrics(tree()->font());
    for (int row = 0; row < 3; ++row) {
        for (const QString &texts : childRows(row)) {
            const QString value = texts.section('|', 1);
            QVERIFY2(metrics.horizontalAdvance(value) < tree()->columnWidth(1), qPrintable(value));
        }
    }
    QVERIFY(tree()->columnWidth(0) + tree()->columnWidth(1) < tree()->viewport()->width() - 60);
    const QString folder = qEnvironmentVariable("CORVANE_PICTURES");
    if (!folder.isEmpty()) {
        QVERIFY(m_dialog->grab().save(folder + "/instrument-configuration.png"));
    }
}

QTEST_MAIN(TestDlgInstrConfig)
#include "tst_dlginstrconfig.moc"
