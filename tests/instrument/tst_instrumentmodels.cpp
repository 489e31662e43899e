// SPDX-License-Identifier: Apache-2.0
#include "instrument/instrumentmodels.h"
#include "instrument/remotepaths.h"

#include <QTest>

class TestInstrumentModels : public QObject
{
    Q_OBJECT
private slots:
    void model_data();
    void model();
    void kinds();
    void rfRange_data();
    void rfRange();
    void baseband_data();
    void baseband();
    void remotePath_data();
    void remotePath();
    void joinedPath_data();
    void joinedPath();
    void catalogue_data();
    void catalogue();
    void resource();
};

void TestInstrumentModels::model_data()
{
    QTest::addColumn<QString>("field");
    QTest::addColumn<int>("row");
    QTest::addColumn<QString>("serialField");
    QTest::addColumn<QString>("serial");
    QTest::addColumn<QStringList>("roots");
    QTest::newRow("first row") << "TGX-830" << 0 << "a/b/c"
                               << "b" << QStringList{"D:"};
    // "TVX" stands before "TVX-710" and lies inside it.
    QTest::newRow("name inside a name") << "TVX-710" << 15 << "a/b"
                                        << "b" << QStringList{"D:"};
    QTest::newRow("more around it") << "The TGX-870A" << 11 << "1234"
                                    << "" << QStringList{"/var/user/", "/hdd/"};
    QTest::newRow("analyzer") << "PAX-630" << 20 << "a/b/c"
                              << "a" << QStringList{"D:"};
    QTest::newRow("three roots") << "PAX-710" << 27 << "a/b/c"
                                 << "b" << QStringList{"D:", "E:", "F:"};
    QTest::newRow("analyzer without /") << "PAX-610" << 17 << "a"
                                        << "a" << QStringList{"D:"};
    QTest::newRow("no root") << "TQX-110" << 9 << "a/b"
                             << "b" << QStringList{};
    QTest::newRow("no hard disk") << "TGX-880" << 12 << "a/b"
                                  << "b" << QStringList{"/var/user/"};
    QTest::newRow("lower case") << "tgx-830" << NoModel << "a/b"
                                << "b" << QStringList{};
}

void TestInstrumentModels::model()
{
    QFETCH(const QString, field);
    QFETCH(const int, row);
    QFETCH(const QString, serialField);
    QFETCH(const QString, serial);
    QFETCH(const QStringList, roots);
    QCOMPARE(findModel(field), row);
    QCOMPARE(serialOf(row, serialField), serial);
    QCOMPARE(rootsOf(row, "TGX870-P7,TGX870-P13"), roots);
}

void TestInstrumentModels::kinds()
{
    const auto rowsWith = [](bool InstrumentModel::*flag) {
        QList<int> rows;
        for (int row = 0; modelRow(row) != nullptr; ++row) {
            if (modelRow(row)->*flag) {
                rows.append(row);
            }
        }
        return rows;
    };
    QCOMPARE(rowsWith(&InstrumentModel::unixFileSystem), (QList<int>{3, 7, 8, 11, 12}));
    QCOMPARE(rowsWith(&InstrumentModel::basebandCoder), (QList<int>{0, 1, 2, 6, 11, 15, 16}));
    QCOMPARE(rowsWith(&InstrumentModel::reserved), (QList<int>{4, 6, 9, 10, 13, 14, 15, 16, 27}));
    // All of the PAX series but its last.
    QCOMPARE(rowsWith(&InstrumentModel::analyzer),
             (QList<int>{17, 18, 19, 20, 21, 22, 23, 24, 25, 26}));
}

void TestInstrumentModels::rfRange_data()
{
    QTest::addColumn<int>("row");
    QTest::addColumn<QString>("options");
    QTest::addColumn<int>("path");
    QTest::addColumn<double>("lower");
    QTest::addColumn<double>("upper");
    QTest::newRow("6 GHz") << 0 << "TGX830-R16,X" << 1 << 100e3 << 6e9;
    QTest::newRow("first of the table") << 1 << "A-R16,A-R12,X" << 1 << 100e3 << 2.2e9;
    QTest::newRow("second path") << 2 << "A-R12,A-R26,X" << 2 << 100e3 << 6e9;
    QTest::newRow("no second path") << 0 << "A-R12,A-R26,X" << 2 << 0.0 << 0.0;
    QTest::newRow("last has no comma") << 1 << "X,A-R14" << 1 << 0.0 << 0.0;
    QTest::newRow("from 9 kHz") << 11 << "A-R13,X" << 1 << 9e3 << 3e9;
    QTest::newRow("not in its list") << 11 << "A-R14,X" << 1 << 0.0 << 0.0;
    QTest::newRow("other row") << 3 << "A-R13,X" << 1 << 0.0 << 0.0;
    QTest::newRow("third path") << 1 << "A-R13,A-R23,X" << 3 << 0.0 << 0.0;
}

void TestInstrumentModels::rfRange()
{
    QFETCH(const int, row);
    QFETCH(const QString, options);
    QFETCH(const int, path);
    QFETCH(const double, lower);
    QFETCH(const double, upper);
    const auto range = rfRangeOf(row, options, path);
    QCOMPARE(range.has_value(), upper > 0);
    if (range) {
        QCOMPARE(range->lower, lower);
        QCOMPARE(range->upper, upper);
    }
}

void TestInstrumentModels::baseband_data()
{
    QTest::addColumn<int>("row");
    QTest::addColumn<QString>("options");
    QTest::addColumn<int>("index");
    QTest::addColumn<int>("size"); // -1: there is no such baseband
    QTest::addColumn<int>("clock");
    QTest::addColumn<int>("bandwidth");
    const QString two = "TGX810-P3,TGX810-P1,X";
    QTest::newRow("first in the answer") << 1 << two << 1 << 134217728 << 40000000 << 100000000;
    QTest::newRow("second in the answer") << 1 << two << 2 << 67108864 << 40000000 << 100000000;
    QTest::newRow("third") << 1 << two + two << 3 << -1 << 0 << 0;
    QTest::newRow("0") << 1 << two << 0 << -1 << 0 << 0;
    QTest::newRow("the same twice")
        << 1 << "TGX810-P2,TGX810-P2,X" << 2 << 16777216 << 40000000 << 100000000;
    QTest::newRow("one only") << 1 << "TGX810-P2,X" << 2 << -1 << 0 << 0;
    QTest::newRow("code of another row") << 1 << "TGX870-P9,X" << 1 << 0 << 40000000 << 100000000;
    // After the cut both stand at 0; the one found first is the first.
    QTest::newRow("equal places") << 6 << "TBX410-P1,TBX410-P3," << 1 << 67108864 << 40000000
                                  << 100000000;
    QTest::newRow("TBX-310") << 4 << "TBX300-P5,X" << 1 << 1073741824 << 100000000 << 300000000;
    QTest::newRow("TBX-320") << 10 << "TBX300-P6,X" << 1 << 536870912 << 264000000 << 600000000;
    QTest::newRow("TGX-870 wide") << 11 << "TGX870-P7,X" << 1 << 33554432 << 120000000 << 150000000;
    QTest::newRow("TGX-870 P9") << 11 << "TGX870-P9" << 1 << 33554432 << 60000000 << 90000000;
    QTest::newRow("TGX-870 P9 and P10")
        << 11 << "TGX870-P9,TGX870-P10" << 1 << 268435456 << 60000000 << 90000000;
    QTest::newRow("TGX-870 wide and P10")
        << 11 << "TGX870-P8,TGX870-P10" << 1 << 268435456 << 120000000 << 150000000;
    QTest::newRow("TGX-870 second") << 11 << "TGX870-P9,TGX870-P10" << 2 << -1 << 0 << 0;
    QTest::newRow("row without basebands") << 3 << two << 1 << -1 << 0 << 0;
    QTest::newRow("nothing known") << 1 << "A,B,C," << 1 << -1 << 0 << 0;
}

void TestInstrumentModels::baseband()
{
    QFETCH(const int, row);
    QFETCH(const QString, options);
    QFETCH(const int, index);
    QFETCH(const int, size);
    QFETCH(const int, clock);
    QFETCH(const int, bandwidth);
    const auto limits = basebandOf(row, options, index);
    QCOMPARE(limits.has_value(), size >= 0);
    if (limits) {
        QCOMPARE(limits->size, size);
        QCOMPARE(limits->clock, clock);
        QCOMPARE(limits->bandwidth, bandwidth);
    }
}

void TestInstrumentModels::remotePath_data()
{
    QTest::addColumn<QStringList>("parts"); // drive, directory, base name, suffix, file name
    QTest::newRow("/var/user/a.b.wv") << QStringList{"", "/var/user/", "a.b", "wv", "a.b.wv"};
    QTest::newRow("D:\\w\\a.wv") << QStringList{"D:", "D:\\w\\", "a", "wv", "a.wv"};
    QTest::newRow("D:/w\\a") << QStringList{"D:", "D:/", "w\\a", "", "w\\a"};
    QTest::newRow("D:a.wv") << QStringList{"D:", "D:", "a", "wv", "a.wv"};
    QTest::newRow("a.") << QStringList{"", "", "a", "", "a."};
    QTest::newRow("/x/") << QStringList{"", "/x/", "", "", ""};
}

void TestInstrumentModels::remotePath()
{
    QFETCH(const QStringList, parts);
    const RemotePath path = splitPath(QTest::currentDataTag());
    QCOMPARE((QStringList{path.drive, path.directory, path.baseName, path.suffix, path.fileName}),
             parts);
}

void TestInstrumentModels::joinedPath_data()
{
    QTest::addColumn<QString>("parent");
    QTest::addColumn<QString>("name");
    QTest::addColumn<char>("separator");
    QTest::addColumn<QString>("path");
    QTest::newRow("unix") << "/var/user/"
                          << "a" << '/' << "/var/user/a";
    QTest::newRow("both kinds") << "D:/x//"
                                << "\\y/z" << '\\' << "D:\\x\\y\\z";
    QTest::newRow("apostrophe") << "/it's/"
                                << "'a'" << '/' << "/its/a";
    QTest::newRow("nothing") << "/"
                             << "" << '/' << "/";
}

void TestInstrumentModels::joinedPath()
{
    QFETCH(const QString, parent);
    QFETCH(const QString, name);
    QFETCH(const char, separator);
    QTEST(joinRemotePath(parent, name, QLatin1Char(separator)), "path");
}

void TestInstrumentModels::catalogue_data()
{
    QTest::addColumn<QString>("answer");
    QTest::addColumn<QStringList>("entries");
    QTest::newRow("two") << R"(100,200,"a.wv,BIN,5","sub,DIR,0")"
                         << QStringList{"a.wv|BIN|5", "sub|DIR|0"};
    QTest::newRow("nothing quoted") << "100,200" << QStringList{};
    QTest::newRow("empty") << "" << QStringList{};
    QTest::newRow("comma in the name") << R"(1,2,"a,b.wv,BIN,5")" << QStringList{"a,b.wv|BIN|5"};
    QTest::newRow("one comma") << R"(1,2,"a,5","b,BIN,6")" << QStringList{"b|BIN|6"};
    QTest::newRow("points") << R"(1,2,".,DIR,0","..,DIR,0",".x,BIN,1","y,BIN,2")"
                            << QStringList{"y|BIN|2"};
    QTest::newRow("bad size") << R"(1,2,"a,BIN,x","b,BIN,","c,BIN,3")" << QStringList{"c|BIN|3"};
    QTest::newRow("no name, no type")
        << R"(1,2,",BIN,1","b,,2","c,BIN,3")" << QStringList{"c|BIN|3"};
    QTest::newRow("quote left open") << R"(1,2,"a,BIN,1)" << QStringList{"a|BIN|1"};
    QTest::newRow("beyond 32 bits")
        << R"(1,2,"a,BIN,5000000000")" << QStringList{"a|BIN|5000000000"};
}

void TestInstrumentModels::catalogue()
{
    QFETCH(const QString, answer);
    QStringList entries;
    for (const RemoteFileEntry &entry : parseCatalogue(answer)) {
        entries.append(QString("%1|%2|%3").arg(entry.name, entry.type).arg(entry.size));
    }
    QTEST(entries, "entries");
}

void TestInstrumentModels::resource()
{
    QCOMPARE(resourceOf(" generator.lab "), "TCPIP::generator.lab::INSTR");
    QCOMPARE(resourceOf("GPIB0::5"), "GPIB0::5");
    QCOMPARE(resourceOf("  "), QString());
}

QTEST_GUILESS_MAIN(TestInstrumentModels)
#include "tst_instrumentmodels.moc"
