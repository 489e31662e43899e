// SPDX-License-Identifier: Apache-2.0
#include "instrument/instrumentmodels.h"
#include "instrument/remotepaths.h"
#include "support/rows.h"

#include <QTest>

class TestInstrumentModels : public QObject
{
    Q_OBJECT
private slots:
    void model();
    void rfRange();
    void baseband();
    void remotePath();
    void catalogue();
    void resource();
};

void TestInstrumentModels::model()
{
    struct Row
    {
        const char *name; ///< the model field
        int row;
        QString serialField;
        QString serial;
        QStringList roots;
    };
    forRows<Row>({{"TGX-830", 0, "a/b/c", "b", {"D:"}},
                  // "TVX" stands before "TVX-710" and lies inside it.
                  {"TVX-710", 15, "a/b", "b", {"D:"}},
                  {"The TGX-870A", 11, "1234", "", {"/var/user/", "/hdd/"}},
                  {"PAX-630", 20, "a/b/c", "a", {"D:"}},
                  {"PAX-710", 27, "a/b/c", "b", {"D:", "E:", "F:"}},
                  {"TQX-110", 9, "a/b", "b", {}},
                  {"tgx-830", NoModel, "a/b", "b", {}}},
                 [](const Row &row) {
                     QCOMPARE(findModel(row.name), row.row);
                     QCOMPARE(serialOf(row.row, row.serialField), row.serial);
                     QCOMPARE(rootsOf(row.row, "TGX870-P7,TGX870-P13"), row.roots);
                 });
}

void TestInstrumentModels::rfRange()
{
    struct Row
    {
        const char *name;
        int row;
        QString options;
        int path;
        double lower;
        double upper; ///< 0: there is no such path
    };
    forRows<Row>({{"first of the table", 1, "A-R16,A-R12,X", 1, 100e3, 2.2e9},
                  {"second path", 2, "A-R12,A-R26,X", 2, 100e3, 6e9},
                  {"no second path", 0, "A-R12,A-R26,X", 2, 0, 0},
                  {"last has no comma", 1, "X,A-R14", 1, 0, 0},
                  {"from 9 kHz", 11, "A-R13,X", 1, 9e3, 3e9},
                  {"other row", 3, "A-R13,X", 1, 0, 0}},
                 [](const Row &row) {
                     const auto range = rfRangeOf(row.row, row.options, row.path);
                     QCOMPARE(range.value_or(FrequencyRange()).lower, row.lower);
                     QCOMPARE(range.value_or(FrequencyRange()).upper, row.upper);
                 });
}

void TestInstrumentModels::baseband()
{
    struct Row
    {
        const char *name;
        int row;
        QString options;
        int index;
        int size; ///< 0: there is no such baseband
        int clock;
        int bandwidth;
    };
    const QString two = "TGX810-P3,TGX810-P1,X";
    forRows<Row>(
        {{"first in the answer", 1, two, 1, 134217728, 40000000, 100000000},
         {"second in the answer", 1, two, 2, 67108864, 40000000, 100000000},
         {"third", 1, two + two, 3, 0, 0, 0},
         {"the same twice", 1, "TGX810-P2,TGX810-P2,X", 2, 16777216, 40000000, 100000000},
         // After the cut both stand at 0; the one found first is the first.
         {"equal places", 6, "TBX410-P1,TBX410-P3,", 1, 67108864, 40000000, 100000000},
         {"TBX-320", 10, "TBX300-P6,X", 1, 536870912, 264000000, 600000000},
         {"TGX-870 P9 and P10", 11, "TGX870-P9,TGX870-P10", 1, 268435456, 60000000, 90000000},
         {"TGX-870 wide and P10", 11, "TGX870-P8,TGX870-P10", 1, 268435456, 120000000, 150000000},
         {"TGX-870 second", 11, "TGX870-P9,TGX870-P10", 2, 0, 0, 0}},
        [](const Row &row) {
            const auto limits = basebandOf(row.row, row.options, row.index);
            QCOMPARE(limits.has_value(), row.size > 0);
            const BasebandLimits found = limits.value_or(BasebandLimits());
            QCOMPARE(found.size, row.size);
            QCOMPARE(found.clock, row.clock);
            QCOMPARE(found.bandwidth, row.bandwidth);
        });
}

void TestInstrumentModels::remotePath()
{
    struct Row
    {
        const char *name;  ///< the path
        QStringList parts; ///< drive, directory, base name, suffix, file name
    };
    forRows<Row>({{"/var/user/a.b.wv", {"", "/var/user/", "a.b", "wv", "a.b.wv"}},
                  {"D:\\w\\a.wv", {"D:", "D:\\w\\", "a", "wv", "a.wv"}},
                  {"D:/w\\a", {"D:", "D:/", "w\\a", "", "w\\a"}},
                  {"D:a.wv", {"D:", "D:", "a", "wv", "a.wv"}},
                  {"/x/", {"", "/x/", "", "", ""}}},
                 [](const Row &row) {
                     const RemotePath path = splitPath(row.name);
                     QCOMPARE((QStringList{path.drive, path.directory, path.baseName, path.suffix,
                                           path.fileName}),
                              row.parts);
                 });
    QCOMPARE(joinRemotePath("D:/x//", "\\y/z", '\\'), "D:\\x\\y\\z");
    QCOMPARE(joinRemotePath("/it's/", "'a'", '/'), "/it's/'a'");
    QVERIFY(staysBelow("a/..b") && !staysBelow("a/../b") && !staysBelow("a//b"));
    for (const QChar character : QString("*#+/\\&'\"?%")) {
        QVERIFY2(hasForbiddenCharacter(QString("a%1b").arg(character)), qPrintable(character));
    }
    QVERIFY(!hasForbiddenCharacter(QString("a-b_c (1).wv")));
    QVERIFY(!sendingProblem("a?").isEmpty() && sendingProblem("50%").isEmpty());
}

void TestInstrumentModels::catalogue()
{
    struct Row
    {
        const char *name;
        QString answer;
        QStringList entries;
    };
    forRows<Row>({{"two", R"(100,200,"a.wv,BIN,5","sub,DIR,0")", {"a.wv|BIN|5", "sub|DIR|0"}},
                  {"nothing quoted", "100,200", {}},
                  {"comma in the name", R"(1,2,"a,b.wv,BIN,5")", {"a,b.wv|BIN|5"}},
                  {"points", R"(1,2,".,DIR,0","..,DIR,0",".x,BIN,1","y,BIN,2")", {"y|BIN|2"}},
                  {"bad parts", R"(1,2,"a,5","a,BIN,x",",BIN,1","b,,2","c,BIN,3")", {"c|BIN|3"}},
                  {"quote left open", R"(1,2,"a,BIN,1)", {"a|BIN|1"}},
                  {"beyond 32 bits", R"(1,2,"a,BIN,5000000000")", {"a|BIN|5000000000"}}},
                 [](const Row &row) {
                     QStringList entries;
                     for (const RemoteFileEntry &entry : parseCatalogue(row.answer)) {
                         entries.append(
                             QString("%1|%2|%3").arg(entry.name, entry.type).arg(entry.size));
                     }
                     QCOMPARE(entries, row.entries);
                 });
}

void TestInstrumentModels::resource()
{
    QCOMPARE(resourceOf(" generator.lab "), "TCPIP::generator.lab::INSTR");
    QCOMPARE(resourceOf("GPIB0::5"), "GPIB0::5");
    QCOMPARE(resourceOf("  "), QString());
}

QTEST_GUILESS_MAIN(TestInstrumentModels)
#include "tst_instrumentmodels.moc"
