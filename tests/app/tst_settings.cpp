// SPDX-License-Identifier: Apache-2.0
#include "app/QCustomTreeView.h"
#include "app/settingsstores.h"
#include "guitesting.h"
#include "log/Tracer.h"
#include "support/rows.h"

#include <QApplication>
#include <QHeaderView>
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
    void damagedSplitters();
    void whatIsLostFallsBack();
    void tellsThatTheFileCannotBeWritten();
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
    QCOMPARE(store->value("locpath").toString(), desk.path("sub") + '/');
    QCOMPARE(store->value("tree1.local.section0").toInt(), 220);
    QCOMPARE(store->value("tree2.local.section0").toInt(), 187);

    QVERIFY(writeText(desk.path("sub/file"), "x"));
    desk.open();
    QCOMPARE(desk.window()->pos(), QPoint(20, 30));
    QCOMPARE(desk.window()->size(), QSize(760, 560));
    QCOMPARE(desk.find<QSplitter>("sp_h")->sizes(), sizes);
    QCOMPARE(desk.tree(2)->header()->sectionSize(0), 187);
    QCOMPARE(desk.tree(1)->currentPath(), desk.path("sub") + '/');
}

void TestSettings::damagedSplitters()
{
    forRows({{"sound", 100, true}, {"no number", "wide", false}},
            [](const QVariant &second, bool applied) {
                Desk desk;
                desk.open();
                const QList<int> built = desk.find<QSplitter>("sp_h")->sizes();
                desk.close();
                {
                    const auto store = openMainStore();
                    store->setValue("h0", 300);
                    store->setValue("h1", second);
                }
                desk.open();
                const QList<int> sizes = desk.find<QSplitter>("sp_h")->sizes();
                QVERIFY(applied ? qAbs(sizes.at(0) - 3 * sizes.at(1)) <= 4 : sizes == built);
            });
}

void TestSettings::whatIsLostFallsBack()
{
    Desk desk;
    {
        const auto store = openMainStore();
        store->setValue("locpath", desk.path("removed/"));
        store->setValue("pos", QPoint(90000, -7000));
        store->setValue("size", QSize(500000, 500000));
    }
    desk.open();
    QCOMPARE(desk.tree(1)->currentPath(), desk.path("") + '/');
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
    Seen seen;
    QVERIFY(withModal([&] { desk.window()->close(); }, answer("OK", seen)));
    QCOMPARE(seen.title, "HV Corvane");
    QCOMPARE(seen.text, "The settings file cannot be written.\n");
    QTRY_VERIFY(!desk.window());
}

void TestSettings::debugSwitch()
{
    forRows({{"given", "--debug", true}, {"capitals", "--DEBUG", false}},
            [](const char *argument, bool debug) {
                qstrncpy(argumentText, argument, sizeof argumentText);
                Desk desk;
                desk.open();
                desk.select(1, "tone.wv");
                argumentText[0] = '\0';
                QCOMPARE(!desk.log().filter("System root path is ").isEmpty(), debug);
                QCOMPARE(Tracer::isEnabled(Tracer::Debug), debug);
            });
}

int main(int argc, char **argv)
{
    const QApplication application(argumentCount, arguments);
    TestSettings test;
    return QTest::qExec(&test, argc, argv);
}

#include "tst_settings.moc"
