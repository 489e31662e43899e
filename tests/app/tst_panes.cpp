// SPDX-License-Identifier: Apache-2.0
#include "app/DlgInfo.h"
#include "app/QCustomTreeView.h"
#include "guitesting.h"
#include "support/rows.h"
#include "tools/DlgView.h"

#include <QApplication>
#include <QDir>
#include <QFileInfo>
#include <QHeaderView>
#include <QMenu>
#include <QMouseEvent>
#include <QSignalSpy>
#include <QStandardItemModel>
#include <QStandardPaths>
#include <QTest>

#include <utility>

class TestPanes : public QObject
{
    Q_OBJECT

private slots:
    void createsAFolder();
    void refusesNames();
    void renames();
    void deletesAFile();
    void noKeepsTheFile();
    void deletesAnEmptyFolderUnasked();
    void deletesAFolderWithContents();
    void rootIsSafe();
    void tellsAFailedDelete();
    void keysMoveAndStart();
    void contextMenuFitsTheEntry();
    void doubleClickStartsTheFirstTool();
    void localCopyIsRefused();
    void tellsWhyAFileDoesNotOpen();
    void namesGetTheRoom();
    void largeFolderStaysInOrder();
    void dragsFromAnyModel();
};

namespace {

/// Counts the drags that the mouse starts.
class DraggedTree : public QCustomTreeView
{
public:
    using QCustomTreeView::mouseMoveEvent;
    using QCustomTreeView::mousePressEvent;
    int drags = 0;

protected:
    void startDrag(Qt::DropActions /*supportedActions*/) override { ++drags; }
};

} // namespace

void TestPanes::createsAFolder()
{
    Desk desk;
    desk.open();
    desk.select(1, "tone.wv"); // the new folder goes beside a file
    Seen seen;
    QVERIFY(withModal([&] { pressKey(desk.tree(1), Qt::Key_F7); }, typeName("captures", seen)));
    QCOMPARE(seen.title, "Create folder");
    QCOMPARE(seen.text, QString("\nCreate new folder in\n'%1/'").arg(desk.path("")));
    QVERIFY(QFileInfo(desk.path("captures")).isDir());
    QVERIFY(desk.log().contains("Creating folder 'captures'..."));
    QTRY_COMPARE(desk.tree(1)->currentPath(), desk.path("captures") + '/');
}

void TestPanes::refusesNames()
{
    struct Row
    {
        const char *name;
        bool rename;
        QString words;
    };
    const QString taken = "An entry with this name already exists.";
    Desk desk;
    desk.open();
    desk.select(1, "tone.wv");
    const QStringList before = QDir(desk.path("")).entryList();
    forRows<Row>({{"  ", false, "The new folder name cannot be empty."},
                  {"data.txt", false, taken},
                  {".", false, taken},
                  {"sub", true, taken},
                  {"a%b", false, "The new folder name contains invalid characters."},
                  {"a#b", true, "The new entry name contains invalid characters."}},
                 [&](const Row &row) {
                     Seen asked;
                     Seen refused;
                     QString again;
                     const auto giveUp = [&again](QWidget &box) {
                         again = box.findChild<QLineEdit *>()->text();
                         press("Cancel")(box);
                     };
                     QVERIFY(withModals(
                         [&] { pressKey(desk.tree(1), row.rename ? Qt::Key_F2 : Qt::Key_F7); },
                         {typeName(row.name, asked), answer("OK", refused), giveUp}));
                     QCOMPARE(again, row.name); // to be corrected
                     QCOMPARE(asked.title, row.rename ? "Rename entry" : "Create folder");
                     QCOMPARE(refused.title, "HV Corvane");
                     QCOMPARE(refused.text, row.words);
                     QCOMPARE(QDir(desk.path("")).entryList(), before);
                 });
}

void TestPanes::renames()
{
    Desk desk;
    desk.open();
    Seen seen;
    desk.select(1, "tone.wv");
    QVERIFY(withModal([&] { pressKey(desk.tree(1), Qt::Key_F2); }, typeName("other.wv", seen)));
    QCOMPARE(seen.title, "Rename entry");
    QCOMPARE(seen.text, "Enter new name for\n'tone.wv'");
    QVERIFY(!QFileInfo::exists(desk.path("tone.wv")));
    QVERIFY(QFileInfo(desk.path("other.wv")).isFile());
    QVERIFY(desk.log().contains("Renaming file 'tone.wv'..."));
    QTRY_COMPARE(desk.tree(1)->currentPath(), desk.path("other.wv"));

    desk.select(1, "sub");
    QVERIFY(withModal([&] { pressKey(desk.tree(1), Qt::Key_F2); }, typeName("moved", seen)));
    QVERIFY(QFileInfo(desk.path("moved")).isDir());
    QVERIFY(desk.log().contains("Renaming folder 'sub'..."));
    QTRY_COMPARE(desk.tree(1)->currentPath(), desk.path("moved") + '/');
}

void TestPanes::deletesAFile()
{
    Desk desk;
    desk.open();
    desk.select(1, "tone.wv");
    Seen seen;
    QVERIFY(withModal([&] { pressKey(desk.tree(1), Qt::Key_Delete); }, answer("Yes", seen)));
    QCOMPARE(seen.title, "Delete File");
    QCOMPARE(seen.text,
             QString("Do you really want to delete the file\n%1 ?").arg(desk.path("tone.wv")));
    QVERIFY(!QFileInfo::exists(desk.path("tone.wv")));
    QVERIFY(desk.log().contains("Deleting file 'tone.wv'..."));
    // It waits in the trash, and the next Delete isn't one of the folder.
    const QString trash =
        QStandardPaths::writableLocation(QStandardPaths::GenericDataLocation) + "/Trash/files/";
    QVERIFY(QFileInfo::exists(trash + "tone.wv"));
    QTRY_COMPARE(desk.tree(1)->currentPath(), desk.path("readme"));
    QVERIFY(
        withModal([&] { pressKey(desk.tree(1), QKeySequence("Shift+Del")); }, answer("Yes", seen)));
    QVERIFY(!QFileInfo::exists(desk.path("readme")));
    QVERIFY(!QFileInfo::exists(trash + "readme"));
    // Several at once, with one question.
    QTRY_COMPARE(desk.tree(1)->currentPath(), desk.path("data.txt"));
    QTest::keyClick(desk.tree(1), Qt::Key_Up, Qt::ShiftModifier);
    QVERIFY(withModal([&] { pressKey(desk.tree(1), Qt::Key_Delete); }, answer("Yes", seen)));
    QVERIFY(seen.text.endsWith("\ndata.txt\nsub") || seen.text.endsWith("\nsub\ndata.txt"));
    QVERIFY(!QFileInfo::exists(desk.path("data.txt")) && !QFileInfo::exists(desk.path("sub")));
}

void TestPanes::noKeepsTheFile()
{
    Desk desk;
    desk.open();
    desk.select(1, "tone.wv");
    // No is preset: a careless Enter destroys nothing.
    QVERIFY(withModal([&] { pressKey(desk.tree(1), Qt::Key_Delete); },
                      [](QWidget &box) { QTest::keyClick(&box, Qt::Key_Return); }));
    QVERIFY(QFileInfo::exists(desk.path("tone.wv")));
    QCOMPARE(desk.tree(1)->currentPath(), desk.path("tone.wv"));
}

void TestPanes::deletesAnEmptyFolderUnasked()
{
    Desk desk;
    desk.open();
    desk.select(1, "sub");
    QVERIFY(withModals([&] { pressKey(desk.tree(1), Qt::Key_Delete); }, {}));
    QVERIFY(!QFileInfo::exists(desk.path("sub")));
    QVERIFY(desk.log().contains("Deleting folder 'sub'..."));
}

void TestPanes::deletesAFolderWithContents()
{
    Desk desk;
    QVERIFY(QDir().mkpath(desk.path("sub/deep/deeper")));
    QVERIFY(writeText(desk.path("sub/deep/.hidden"), "x"));
    desk.open();
    desk.select(1, "sub");
    Seen seen;
    QVERIFY(withModal([&] { pressKey(desk.tree(1), Qt::Key_Delete); }, answer("No", seen)));
    QVERIFY(QFileInfo::exists(desk.path("sub/deep/.hidden")));
    QVERIFY(withModal([&] { pressKey(desk.tree(1), Qt::Key_Delete); }, answer("Yes", seen)));
    QCOMPARE(seen.title, "Delete Folder");
    QCOMPARE(seen.text, QString("The selected folder %1 is not empty.\nDo you really want to "
                                "delete this folder and all its contents?")
                            .arg(desk.path("sub")));
    QVERIFY(!QFileInfo::exists(desk.path("sub")));
    QVERIFY(desk.log().contains("Deleting folder structure 'sub'..."));
}

void TestPanes::rootIsSafe()
{
    Desk desk;
    desk.open();
    desk.tree(1)->updateAndExpandTree("/");
    QTRY_COMPARE(desk.tree(1)->currentPath(), "/");
    Seen seen;
    QVERIFY(withModal([&] { pressKey(desk.tree(1), Qt::Key_F2); }, answer("OK", seen)));
    QCOMPARE(seen.text, "Cannot rename root node.");
    QVERIFY(withModal([&] { pressKey(desk.tree(1), Qt::Key_Delete); }, answer("OK", seen)));
    QCOMPARE(seen.text, "Cannot delete root node.");
}

void TestPanes::tellsAFailedDelete()
{
    Desk desk;
    desk.open();
    desk.select(1, "tone.wv");
    QSignalSpy status(desk.tree(1), &QCustomTreeView::errMsg);
    QVERIFY(withModal([&] { pressKey(desk.tree(1), Qt::Key_Delete); },
                      [&](QWidget &box) {
                          QFile::remove(desk.path("tone.wv")); // somebody is faster
                          press("Yes")(box);
                      }));
    QVERIFY(desk.log().contains("Deleting file failed."));
    QVERIFY(status.first().first().toString().contains(desk.path("tone.wv")));
}

void TestPanes::keysMoveAndStart()
{
    Desk desk;
    desk.open();
    desk.tree(1)->setFocus();
    pressKey(desk.tree(1), Qt::Key_Tab);
    QVERIFY(desk.tree(2)->hasFocus());
    pressKey(desk.tree(2), Qt::Key_Tab);
    QVERIFY(desk.tree(1)->hasFocus());

    desk.select(1, "tone.wv");
    QTest::keyClick(desk.tree(1), Qt::Key_Return, Qt::AltModifier);
    const auto isReportOpen = [] {
        const QWidgetList windows = QApplication::topLevelWidgets();
        return std::any_of(windows.begin(), windows.end(), [](const QWidget *window) {
            return qobject_cast<const DlgInfo *>(window) && window->isVisible();
        });
    };
    QVERIFY(isReportOpen());
    pressKey(desk.tree(1), Qt::Key_Backspace);
    QCOMPARE(desk.tree(1)->currentPath(), desk.path("") + '/');
    pressKey(desk.tree(1), Qt::Key_Return);
    QVERIFY(!desk.tree(1)->isExpanded(desk.tree(1)->currentIndex()));
    pressKey(desk.tree(1), Qt::Key_Return);
    QVERIFY(desk.tree(1)->isExpanded(desk.tree(1)->currentIndex()));

    // The controls above a tree are reached backwards.
    QTest::keyClick(desk.tree(1), Qt::Key_Tab, Qt::ShiftModifier);
    QCOMPARE(QApplication::focusWidget()->objectName(), "cb_entry1");

    const QPointer<MainWindow> window = desk.window();
    QTest::keyClick(desk.window(), Qt::Key_Q, Qt::ControlModifier);
    QTRY_VERIFY(!window);
    QVERIFY(!isReportOpen());
}

void TestPanes::contextMenuFitsTheEntry()
{
    Desk desk;
    desk.open();
    QCustomTreeView *tree = desk.tree(1);
    const QStringList fileEntries{"Set As Default Folder", "Create Folder", "Rename", "Delete"};

    desk.select(1, "tone.wv");
    rightClick(tree, "data.txt");
    QTRY_VERIFY(openMenu());
    QCOMPARE(tree->currentPath(), desk.path("data.txt"));
    QCOMPARE(visibleEntries(*openMenu()).mid(0, 4), fileEntries);
    QVERIFY(!visibleEntries(*openMenu()).contains("Waveform Info"));
    openMenu()->close();

    rightClick(tree, "tone.wv");
    QTRY_VERIFY(openMenu());
    QCOMPARE(tree->currentPath(), desk.path("tone.wv"));
    QCOMPARE(visibleEntries(*openMenu()).mid(0, 6),
             fileEntries + QStringList({"-", "Waveform Info"}));
    QTest::keyClick(openMenu(), Qt::Key_S); // the mnemonic of "Set As Default Folder"
    QTRY_COMPARE(desk.log().last(), QString("Set local default folder '%1/'").arg(desk.path("")));
}

void TestPanes::doubleClickStartsTheFirstTool()
{
    Desk desk;
    desk.open();
    desk.select(1, "data.txt");
    QCustomTreeView *tree = desk.tree(1);
    const auto doubleClick = [&] {
        const QPoint position = tree->visualRect(tree->currentIndex()).center();
        QTest::mouseClick(tree->viewport(), Qt::LeftButton, {}, position);
        QTest::mouseDClick(tree->viewport(), Qt::LeftButton, {}, position);
    };
    doubleClick();
    // Of the tools that take files of any type, one is made for text.
    QTRY_COMPARE(QApplication::activeWindow()->windowTitle(), "Create Waveform From Data");
    QApplication::activeWindow()->close();
    desk.select(1, "tone.wv");
    doubleClick();
    QTRY_VERIFY(qobject_cast<DlgView *>(QApplication::activeWindow()));
}

void TestPanes::localCopyIsRefused()
{
    Desk desk;
    desk.open();
    desk.select(1, "tone.wv");
    desk.select(2, "sub");
    QCustomTreeView *from = desk.tree(1);
    QCustomTreeView *to = desk.tree(2);
    dragBetween(*desk.window(), *from, *to);
    QTRY_VERIFY(openMenu());
    QCOMPARE(visibleEntries(*openMenu()), QStringList({"Copy to", "-", "Cancel\tEsc"}));
    Seen seen;
    const auto chooseFirst = [] {
        QTest::keyClick(openMenu(), Qt::Key_Down);
        QTest::keyClick(openMenu(), Qt::Key_Return);
    };
    QVERIFY(withModal(chooseFirst, answer("OK", seen)));
    QCOMPARE(seen.text, "Copy operations between local file systems are not supported.");
    QVERIFY(!QFileInfo::exists(desk.path("sub/tone.wv")));

    to->offerCopy(*from, {from->currentPath()}, QPoint(5, 10000)); // below the last entry
    QTRY_VERIFY(openMenu());
    QVERIFY(withModal(chooseFirst, answer("OK", seen)));
    QCOMPARE(seen.text, "The target location for the copy operation must be a folder.");
}

void TestPanes::tellsWhyAFileDoesNotOpen()
{
    Desk desk;
    QVERIFY(writeText(desk.path("notes.wv"), "no waveform"));
    desk.open();
    desk.select(1, "notes.wv");
    Seen seen;
    QVERIFY(withModal([&] { pressKey(desk.tree(1), Qt::Key_Return); }, answer("OK", seen)));
    QCOMPARE(seen.text,
             "'notes.wv' cannot be opened in View.\nThis is no waveform file: it is text.");
}

void TestPanes::namesGetTheRoom()
{
    Desk desk;
    desk.open();
    QCustomTreeView *tree = desk.tree(1);
    const auto room = [tree] {
        const QHeaderView &header = *tree->header();
        return tree->viewport()->width() - header.sectionSize(1) - header.sectionSize(2) -
               header.sectionSize(3);
    };
    desk.window()->resize(1500, 600);
    QTRY_VERIFY(tree->columnWidth(0) > 300 && tree->columnWidth(0) == room());
    // What the user chooses stays.
    tree->setColumnWidth(0, 250);
    const int before = tree->width();
    desk.window()->resize(1600, 600);
    QTRY_VERIFY(tree->width() > before);
    QCoreApplication::processEvents();
    QCOMPARE(tree->columnWidth(0), 250);
}

void TestPanes::largeFolderStaysInOrder()
{
    Desk desk;
    QVERIFY(QDir().mkpath(desk.path("many")));
    for (int i = 0; i < 1000; ++i) {
        QVERIFY(writeText(desk.path(QString("many/f%1.wv").arg(i, 5, 10, QChar('0'))), "x"));
    }
    desk.open();
    desk.select(1, "many/f00800.wv");
    QCustomTreeView *tree = desk.tree(1);
    QTRY_COMPARE(tree->model()->rowCount(tree->currentIndex().parent()), 1000);
    // Although the rows came in afterwards, the entry stands in sight, and in its order.
    QTRY_COMPARE(tree->currentIndex().row(), 800);
    QTRY_VERIFY(tree->viewport()->rect().contains(tree->visualRect(tree->currentIndex()).center()));
    pressKey(tree, Qt::Key_Down);
    QCOMPARE(tree->currentPath(), desk.path("many/f00801.wv"));
}

void TestPanes::dragsFromAnyModel()
{
    // As an instrument's: its entries aren't offered for dragging.
    QStandardItemModel model;
    auto *folder = new QStandardItem("folder");
    folder->setFlags(Qt::ItemIsEnabled | Qt::ItemIsSelectable);
    folder->appendRow(new QStandardItem("file"));
    model.appendRow(folder);
    DraggedTree tree;
    tree.setModel(&model);
    tree.resize(300, 200);
    tree.show();
    const QRect row = tree.visualRect(folder->index());
    const auto pressAndMove = [&](const QPoint &start, int distance, Qt::MouseButton button) {
        const auto global = [&](const QPoint &point) {
            return tree.viewport()->mapToGlobal(point);
        };
        QMouseEvent press(QEvent::MouseButtonPress, start, global(start), button, button, {});
        tree.mousePressEvent(&press);
        for (int step = 1; step <= 2; ++step) {
            const QPoint position = start + QPoint(0, distance * step);
            QMouseEvent move(QEvent::MouseMove, position, global(position), Qt::NoButton, button,
                             {});
            tree.mouseMoveEvent(&move);
        }
        return std::exchange(tree.drags, 0);
    };
    const int far = QApplication::startDragDistance();
    QCOMPARE(pressAndMove(row.center(), far, Qt::LeftButton), 1);
    QCOMPARE(pressAndMove(row.center(), far / 2 - 1, Qt::LeftButton), 0);
    QCOMPARE(pressAndMove(row.center(), far, Qt::RightButton), 0);
    QCOMPARE(pressAndMove({row.left() - 8, row.center().y()}, far, Qt::LeftButton), 0);
    QCOMPARE(pressAndMove({100, 150}, far, Qt::LeftButton), 0);
}

QTEST_MAIN(TestPanes)
#include "tst_panes.moc"
