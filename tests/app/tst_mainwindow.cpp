// SPDX-License-Identifier: Apache-2.0
#include "app/GuideWindow.h"
#include "app/ModulesDb.h"
#include "app/QCustomTreeView.h"
#include "guitesting.h"
#include "log/Tracer.h"
#include "support/accessible.h"
#include "support/logreader.h"
#include "support/rows.h"
#include "toolframe/DlgBase.h"

#include <QClipboard>
#include <QComboBox>
#include <QFile>
#include <QLabel>
#include <QLineEdit>
#include <QListWidget>
#include <QMenu>
#include <QMenuBar>
#include <QRegularExpression>
#include <QScrollBar>
#include <QTest>
#include <QTextBlock>
#include <QTextBrowser>
#include <QToolButton>

#include <algorithm>
#include <cmath>

namespace {

QString plain(QString text)
{
    return text.remove('&');
}

QAction *findEntry(const MainWindow &window, const QString &menu, const QString &entry)
{
    const QList<QAction *> menus = window.menuBar()->actions();
    for (const QAction *title : menus) {
        const QList<QAction *> entries = title->menu()->actions();
        for (QAction *action : entries) {
            if (plain(title->text()) == menu && plain(action->text()) == entry) {
                return action;
            }
        }
    }
    return nullptr;
}

/// A tool for everything that begins under "File", as the registry must place it.
class AnyTool : public DlgBase
{
public:
    bool startModule(const QString &path) override
    {
        started.append(path);
        return accepts;
    }

    QStringList started;
    bool accepts = true;
};

} // namespace

class TestMainWindow : public QObject
{
    Q_OBJECT

private slots:
    void menusHaveNoEmptyEntryAndUniqueMnemonics();
    void everyWindowHasItsPage();
    void windowsCanBeUsedByKeysAndEars();
    void selectionEnablesTools();
    void registryPlacesAndStartsTools();
    void historyHoldsElevenEntries();
    void activePaneIsMarked();
    void masksHideOtherFiles();
    void logKeepsTheLast256Lines();
    void pathBoxAndRefresh();
    void logIsFilteredAndKept();
    void opensFilesOfTheCommandLine();
};

void TestMainWindow::menusHaveNoEmptyEntryAndUniqueMnemonics()
{
    Desk desk;
    desk.open();
    QStringList titles;
    const QList<QAction *> menus = desk.window()->menuBar()->actions();
    for (const QAction *title : menus) {
        titles.append(plain(title->text()));
        QVERIFY(!title->menu()->isEmpty());
        QSet<QChar> keys;
        const QList<QAction *> entries = title->menu()->actions();
        for (const QAction *entry : entries) {
            if (entry->isSeparator()) {
                continue;
            }
            const QChar key = entry->text().section('&', 1).front().toLower();
            QVERIFY2(!keys.contains(key), qPrintable(entry->text()));
            keys.insert(key);
        }
    }
    QCOMPARE(titles,
             QStringList({"File", "Analyze", "Import", "Edit", "Instrument", "Program", "Help"}));
    QVERIFY(findEntry(*desk.window(), "File", "Exit"));
    QVERIFY(findEntry(*desk.window(), "Analyze", "File Info"));
    QVERIFY(findEntry(*desk.window(), "Help", "About"));
    QAction *colors = findEntry(*desk.window(), "Program", "Colors...");
    QVERIFY(colors);
    colors->trigger();
    const auto *dialog = desk.window()->findChild<QDialog *>("DlgColors");
    QVERIFY(dialog && dialog->isVisible());
    desk.window()->hide();
    QVERIFY(!dialog->isVisible());
    desk.window()->show();
    QVERIFY(dialog->isVisible());
}

void TestMainWindow::everyWindowHasItsPage()
{
    Desk desk;
    desk.open();
    const QStringList headings = GuideWindow::headings();
    ModulesDb &modules = desk.window()->modules();
    const QList<const ToolInfo *> tools = modules.allAllowed(desk.path("tone.wv"), true);
    QVERIFY(tools.size() > 9);
    for (const auto &[action, tool] : modules.contextActions(desk.window())) {
        QVERIFY2(headings.contains(tool->guidePage), qPrintable(tool->name));
        QVERIFY2(!action->icon().isNull(), qPrintable(tool->name));
    }
    for (const char *window : {"DlgInstrConfig", "DlgColors"}) {
        QVERIFY(headings.contains(guidePageOf(desk.window()->findChild<QDialog *>(window))));
    }
    const ToolInfo &level = **std::find_if(
        tools.begin(), tools.end(), [](const ToolInfo *tool) { return tool->name == "Level"; });
    QVERIFY(modules.start(level, desk.path("tone.wv")));
    modules.dialog(level).activateWindow();
    QVERIFY(QTest::qWaitForWindowActive(&modules.dialog(level)));
    QTest::keyClick(&modules.dialog(level), Qt::Key_F1);
    auto *guide = desk.window()->findChild<QTextBrowser *>("tb_guide");
    QVERIFY(guide);
    QCOMPARE(guide->textCursor().block().text(), "Level");
    QVERIFY(std::abs(guide->cursorRect().top()) < 40);

    // Every link and every picture of the guide is there.
    QStringList pages{"/docs/guide/index.md", "/docs/user-guide.md"};
    const QRegularExpression link("\\]\\(([^)]*)\\)");
    for (int i = 0; i < pages.size(); ++i) {
        QFile file(':' + pages.at(i));
        QVERIFY2(file.open(QIODevice::ReadOnly), qPrintable(pages.at(i)));
        auto found = link.globalMatch(QString::fromUtf8(file.readAll()));
        while (found.hasNext()) {
            const QUrl url = QUrl("qrc:" + pages.at(i)).resolved(QUrl(found.next().captured(1)));
            const QString path = url.path();
            QVERIFY2(QFile::exists(':' + path), qPrintable(pages.at(i) + ": " + path));
            QVERIFY2(!url.hasFragment() || headings.contains(url.fragment()),
                     qPrintable(url.fragment()));
            if (path.endsWith(".md") && !pages.contains(path)) {
                pages.append(path);
            }
        }
    }
    QVERIFY(pages.size() >= 9);
}

void TestMainWindow::windowsCanBeUsedByKeysAndEars()
{
    Desk desk;
    desk.open();
    (void)takeLog();
    ModulesDb &modules = desk.window()->modules();
    QList<QWidget *> windows{desk.window(), desk.window()->findChild<QDialog *>("DlgInstrConfig"),
                             desk.window()->findChild<QDialog *>("DlgColors")};
    for (const auto &[action, tool] : modules.contextActions(desk.window())) {
        windows.append(&modules.dialog(*tool));
    }
    QStringList found;
    for (QWidget *window : std::as_const(windows)) {
        for (const QString &barrier : barriers(*window)) {
            found += window->windowTitle() + ": " + barrier;
        }
        // A screen of 1920 x 1080 at 150 %, and one of 1366 x 768, with room for a bar.
        window->ensurePolished();
        const QSize least = window->minimumSizeHint().expandedTo(window->minimumSize());
        if (least.width() > 1280 || least.height() > 680) {
            found += QString("%1 needs %2 x %3")
                         .arg(window->windowTitle())
                         .arg(least.width())
                         .arg(least.height());
        }
    }
    for (const QString &one : std::as_const(found)) {
        qWarning("%s", qPrintable(one)); // a message holds but a few
    }
    QVERIFY(found.isEmpty());
    QCOMPARE(takeLog(), QStringList()); // as of an icon that isn't there
}

void TestMainWindow::selectionEnablesTools()
{
    Desk desk;
    QVERIFY(writeTone(desk.path("other.Wv")));
    QVERIFY(QDir().mkpath(desk.path("folder.wv")));
    desk.open();
    forRows({{"mixed case", "other.Wv", true},
             {"no type", "readme", false},
             {"folder like a waveform", "folder.wv", false}},
            [&](const QString &entry, bool enabled) {
                desk.select(1, entry);
                QCOMPARE(findEntry(*desk.window(), "Analyze", "File Info")->isEnabled(), enabled);
            });
}

void TestMainWindow::registryPlacesAndStartsTools()
{
    ModulesDb modules;
    AnyTool *tool = nullptr;
    modules.addTool({"Any Tool", "/Edit/Any", ToolInfo::Selection::FileOrFolder, {}, [&tool] {
                         auto made = std::make_unique<AnyTool>();
                         tool = made.get();
                         return made;
                     }});
    QMenuBar bar;
    bar.addMenu("&File");
    modules.buildMenu(&bar);
    modules.buildMenu(&bar);
    QStringList titles;
    for (const QAction *title : bar.actions()) {
        titles.append(title->text());
    }
    QCOMPARE(titles.removeDuplicates(), 0); // built once, and "File" was found
    QAction *entry = nullptr;
    for (const QAction *title : bar.actions()) {
        for (QAction *action : title->menu()->actions()) {
            entry = action->text() == "Any" ? action : entry;
        }
    }
    QVERIFY(entry);
    QVERIFY(!entry->isEnabled());

    modules.setSelection("/data/some folder/", true);
    QVERIFY(entry->isEnabled());
    modules.setSelection("/data/x.dat", false);
    QVERIFY2(!entry->isEnabled(), "tools never work on an instrument");
    modules.setSelection("/data/x.dat", true);
    QVERIFY2(!tool, "a dialog is made at its first use");
    entry->trigger();
    QVERIFY(tool);
    QCOMPARE(tool->started, QStringList("/data/x.dat"));
    QVERIFY(tool->isVisible());

    modules.hideAll();
    QVERIFY(!tool->isVisible());
    modules.showAgain();
    QVERIFY(tool->isVisible());
    modules.closeAll();

    tool->accepts = false;
    (void)takeLog();
    entry->trigger();
    QVERIFY(!tool->isVisible());
    QCOMPARE(takeLog(), QStringList("4|Cannot initialize module."));
}

void TestMainWindow::historyHoldsElevenEntries()
{
    Desk desk;
    for (int i = 0; i < 15; ++i) {
        QVERIFY(writeText(desk.path(QString("file%1.dat").arg(i)), "x"));
    }
    desk.open();
    const auto *history = desk.find<QComboBox>("cb_entry1");
    for (int i = 0; i < 15; ++i) {
        desk.select(1, QString("file%1.dat").arg(i));
        QVERIFY(history->count() <= 11);
    }
    QCOMPARE(history->count(), 11);
    QCOMPARE(history->itemText(0), desk.path("file4.dat"));
    QCOMPARE(history->currentText(), desk.path("file14.dat"));
    // One that is known already is chosen, not entered again.
    desk.select(1, "file7.dat");
    QCOMPARE(history->count(), 11);
    QCOMPARE(history->currentText(), desk.path("file7.dat"));
    // And it leads back.
    auto *box = desk.find<QComboBox>("cb_entry1");
    box->setFocus();
    QTest::keyClick(box, Qt::Key_Up);
    QTRY_COMPARE(desk.tree(1)->currentPath(), desk.path("file6.dat"));
}

void TestMainWindow::activePaneIsMarked()
{
    Desk desk;
    desk.open();
    const auto isMarked = [&](int pane) {
        return !desk.find<QLabel>(QString("l_win%1").arg(pane))->pixmap().isNull();
    };
    QVERIFY(isMarked(1));
    QVERIFY(!isMarked(2));
    desk.tree(2)->setFocus();
    desk.select(2, "tone.wv");
    QVERIFY(!isMarked(1));
    QVERIFY(isMarked(2));
    // The tools follow the pane that is used, also when its selection stays as it was.
    desk.tree(1)->setFocus();
    QVERIFY(isMarked(1));
    QVERIFY(!findEntry(*desk.window(), "Analyze", "File Info")->isEnabled());
    desk.tree(2)->setFocus();
    QVERIFY(findEntry(*desk.window(), "Analyze", "File Info")->isEnabled());
}

void TestMainWindow::masksHideOtherFiles()
{
    Desk desk;
    QVERIFY(writeTone(desk.path("UPPER.WV")));
    desk.open();
    const auto names = [&](int pane) {
        const QAbstractItemModel &model = *desk.tree(pane)->model();
        const QModelIndex home = desk.tree(pane)->currentIndex();
        QStringList list;
        for (int row = 0; row < model.rowCount(home); ++row) {
            list.append(model.index(row, 0, home).data().toString());
        }
        list.sort();
        return list;
    };
    const QStringList all{"UPPER.WV", "data.txt", "readme", "sub", "tone.wv"};
    QTRY_COMPARE(names(1), all);
    auto *mask = desk.find<QComboBox>("cb_flt_1");
    mask->setFocus();
    QTest::keyClick(mask, Qt::Key_Down);
    QCOMPARE(mask->currentText(), "*.wv");
    QTRY_COMPARE(names(1), QStringList({"UPPER.WV", "sub", "tone.wv"}));
    QTRY_COMPARE(names(2), all);
    QTest::keyClick(mask, Qt::Key_Up);
    QTRY_COMPARE(names(1), all);
    desk.tree(1)->filterChanged("*.txt;*.wv");
    QTRY_COMPARE(names(1), QStringList({"UPPER.WV", "data.txt", "sub", "tone.wv"}));
}

void TestMainWindow::logKeepsTheLast256Lines()
{
    Desk desk;
    desk.open();
    for (int i = 0; i < 1000; ++i) {
        Tracer::Trace(Tracer::Information, QString("line %1").arg(i));
    }
    const QStringList lines = desk.log();
    QCOMPARE(lines.size(), 256);
    QCOMPARE(lines.first(), "line 744");
    QCOMPARE(lines.last(), "line 999");
    const QScrollBar *bar = desk.find<QListWidget>("lw_log")->verticalScrollBar();
    QTRY_COMPARE(bar->value(), bar->maximum());

    Tracer::Trace(Tracer::Debug, QString("bus traffic"));
    QCOMPARE(desk.log().last(), "line 999");
}

void TestMainWindow::pathBoxAndRefresh()
{
    Desk desk;
    desk.open();
    desk.select(2, "sub");
    desk.tree(2)->slot_default();
    QCOMPARE(desk.log().last(), QString("Set local default folder '%1/'").arg(desk.path("sub")));
    // What is current stays so when the tree is read anew; the default folder has a button.
    desk.select(1, "tone.wv");
    QTest::mouseClick(desk.find<QToolButton>("tb_refresh_1"), Qt::LeftButton);
    desk.tree(1)->setFocus();
    QTest::keyClick(desk.tree(1), Qt::Key_R, Qt::ControlModifier);
    QCOMPARE(desk.tree(1)->currentPath(), desk.path("tone.wv"));
    QTest::mouseClick(desk.find<QToolButton>("tb_home_1"), Qt::LeftButton);
    QTRY_COMPARE(desk.tree(1)->currentPath(), desk.path("sub") + '/');
    QTest::mouseClick(desk.find<QToolButton>("tb_up_1"), Qt::LeftButton);
    QTRY_COMPARE(desk.tree(1)->currentPath(), desk.path("") + '/');
    auto *box = desk.find<QComboBox>("cb_entry1");
    const auto type = [box](const QString &path) {
        box->setFocus();
        box->lineEdit()->selectAll();
        QTest::keyClicks(box->lineEdit(), path);
        QTest::keyClick(box->lineEdit(), Qt::Key_Return);
    };
    type(desk.path("data.txt"));
    QTRY_COMPARE(desk.tree(1)->currentPath(), desk.path("data.txt"));
    type("/no/such/place");
    QCOMPARE(box->currentText(), desk.path("data.txt"));
}

void TestMainWindow::logIsFilteredAndKept()
{
    Desk desk;
    desk.open();
    Tracer::Trace(Tracer::Error, "something broke");
    Tracer::Trace(Tracer::Information, "some news");
    auto *level = desk.find<QComboBox>("cb_logLevel");
    const auto *list = desk.find<QListWidget>("lw_log");
    QTRY_VERIFY(desk.log().contains("some news"));
    const auto shown = [list] {
        QStringList texts;
        for (int row = 0; row < list->count(); ++row) {
            if (!list->item(row)->isHidden()) {
                texts.append(list->item(row)->text());
            }
        }
        return texts;
    };
    level->setCurrentIndex(2);
    QVERIFY(shown().size() == 1 && shown().first().endsWith("something broke"));
    level->setCurrentIndex(0);
    QTest::keyClicks(desk.find<QLineEdit>("le_logFilter"), "NEWS");
    QVERIFY(shown().size() == 1 && shown().first().endsWith("some news"));
    desk.find<QListWidget>("lw_log")->setFocus();
    QTest::keyClick(desk.find<QListWidget>("lw_log"), Qt::Key_C, Qt::ControlModifier);
    QCOMPARE(QApplication::clipboard()->text(), shown().first() + '\n');
    for (int k = 0; k < 300; ++k) {
        Tracer::Trace(Tracer::Information, "chatter");
    }
    QTRY_VERIFY(!desk.log().contains("something broke"));
    QVERIFY(desk.find<QLabel>("l_lastError")->text().endsWith("something broke"));
}

void TestMainWindow::opensFilesOfTheCommandLine()
{
    Desk desk;
    desk.open();
    desk.window()->openFiles({desk.path("tone.wv"), desk.path("none.wv")});
    QTRY_COMPARE(QApplication::activeWindow()->windowTitle(), "View Waveform - tone.wv");
    QCOMPARE(desk.tree(1)->currentPath(), desk.path("tone.wv"));
    QVERIFY(desk.log().contains(QString("There is no file '%1'.").arg(desk.path("none.wv"))));
}

QTEST_MAIN(TestMainWindow)
#include "tst_mainwindow.moc"
