// SPDX-License-Identifier: Apache-2.0
#include "app/QCustomTreeView.h"
#include "app/settingsstores.h"
#include "guitesting.h"
#include "log/Tracer.h"

#include <QApplication>
#include <QHeaderView>
#include <QMessageBox>
#include <QSettings>
#include <QSplitter>
#include <QTest>

namespace {

// The arguments of the application object, of which each test may set the second.
int argumentCount = 2;
char programName[] = "corvane";
char argumentText[32] = "";
char *arguments[] = {programName, argumentText, nullptr};

} // namespace

class TestSettings : public QObject
{
    Q_OBJECT

private slots:
    void survivesTwoStarts();
    void damagedSplitters_data();
    void damagedSplitters();
    void lostDefaultFolderFallsBackToHome();
    void windowComesBackOntoTheScreen();
    void tellsThatTheFileCannotBeWritten();
    void debugSwitch_data();
    void debugSwitch();
};

void TestSettings::survivesTwoStarts()
{
    Desk desk;
    desk.open();
    desk.window()->move(20, 30);
    desk.window()->resize(760, 560);
    desk.find<QSplitter>("sp_h")->setSizes({350, 130});
    desk.tree(2)->header()->resizeSection(0, 187);
    desk.select(1, "sub");
    desk.tree(1)->slot_default();
    QCoreApplication::processEvents();
    const QList<int> sizes = desk.find<QSplitter>("sp_h")->sizes();
    desk.close();

    const auto store = openMainStore();
    QCOMPARE(store->format(), QSettings::IniFormat);
    QVERIFY(store->fileName().endsWith("/Halvorn/Corvane.ini"));
    QVERIFY(openColorStore()->fileName().endsWith("/Halvorn/Corvane-colors.ini"));
    QCOMPARE(store->value("pos").toPoint(), QPoint(20, 30));
    QCOMPARE(store->value("size").toSize(), QSize(760, 560));
    QCOMPARE(store->value("h0").toInt(), sizes.at(0));
    QCOMPARE(store->value("h1").toInt(), sizes.at(1));
    QVERIFY(store->value("v0").toInt() > 0);
    QCOMPARE(store->value("locpath").toString(), desk.path("sub") + '/');
    QCOMPARE(store->value("tree1.local.section0").toInt(), 220);
    QCOMPARE(store->value("tree1.local.section2").toInt(), 60);
    QCOMPARE(store->value("tree2.local.section0").toInt(), 187);

    QVERIFY(writeText(desk.path("sub/file"), "x"));
    desk.open();
    QCOMPARE(desk.window()->pos(), QPoint(20, 30));
    QCOMPARE(desk.window()->size(), QSize(760, 560));
    QCOMPARE(desk.find<QSplitter>("sp_h")->sizes(), sizes);
    QCOMPARE(desk.tree(1)->header()->sectionSize(0), 220);
    QCOMPARE(desk.tree(2)->header()->sectionSize(0), 187);
    QCOMPARE(desk.tree(1)->currentPath(), desk.path("sub") + '/');
    QCOMPARE(desk.tree(2)->currentPath(), desk.path("sub") + '/');
}

void TestSettings::damagedSplitters_data()
{
    QTest::addColumn<QVariant>("first");
    QTest::addColumn<QVariant>("second");
    QTest::addColumn<bool>("applied");
    QTest::newRow("sound") << QVariant(300) << QVariant(100) << true;
    QTest::newRow("zero ends the list") << QVariant(0) << QVariant(100) << false;
    QTest::newRow("negative") << QVariant(300) << QVariant(-5) << false;
    QTest::newRow("one alone") << QVariant(300) << QVariant() << false;
    QTest::newRow("no number") << QVariant(300) << QVariant("wide") << false;
}

void TestSettings::damagedSplitters()
{
    QFETCH(QVariant, first);
    QFETCH(QVariant, second);
    QFETCH(bool, applied);
    Desk desk;
    desk.open();
    const QList<int> built = desk.find<QSplitter>("sp_h")->sizes();
    desk.close();
    {
        const auto store = openMainStore();
        store->setValue("h0", first);
        store->setValue("h1", second);
        if (!second.isValid()) {
            store->remove("h1");
        }
    }
    desk.open();
    const QList<int> sizes = desk.find<QSplitter>("sp_h")->sizes();
    if (applied) {
        QVERIFY2(qAbs(sizes.at(0) - 3 * sizes.at(1)) <= 4, "the sizes are shared as stored");
    } else {
        QCOMPARE(sizes, built);
    }
}

void TestSettings::lostDefaultFolderFallsBackToHome()
{
    Desk desk;
    openMainStore()->setValue("locpath", desk.path("removed/"));
    desk.open();
    QCOMPARE(desk.tree(1)->currentPath(), desk.path("") + '/');
}

void TestSettings::windowComesBackOntoTheScreen()
{
    Desk desk;
    {
        const auto store = openMainStore();
        store->setValue("pos", QPoint(90000, -7000));
        store->setValue("size", QSize(500000, 500000));
    }
    desk.open();
    QVERIFY(desk.window()->screen()->geometry().contains(desk.window()->pos()));
    QVERIFY(desk.window()->width() <= desk.window()->screen()->geometry().width());
}

void TestSettings::tellsThatTheFileCannotBeWritten()
{
    Desk desk;
    desk.open();
    // The folder of the settings can't be made where a file stands.
    QVERIFY(writeText(desk.path("blocked"), "x"));
    QSettings::setPath(QSettings::IniFormat, QSettings::UserScope, desk.path("blocked"));
    QString title;
    QString text;
    QVERIFY(withModal([&] { desk.window()->close(); },
                      [&](QWidget &box) {
                          title = box.windowTitle();
                          text = dynamic_cast<QMessageBox &>(box).text();
                          press("OK")(box);
                      }));
    QCOMPARE(title, "HV Corvane");
    QCOMPARE(text, "The settings file cannot be written.\n");
    QTRY_VERIFY(!desk.window());
}

void TestSettings::debugSwitch_data()
{
    QTest::addColumn<QByteArray>("argument");
    QTest::addColumn<bool>("debug");
    QTest::newRow("given") << QByteArray("--debug") << true;
    QTest::newRow("none") << QByteArray() << false;
    QTest::newRow("capitals") << QByteArray("--DEBUG") << false;
    QTest::newRow("with a value") << QByteArray("--debug=1") << false;
}

void TestSettings::debugSwitch()
{
    QFETCH(QByteArray, argument);
    QFETCH(bool, debug);
    qstrncpy(argumentText, argument.constData(), sizeof argumentText);
    Desk desk;
    desk.open();
    desk.select(1, "tone.wv");
    argumentText[0] = '\0';
    const QStringList log = desk.log();
    QCOMPARE(!log.filter("System root path is ").isEmpty(), debug);
    QCOMPARE(log.contains(QString("Selecting LOCAL: %1.").arg(desk.path("tone.wv"))), debug);
    QCOMPARE(Tracer::isEnabled(Tracer::Debug), debug);
}

int main(int argc, char **argv)
{
    const QApplication application(argumentCount, arguments);
    TestSettings test;
    return QTest::qExec(&test, argc, argv);
}

#include "tst_settings.moc"
