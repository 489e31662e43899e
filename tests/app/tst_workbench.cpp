// SPDX-License-Identifier: Apache-2.0
// The main job in the window: a waveform goes to an instrument, plays there, and comes back. The
// instruments are simulated ones behind a gateway, over real sockets.
#include "app/QCustomTreeView.h"
#include "app/settingsstores.h"
#include "guitesting.h"
#include "simulator/SimulatorProcess.h"
#include "toolframe/QtProgressDialog.h"

#include <QAbstractButton>
#include <QAbstractItemView>
#include <QApplication>
#include <QCloseEvent>
#include <QComboBox>
#include <QDir>
#include <QElapsedTimer>
#include <QFileInfo>
#include <QLabel>
#include <QLineEdit>
#include <QMenu>
#include <QRandomGenerator>
#include <QStatusBar>
#include <QTest>
#include <QTimer>

#include <algorithm>
#include <csignal>

namespace {

const QString onUnix = "TGX-870, 100001, GPIB0";
const QString onDrives = "TGX-810, 200002, GPIB0";

QByteArray content(const QString &path)
{
    QFile file(path);
    return file.open(QIODevice::ReadOnly) ? file.readAll() : QByteArray("not readable");
}

/// A file of zeros that takes no room on the disk.
bool makeLarge(const QString &path, qint64 size)
{
    QFile file(path);
    return file.open(QIODevice::WriteOnly) && file.resize(size);
}

QByteArray noise(qsizetype size)
{
    QByteArray bytes(size, '\0');
    QRandomGenerator generator(1);
    for (char &byte : bytes) {
        byte = static_cast<char>(generator.generate());
    }
    return bytes;
}

/// Presses cancel in the progress dialog as soon as a transfer shows some progress.
template <typename Action>
void onProgress(const Action &action)
{
    auto *poll = new QTimer(qApp);
    QObject::connect(poll, &QTimer::timeout, qApp, [poll, action] {
        const QList<QWidget *> windows = QApplication::topLevelWidgets();
        for (QWidget *window : windows) {
            auto *progress = qobject_cast<QtProgressDialog *>(window);
            if (progress && progress->value() > 0) {
                poll->stop();
                poll->deleteLater();
                action(*progress);
                return;
            }
        }
    });
    poll->start(5);
}

/// Of the panes' widgets of one name the one that can be seen.
template <typename Widget>
Widget *visibleOne(const QWidget &window, const char *name)
{
    const auto found = window.findChildren<Widget *>(name);
    const auto seen = std::find_if(found.cbegin(), found.cend(),
                                   [](const QWidget *widget) { return widget->isVisible(); });
    return seen == found.cend() ? nullptr : *seen;
}

/// What the end of the desktop session sends; a click on the window's close button doesn't get
/// through to a window behind a modal one.
void askToClose(QWidget *window)
{
    QCloseEvent event;
    QApplication::sendEvent(window, &event);
}

} // namespace

class TestWorkbench : public QObject
{
    Q_OBJECT

private slots:
    void init();
    void cleanup();
    void choosesInstruments();
    void opensFoldersByKeys();
    void removedInstrumentFallsBack();
    void copiesBothWays();
    void copiesByKeysAndClipboard();
    void copiesFolders();
    void asksAfterAFailedFile();
    void copiesFromInstrumentToInstrument();
    void runsAWaveform();
    void showsAndSetsTheGenerator();
    void fileOperations();
    void cancelledCopyLeavesNoFile();
    void plugPulledAndPutBack();
    void answersDuringATransfer();
    void asksBeforeClosing();
    void keepsDefaultFolderAndWidths();

private:
    void startSimulator(quint16 port);
    void choose(int pane, const QString &text);
    /// Makes an entry of an instrument current.
    void selectRemote(int pane, const QString &path);
    void copyByDrag(int from, const QList<Answer> &answers = {});
    [[nodiscard]] QString unixFile(const QString &name) const
    {
        return m_simulator->root() + "/a/var/user/" + name;
    }
    [[nodiscard]] QString driveFile(const QString &name) const
    {
        return m_simulator->root() + "/b/D:/" + name;
    }

    std::unique_ptr<Desk> m_desk;
    std::unique_ptr<SimulatorProcess> m_simulator;
    quint16 m_port = 0;
};

void TestWorkbench::startSimulator(quint16 port)
{
    m_simulator = std::make_unique<SimulatorProcess>();
    const QString config = QString("[a]\nmodel=TGX-870\nserial=100001\nroot=%ROOT%/a\n"
                                   "gateway=%1\ngpib=28\n"
                                   "[b]\nmodel=TGX-810\nserial=200002\nroot=%ROOT%/b\n"
                                   "gateway=%1\ngpib=5\n")
                               .arg(port);
    QVERIFY2(m_simulator->startConfig(config, 2), qPrintable(m_simulator->errorOutput()));
    m_port = m_simulator->gatewayPort();
}

void TestWorkbench::init()
{
    startSimulator(0);
    qputenv("CORVANE_VISA_CONFIG", m_simulator->path("visa.ini").toLocal8Bit());
    QVERIFY(writeText(
        m_simulator->path("visa.ini"),
        QString("[GPIB0]\nhost=127.0.0.1\nport=%1\naddresses=5,28\n").arg(m_port).toLatin1()));
    m_desk = std::make_unique<Desk>();
    const auto store = openMainStore();
    store->beginGroup("InstrConfig");
    const QList<QStringList> entries{{"TGX-870", "100001", "GPIB0::28::INSTR"},
                                     {"TGX-810", "200002", "GPIB0::5::INSTR"}};
    for (int i = 0; i < entries.size(); ++i) {
        store->setValue(QString("en%1").arg(i), true);
        store->setValue(QString("model%1").arg(i), entries.at(i).at(0));
        store->setValue(QString("serial%1").arg(i), entries.at(i).at(1));
        store->setValue(QString("instr%1").arg(i), entries.at(i).at(2));
        store->setValue(QString("intf%1").arg(i), "GPIB0");
        store->setValue(QString("folder%1").arg(i), "Manually Added");
    }
    store->setValue("instr2", "");
    store->endGroup();
    store->sync();
    m_desk->open();
}

void TestWorkbench::cleanup()
{
    m_desk.reset();
    m_simulator.reset();
}

void TestWorkbench::choose(int pane, const QString &text)
{
    auto *choice = m_desk->find<QComboBox>(QString("cb_dev_%1").arg(pane));
    const int wanted = choice->findText(text);
    QVERIFY(wanted >= 0);
    // By the list: the arrows would choose all on the way.
    choice->showPopup();
    choice->view()->setCurrentIndex(choice->model()->index(wanted, 0));
    QTest::keyClick(choice->view(), Qt::Key_Return);
    QCOMPARE(choice->currentText(), text);
}

void TestWorkbench::selectRemote(int pane, const QString &path)
{
    m_desk->tree(pane)->updateAndExpandTree(path);
    QCOMPARE(m_desk->tree(pane)->currentPath(), path);
}

void TestWorkbench::copyByDrag(int from, const QList<Answer> &answers)
{
    QCustomTreeView *source = m_desk->tree(from);
    QCustomTreeView *target = m_desk->tree(3 - from);
    dragBetween(*m_desk->window(), *source, *target);
    QTRY_VERIFY(openMenu());
    const auto copy = [] {
        QTest::keyClick(openMenu(), Qt::Key_Down);
        QTest::keyClick(openMenu(), Qt::Key_Return);
    };
    QVERIFY(withModals(copy, answers));
}

void TestWorkbench::choosesInstruments()
{
    const auto *choice = m_desk->find<QComboBox>("cb_dev_2");
    QCOMPARE(choice->count(), 3);
    QCOMPARE(choice->itemText(0), "Local");
    QCOMPARE(choice->itemData(0).toString(), QString());
    QCOMPARE(choice->itemData(1).toString(), "GPIB0::28::INSTR");
    choose(2, onUnix);
    QVERIFY(m_desk->log().contains("Device is 'TGX-870' , Serial is '100001'"));
    QCOMPARE(m_desk->tree(2)->currentPath(), "/var/user/");
    QVERIFY(!m_desk->tree(2)->isLocal());
    QCOMPARE(m_desk->tree(2)->model()->headerData(2, Qt::Horizontal).toString(), "Type");
    choose(2, onDrives);
    QCOMPARE(m_desk->tree(2)->currentPath(), "D:/");
    choose(1, onUnix);
    QCOMPARE(m_desk->tree(1)->currentPath(), "/var/user/");
    // The same one only once.
    choose(2, "Local");
    QTRY_COMPARE(m_desk->tree(2)->currentPath(), m_desk->path("") + '/');
    auto *second = m_desk->find<QComboBox>("cb_dev_2");
    QTest::keyClick(second, Qt::Key_Down);
    QCOMPARE(second->currentIndex(), 0);
    QVERIFY(m_desk->tree(2)->isLocal());
    QVERIFY(m_desk->log().contains("Warning: The same device cannot be selected twice."));
    QCOMPARE(m_desk->tree(1)->currentPath(), "/var/user/");
}

void TestWorkbench::opensFoldersByKeys()
{
    QVERIFY(QDir().mkpath(unixFile("deep/deeper")));
    QVERIFY(writeText(unixFile("deep/deeper/last.wv"), "1"));
    choose(2, onUnix);
    QCustomTreeView *tree = m_desk->tree(2);
    for (const QString name : {"deep", "deeper", "last.wv"}) {
        QTest::keyClick(tree, Qt::Key_Down);
        QCOMPARE(tree->currentIndex().data().toString(), name);
        QVERIFY(tree->visualRect(tree->currentIndex()).height() > 0);
        QTest::keyClick(tree, Qt::Key_Right);
    }
    // The same by the mouse, on the marks of branches that were not read yet.
    QVERIFY(QDir().mkpath(driveFile("one/two/three")));
    choose(2, onDrives);
    for (const QString name : {"one", "two"}) {
        QTest::keyClick(tree, Qt::Key_Down);
        QCOMPARE(tree->currentIndex().data().toString(), name);
        const QRect row = tree->visualRect(tree->currentIndex());
        QTest::mouseClick(tree->viewport(), Qt::LeftButton, {},
                          QPoint(row.left() - 8, row.center().y()));
        QVERIFY(tree->isExpanded(tree->currentIndex()));
    }
    choose(2, onUnix);
    selectRemote(2, "/var/user/deep/deeper/last.wv");
    QVERIFY(!m_desk->log().contains("Not all paths could be reloaded."));
    // What was open stays open.
    QTest::mouseClick(m_desk->find<QAbstractButton>("tb_refresh_2"), Qt::LeftButton);
    QCOMPARE(tree->currentPath(), "/var/user/deep/deeper/last.wv");
    QVERIFY(tree->isExpanded(tree->currentIndex().parent().parent()));
}

void TestWorkbench::removedInstrumentFallsBack()
{
    choose(2, onUnix);
    auto *dialog = m_desk->find<QDialog>("DlgInstrConfig");
    QVERIFY(dialog);
    QTest::mouseClick(m_desk->find<QAbstractButton>("tb_instruments_2"), Qt::LeftButton);
    QTRY_VERIFY(dialog->isVisible());
    QVERIFY(QMetaObject::invokeMethod(dialog, "instr_clearlist"));
    QVERIFY(m_desk->tree(2)->isLocal());
    QCOMPARE(m_desk->find<QComboBox>("cb_dev_2")->count(), 1);
    QVERIFY(m_desk->log().contains("The previously selected instrument is not available anymore."));
    dialog->close();
}

void TestWorkbench::copiesBothWays()
{
    QVERIFY(writeText(m_desk->path("noise.wv"), noise(1'500'001)));
    choose(2, onUnix);
    m_desk->select(1, "noise.wv");
    copyByDrag(1);
    QCOMPARE(content(unixFile("noise.wv")), content(m_desk->path("noise.wv")));
    QVERIFY(m_desk->log().contains("Sending file noise.wv to instrument TGX-870, 100001"));

    selectRemote(2, "/var/user/noise.wv");
    m_desk->select(1, "sub");
    copyByDrag(2);
    QCOMPARE(content(m_desk->path("sub/noise.wv")), content(m_desk->path("noise.wv")));
    QTRY_COMPARE(m_desk->tree(1)->currentPath(), m_desk->path("sub/"));

    // A file that is there already goes only with the user's consent.
    QVERIFY(writeText(m_desk->path("sub/noise.wv"), "mine"));
    Seen seen;
    copyByDrag(2, {answer("No", seen)});
    QCOMPARE(content(m_desk->path("sub/noise.wv")), "mine");
    copyByDrag(2, {answer("Yes", seen)});
    QCOMPARE(content(m_desk->path("sub/noise.wv")).size(), 1'500'001);
    QCOMPARE(seen.title, "Overwrite File");
}

void TestWorkbench::copiesByKeysAndClipboard()
{
    choose(2, onDrives);
    m_desk->select(1, "tone.wv");
    m_desk->tree(1)->setFocus();
    pressKey(m_desk->tree(1), Qt::Key_F5);
    QCOMPARE(content(driveFile("tone.wv")), content(m_desk->path("tone.wv")));

    m_desk->select(1, "data.txt");
    pressKey(m_desk->tree(1), QKeySequence::Copy);
    pressKey(m_desk->tree(1), QKeySequence::Paste); // into itself: nothing
    QVERIFY(!QFileInfo::exists(driveFile("data.txt")));
    m_desk->tree(2)->setFocus();
    pressKey(m_desk->tree(2), QKeySequence::Paste);
    QCOMPARE(content(driveFile("data.txt")), content(m_desk->path("data.txt")));
}

void TestWorkbench::copiesFolders()
{
    QVERIFY(QDir().mkpath(m_desk->path("sub/deep/empty")));
    QVERIFY(writeText(m_desk->path("sub/one.wv"), noise(1000)));
    QVERIFY(writeText(m_desk->path("sub/deep/two.wv"), noise(2000)));
    choose(2, onDrives);
    m_desk->select(1, "sub");
    Seen seen;
    copyByDrag(1, {answer("No", seen)});
    QCOMPARE(seen.text, "2 files found.\nThe total file size is 0.00 MB.\n"
                        "Do you really want to proceed?");
    QVERIFY(!QFileInfo::exists(driveFile("one.wv")));
    copyByDrag(1, {answer("Yes", seen)});
    QCOMPARE(content(driveFile("one.wv")), noise(1000));
    QCOMPARE(content(driveFile("deep/two.wv")), noise(2000));
    QCOMPARE(m_desk->find<QStatusBar>("statusbar")->currentMessage(), "2 files copied.");
    QVERIFY(m_desk->log().contains(
        QString("Copying %1 to D:/deep/two.wv").arg(m_desk->path("sub/deep/two.wv"))));

    QVERIFY(QDir().mkpath(m_desk->path("back")));
    m_desk->select(1, "back");
    selectRemote(2, "D:/");
    copyByDrag(2, {answer("Yes", seen)});
    QCOMPARE(content(m_desk->path("back/one.wv")), noise(1000));
    QCOMPARE(content(m_desk->path("back/deep/two.wv")), noise(2000));
    QVERIFY(m_desk->log().contains("Building remote source files list..."));
}

void TestWorkbench::asksAfterAFailedFile()
{
    // An instrument takes no file without bytes.
    QVERIFY(writeText(m_desk->path("sub/a.wv"), ""));
    QVERIFY(writeText(m_desk->path("sub/b.wv"), "bytes"));
    choose(2, onUnix);
    m_desk->select(1, "sub");
    Seen seen;
    copyByDrag(1, {press("Yes"), answer("No", seen)});
    QCOMPARE(seen.text,
             "An error occured during copying. Do you want to proceed with the next file?");
    QVERIFY(!QFileInfo::exists(unixFile("b.wv")));
    QVERIFY(m_desk->log().contains("Sending file to instrument failed."));
    copyByDrag(1, {press("Yes"), press("Yes")});
    QCOMPARE(content(unixFile("b.wv")), "bytes");
}

void TestWorkbench::copiesFromInstrumentToInstrument()
{
    QVERIFY(writeText(unixFile("wave.wv"), noise(70'000)));
    choose(1, onUnix);
    choose(2, onDrives);
    selectRemote(1, "/var/user/wave.wv");
    copyByDrag(1);
    QCOMPARE(content(driveFile("wave.wv")), noise(70'000));
    QVERIFY(!QFileInfo::exists(QDir::temp().filePath("HvCorvane.tmp")));
    QCOMPARE(m_desk->tree(2)->currentPath(), "D:/");
}

void TestWorkbench::runsAWaveform()
{
    QVERIFY(QFile::copy(m_desk->path("tone.wv"), unixFile("TONE.WV")));
    QVERIFY(writeText(unixFile("notes.txt"), "text"));
    choose(2, onUnix);
    selectRemote(2, "/var/user/TONE.WV");
    rightClick(m_desk->tree(2), "notes.txt");
    QTRY_VERIFY(openMenu());
    QVERIFY(!visibleEntries(*openMenu()).contains("Run!"));
    openMenu()->close();
    rightClick(m_desk->tree(2), "TONE.WV");
    QTRY_VERIFY(openMenu());
    QCOMPARE(visibleEntries(*openMenu()), QStringList({"Set As Default Folder", "Run!",
                                                       "Create Folder", "Rename", "Delete", "-"}));
    QTest::keyClick(openMenu(), Qt::Key_R);
    const QStringList log = m_desk->log();
    const qsizetype selected = log.indexOf("VISA >> 'SOUR:BB:ARB:WAV:SEL '/var/user/TONE.WV''");
    const qsizetype ready = log.indexOf("VISA >> 'STAT:OPER:COND?'");
    const qsizetype started = log.indexOf("VISA >> 'SOUR:BB:ARB:STAT ON; *OPC?'");
    QVERIFY(selected >= 0 && selected < ready && ready < started);
    QVERIFY(!log.contains("Cannot select ARB waveform."));

    m_desk->select(1, "tone.wv");
    rightClick(m_desk->tree(1), "tone.wv");
    QTRY_VERIFY(openMenu());
    QVERIFY(!visibleEntries(*openMenu()).contains("Run!"));
    openMenu()->close();
}

/// The line below the pane tells what the generator does and sets its RF side; a waveform that it
/// can't play is asked about before it is sent.
void TestWorkbench::showsAndSetsTheGenerator()
{
    const auto *waveform = m_desk->find<QLabel>("l_genwaveform");
    QVERIFY(!waveform->isVisible());
    choose(2, onUnix);
    QLabel *shown = nullptr;
    QTRY_VERIFY((shown = visibleOne<QLabel>(*m_desk->window(), "l_genwaveform")) != nullptr);
    QTRY_COMPARE(shown->text(), "No waveform is loaded.");
    auto *output = visibleOne<QAbstractButton>(*m_desk->window(), "pb_genoutput");
    auto *frequency = visibleOne<QLineEdit>(*m_desk->window(), "ne_genfrequency");
    QCOMPARE(output->text(), "RF Off");
    frequency->setFocus();
    frequency->selectAll();
    QTest::keyClicks(frequency, "2.4G");
    QTest::keyClick(frequency, Qt::Key_Return);
    QVERIFY(m_desk->log().contains("VISA >> ':FREQ 2400000000; *OPC?'"));
    QCOMPARE(frequency->text(), "2.4 GHz");

    // The clock is below what the instrument plays, and then above.
    QFile tone(m_desk->path("tone.wv"));
    QVERIFY(tone.open(QIODevice::ReadOnly));
    QByteArray bytes = tone.readAll();
    const qsizetype clock = bytes.indexOf("{CLOCK:");
    QVERIFY(clock > 0);
    bytes.replace(clock, bytes.indexOf('}', clock) - clock, "{CLOCK: 200000000");
    QVERIFY(writeText(m_desk->path("fast.wv"), bytes));
    QTRY_VERIFY((m_desk->select(1, "fast.wv"), m_desk->tree(1)->currentPath().endsWith("fast.wv")));
    QApplication::setActiveWindow(m_desk->window()); // the list of instruments was it
    m_desk->tree(1)->setFocus();
    Seen question;
    const auto copy = [this] { pressKey(m_desk->tree(1), Qt::Key_F5); };
    QVERIFY(withModal(copy, answer("No", question)));
    QVERIFY2(question.text.contains("200 MHz"), qPrintable(question.text));
    QVERIFY(!QFile::exists(unixFile("fast.wv")));
    QVERIFY(withModal(copy, press("Yes")));
    QVERIFY(QFile::exists(unixFile("fast.wv")));

    // A tool sends its result there, and starts it, while there is a generator.
    DlgBase *tool = nullptr;
    const auto sender = [&] { return tool->findChild<QAbstractButton *>("pb_send"); };
    m_desk->select(1, "tone.wv");
    ModulesDb &modules = m_desk->window()->modules();
    for (const ToolInfo *one : modules.allAllowed(m_desk->path("tone.wv"), true)) {
        tool = one->name == "Resample" ? &modules.dialog(*one) : tool;
    }
    QVERIFY(tool && sender()->isEnabled() && sender()->toolTip().contains("TGX-870, 100001"));
    choose(2, "Local");
    QVERIFY(!sender()->isEnabled() && sender()->toolTip().startsWith("No pane"));
    choose(2, onUnix);
    QVERIFY(sender()->isEnabled());
    m_desk->tree(1)->setFocus();
    QVERIFY(withModal(
        [this] { emit m_desk->window()->modules().sendRequested(m_desk->path("tone.wv")); },
        answer("Yes", question)));
    QVERIFY(question.text.contains("'tone.wv' is on TGX-870"));
    QVERIFY(m_desk->find<QStatusBar>("statusbar")->currentMessage().endsWith("output is off."));
    QTRY_VERIFY(shown->text().startsWith("tone.wv plays at "));
    QTest::mouseClick(output, Qt::LeftButton);
    QTRY_COMPARE(output->text(), "RF On");
    QTest::mouseClick(visibleOne<QAbstractButton>(*m_desk->window(), "pb_genstop"), Qt::LeftButton);
    QTRY_COMPARE(shown->text(), "tone.wv is loaded");
    QCOMPARE(output->text(), "RF On");
}

void TestWorkbench::fileOperations()
{
    choose(2, onUnix);
    QCustomTreeView *tree = m_desk->tree(2);
    tree->setFocus();
    Seen seen;
    QVERIFY(withModal([&] { pressKey(tree, Qt::Key_F7); }, typeName("waves", seen)));
    QCOMPARE(seen.text, "\nCreate new folder in\n'/var/user/'");
    QVERIFY(QFileInfo(unixFile("waves")).isDir());
    QCOMPARE(tree->currentPath(), "/var/user/waves/");
    QVERIFY(withModals([&] { pressKey(tree, Qt::Key_F2); }, {typeName("tones", seen)}));
    QCOMPARE(tree->currentPath(), "/var/user/tones/");
    QVERIFY(QFileInfo(unixFile("tones")).isDir());

    QVERIFY(QDir().mkpath(unixFile("tones/deep")));
    QVERIFY(writeText(unixFile("tones/deep/a.wv"), "1"));
    QVERIFY(writeText(unixFile("tones/b.wv"), "2"));
    selectRemote(2, "/var/user/tones/b.wv");
    QVERIFY(withModals([&] { pressKey(tree, Qt::Key_F2); },
                       {typeName("50%.wv", seen), answer("OK", seen), press("Cancel")}));
    QCOMPARE(seen.text, "The new entry name contains invalid characters.");
    QVERIFY(withModals([&] { pressKey(tree, Qt::Key_F2); }, {typeName("c.wv", seen)}));
    QVERIFY(QFileInfo::exists(unixFile("tones/c.wv")));
    QVERIFY(withModal([&] { pressKey(tree, Qt::Key_Delete); }, answer("Yes", seen)));
    QCOMPARE(seen.text, "Do you really want to delete the file\n/var/user/tones/c.wv ?");
    QVERIFY(!QFileInfo::exists(unixFile("tones/c.wv")));

    selectRemote(2, "/var/user/tones/");
    QVERIFY(withModal([&] { pressKey(tree, Qt::Key_Delete); }, answer("Yes", seen)));
    QCOMPARE(seen.text, "Do you want to delete the folder '/var/user/tones'\nand all its content?");
    QVERIFY(!QFileInfo::exists(unixFile("tones")));
    QCOMPARE(tree->currentPath(), "/var/user/");
    QVERIFY(withModal([&] { pressKey(tree, Qt::Key_Delete); }, answer("OK", seen)));
    QCOMPARE(seen.text, "Cannot delete root node.");
    QVERIFY(QFileInfo(unixFile("")).isDir());
}

void TestWorkbench::cancelledCopyLeavesNoFile()
{
    for (const int from : {1, 2}) {
        cleanup();
        init();
        const QString source = from == 1 ? m_desk->path("big.wv") : unixFile("big.wv");
        QVERIFY(makeLarge(source, 400'000'000));
        choose(2, onUnix);
        m_desk->select(1, from == 1 ? "big.wv" : "sub");
        selectRemote(2, from == 1 ? "/var/user/" : "/var/user/big.wv");
        onProgress([](QtProgressDialog &progress) { progress.reject(); });
        copyByDrag(from);
        QVERIFY(m_desk->log().contains("*** Transfer aborted by user."));
        const QString target = from == 1 ? unixFile("") : m_desk->path("sub");
        QCOMPARE(QDir(target).entryList(QDir::Files), QStringList());
        QVERIFY(!m_desk->log().contains("Sending file to instrument failed."));
        // The session goes on.
        m_desk->select(1, "tone.wv");
        selectRemote(2, "/var/user/");
        copyByDrag(1);
        QCOMPARE(content(unixFile("tone.wv")), content(m_desk->path("tone.wv")));
    }
}

void TestWorkbench::plugPulledAndPutBack()
{
    QVERIFY(makeLarge(m_desk->path("big.wv"), 400'000'000));
    choose(2, onUnix);
    m_desk->select(1, "big.wv");
    onProgress([this](QtProgressDialog &) { m_simulator->stop(SIGKILL); });
    copyByDrag(1);
    QVERIFY(m_desk->log().contains("Sending file to instrument failed."));
    const QString message = m_desk->find<QStatusBar>("statusbar")->currentMessage();
    QVERIFY2(message.startsWith("Nothing was copied: ") && message.contains("onnection"),
             qPrintable(message));
    QVERIFY(!visibleOne<QLabel>(*m_desk->window(), "l_genwaveform")); // its state is unknown
    QVERIFY(m_desk->window()->isEnabled());
    m_desk->select(1, "tone.wv"); // the other pane goes on
    QTest::mouseClick(m_desk->find<QAbstractButton>("tb_refresh_2"), Qt::LeftButton);
    QVERIFY(m_desk->log().contains("viOpen(): Cannot open instrument connection."));

    startSimulator(m_port);
    QVERIFY(writeText(unixFile("again.wv"), "x"));
    QTest::mouseClick(m_desk->find<QAbstractButton>("tb_refresh_2"), Qt::LeftButton);
    QCOMPARE(m_desk->tree(2)->currentPath(), "/var/user/");
    copyByDrag(1);
    QCOMPARE(content(unixFile("tone.wv")), content(m_desk->path("tone.wv")));
    selectRemote(2, "/var/user/again.wv");
}

void TestWorkbench::answersDuringATransfer()
{
    QVERIFY(makeLarge(m_desk->path("big.wv"), 30'000'000));
    choose(2, onUnix);
    m_desk->select(1, "big.wv");
    QTimer tick;
    QElapsedTimer sinceTick;
    qint64 longest = 0;
    int ticks = 0;
    QString shownTimes;
    connect(&tick, &QTimer::timeout, [&] {
        longest = std::max(longest, sinceTick.restart());
        ++ticks;
        const QList<QWidget *> windows = QApplication::topLevelWidgets();
        for (const QWidget *window : windows) {
            if (window->isVisible() && qobject_cast<const QtProgressDialog *>(window)) {
                shownTimes = window->findChild<QLabel *>("l_times")->text();
            }
        }
    });
    // Another program may take the processor for a while; a window that waits by itself does so
    // every time.
    for (int attempt = 0; attempt < 3 && (ticks == 0 || longest >= 200); ++attempt) {
        longest = 0;
        QElapsedTimer whole;
        whole.start();
        sinceTick.start();
        tick.start(10);
        copyByDrag(1);
        tick.stop();
        QCOMPARE(QFileInfo(unixFile("big.wv")).size(), 30'000'000);
        QVERIFY(ticks >= whole.elapsed() / 200);
        qInfo("longest wait of the window: %lld ms", static_cast<long long>(longest));
        if (whole.elapsed() > 1500) {
            QVERIFY2(shownTimes.contains("of 28.6 MB at "), qPrintable(shownTimes));
        }
    }
    QVERIFY2(longest < 200, qPrintable(QString("%1 ms").arg(longest)));
}

void TestWorkbench::asksBeforeClosing()
{
    QVERIFY(makeLarge(m_desk->path("big.wv"), 400'000'000));
    choose(2, onUnix);
    m_desk->select(1, "big.wv");
    bool stayed = false;
    onProgress([&](QtProgressDialog &) {
        QTimer::singleShot(0, m_desk->window(), [&] {
            Seen seen;
            QVERIFY(withModal([&] { askToClose(m_desk->window()); }, answer("No", seen)));
            QVERIFY(seen.text.startsWith("An operation is still running."));
            stayed = m_desk->window()->isVisible();
            QVERIFY(withModal([&] { askToClose(m_desk->window()); }, press("Yes")));
        });
    });
    m_desk->tree(2)->offerCopy(
        *m_desk->tree(1), {m_desk->path("big.wv")},
        m_desk->tree(2)->visualRect(m_desk->tree(2)->currentIndex()).center());
    QTRY_VERIFY(openMenu());
    QTest::keyClick(openMenu(), Qt::Key_Down);
    QTest::keyClick(openMenu(), Qt::Key_Return);
    QTRY_VERIFY(!m_desk->window());
    QVERIFY(stayed);
    QTRY_COMPARE(QDir(unixFile("")).entryList(QDir::Files), QStringList());
}

void TestWorkbench::keepsDefaultFolderAndWidths()
{
    QVERIFY(QDir().mkpath(unixFile("mine")));
    choose(2, onUnix);
    selectRemote(2, "/var/user/mine/");
    rightClick(m_desk->tree(2), "mine");
    QTRY_VERIFY(openMenu());
    QTest::keyClick(openMenu(), Qt::Key_S);
    QTRY_VERIFY(m_desk->log().last().startsWith("Set default folder '/var/user/mine/'"));
    m_desk->close();
    const auto store = openMainStore();
    QCOMPARE(store->value("InstrConfig/folder0").toString(), "/var/user/mine/");
    QCOMPARE(store->value("tree2.remote.section0").toInt(), 220);
    // The pane shows its instrument again, and goes back to where the user was on each device.
    m_desk->open();
    QCOMPARE(m_desk->tree(2)->currentPath(), "/var/user/mine/");
    selectRemote(2, "/var/user/");
    choose(2, "Local");
    choose(2, onUnix);
    QCOMPARE(m_desk->tree(2)->currentPath(), "/var/user/");
}

QTEST_MAIN(TestWorkbench)
#include "tst_workbench.moc"
