// SPDX-License-Identifier: Apache-2.0
#include "instrument/InstrumentList.h"
#include "instrument/LogRecorder.h"
#include "support/files.h"
#include "support/rows.h"

#include <QSettings>
#include <QTest>

namespace {

InstrConfigEntry entry(const QString &model, const QString &serial, const QString &resource)
{
    return {.enabled = true,
            .model = model,
            .serial = serial,
            .resource = resource,
            .interface = resource.section("::", 0, 0),
            .comment = {},
            .folder = "Manually Added"};
}

} // namespace

class TestInstrumentList : public QObject
{
    Q_OBJECT

private slots:
    void add();
    void identify();
    void settingsRoundTrip();
    void shorterListLeavesNothingBehind();
    void readsWhatWasWrittenByHand();

private:
    [[nodiscard]] QString fileName() const { return m_folder.path("settings.ini"); }

    TestFolder m_folder;
};

void TestInstrumentList::add()
{
    struct Row
    {
        const char *name;
        InstrConfigEntry added;
        int place;
        int count;
        QString words;
    };
    forRows<Row>(
        {// The panes tell them apart by the interface.
         {"known, by another interface", entry("TGX-870", "1", "TCPIP::10.0.0.1::INSTR"), 1, 2, ""},
         {"known, at another address", entry("TGX-870", "1", "GPIB0::9::INSTR"), -1, 1,
          "1 The instrument 'TGX-870, 1' was already added."},
         {"other instrument at a known address", entry("TGX-810", "2", "gpib0::28::instr"), 0, 1,
          "2 At 'GPIB0::28::INSTR' there is now the instrument 'TGX-810, 2'."},
         // An empty resource marks the end of the stored list.
         {"no resource", entry("TGX-810", "2", ""), -1, 1,
          "4 The instrument 'TGX-810, 2' has no resource and was not added."}},
        [](const Row &row) {
            InstrumentList list;
            QCOMPARE(list.add(entry("TGX-870", "1", "GPIB0::28::INSTR")), 0);
            (void)takeLog();
            QCOMPARE(list.add(row.added), row.place);
            QCOMPARE(list.entries().size(), row.count);
            QCOMPARE(takeLog(Tracer::DefaultMask).join('\n'), row.words);
            if (row.place >= 0) {
                QCOMPARE(list.entries().at(row.place).model, row.added.model);
            }
        });
}

void TestInstrumentList::identify()
{
    InstrumentList list;
    list.add(entry("TGX-870", "1", "GPIB0::28::INSTR"));
    list.setComment(0, "left bench");
    QVERIFY(!list.identify(0, entry("TGX-870", "1", "GPIB0::28::INSTR")));
    QVERIFY(list.identify(0, entry("TGX-870", "7", "GPIB0::28::INSTR")));
    QCOMPARE(list.entries().at(0).serial, "7");
    // What the user has said of the place stays.
    QCOMPARE(list.entries().at(0).comment, "left bench");
    QCOMPARE(list.entries().at(0).folder, "Manually Added");
    QVERIFY(!list.identify(1, entry("TGX-870", "8", "GPIB0::28::INSTR")));
    QVERIFY(!list.identify(-1, entry("TGX-870", "8", "GPIB0::28::INSTR")));
}

void TestInstrumentList::settingsRoundTrip()
{
    InstrumentList list;
    list.add(entry("TGX-870", "1", "TCPIP::bench.example::INSTR"));
    list.add({.enabled = false,
              .model = "PAX-630",
              .serial = "",
              .resource = "GPIB0::20::INSTR",
              .interface = "GPIB0",
              .comment = "a, \"b\"; c=\\d ü\n[e]",
              .folder = "D:\\waves\\"});
    {
        QSettings settings(fileName(), QSettings::IniFormat);
        settings.beginGroup("InstrConfig");
        list.write(settings);
    }
    QSettings settings(fileName(), QSettings::IniFormat);
    settings.beginGroup("InstrConfig");
    QCOMPARE(settings.value("intf1").toString(), "GPIB0");
    QCOMPARE(settings.value("en1").toBool(), false);
    QVERIFY(settings.contains("instr2"));
    QCOMPARE(settings.value("instr2").toString(), "");
    InstrumentList other;
    other.add(entry("TGX-850", "9", "USB::1::INSTR"));
    other.read(settings);
    QCOMPARE(other.entries(), list.entries());
}

void TestInstrumentList::shorterListLeavesNothingBehind()
{
    QSettings settings(fileName(), QSettings::IniFormat);
    InstrumentList list;
    for (int i = 0; i < 12; ++i) {
        list.add(entry("TGX-870", QString::number(i), QString("GPIB0::%1::INSTR").arg(i)));
    }
    list.write(settings);
    list.clear();
    list.add(entry("TGX-810", "1", "GPIB0::5::INSTR"));
    list.write(settings);
    QStringList keys = settings.childKeys();
    keys.sort();
    QCOMPARE(keys, (QStringList{"comment0", "en0", "folder0", "instr0", "instr1", "intf0", "model0",
                                "serial0"}));
    InstrumentList other;
    other.read(settings);
    QCOMPARE(other.entries(), list.entries());
}

void TestInstrumentList::readsWhatWasWrittenByHand()
{
    QVERIFY(m_folder.store(
        "settings.ini",
        "[General]\ninstr0=TCPIP::10.0.0.1::INSTR\nmodel0=TGX-870\ncomment0=left, below\n"
        "instr1=\ninstr2=GPIB0::5::INSTR\n"));
    InstrumentList list;
    list.read(QSettings(fileName(), QSettings::IniFormat));
    // The empty one is the end, whatever follows.
    QCOMPARE(list.entries().size(), 1);
    QCOMPARE(list.entries().at(0).comment, "left, below");
    QVERIFY(list.entries().at(0).enabled);
    QVERIFY(!isComplete(list.entries().at(0)));
}

QTEST_GUILESS_MAIN(TestInstrumentList)
#include "tst_instrumentlist.moc"
