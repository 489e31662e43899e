// SPDX-License-Identifier: Apache-2.0
#include "simulator/Options.h"
#include "simulator/configfile.h"
#include "support/files.h"
#include "support/rows.h"

#include <QTest>

using namespace simulator;

class TestSimulatorOptions : public QObject
{
    Q_OBJECT

private slots:
    void switches();
    void wrongSwitches();
    void config();
    void wrongConfig();
    void folders();

private:
    static std::optional<Options> parse(const QStringList &arguments, QString &error)
    {
        std::vector<std::string> texts;
        for (const QString &argument : arguments) {
            texts.push_back(argument.toStdString());
        }
        std::string reason;
        auto options = parseOptions(texts, reason);
        error = QString::fromStdString(reason);
        return options;
    }
};

void TestSimulatorOptions::switches()
{
    QString error;
    auto options = parse({}, error);
    QVERIFY2(options, qPrintable(error));
    const InstrumentPlace &preset = options->instruments.front();
    QCOMPARE(preset.instrument.model->name, "TGX-870");
    QCOMPARE(preset.instrument.serial, "100001");
    QCOMPARE(preset.instrument.firmware, "1.0");
    QCOMPARE(preset.address, "127.0.0.2");
    QVERIFY(!preset.gateway && options->text.empty());

    options = parse({"--model=PAX-610", "--serial", "7", "--options", "", "--address", "127.1.2.3",
                     "--fault", "queue=25", "--fault=idn=A,B", "--verbose"},
                    error);
    QVERIFY2(options, qPrintable(error));
    const InstrumentPlace &given = options->instruments.front();
    QVERIFY(options->verbose);
    QVERIFY(given.instrument.model->analyzer);
    QCOMPARE(given.instrument.options, "");
    QCOMPARE(given.instrument.faults.list(), "idn=A,B,queue=25");

    options = parse({"--help"}, error);
    QVERIFY(options && options->text.find("short-block[=BYTES]") != std::string::npos);
    options = parse({"--version"}, error);
    QVERIFY(options && options->text.starts_with("corvane-simulator "));
}

void TestSimulatorOptions::wrongSwitches()
{
    forRows({{"unknown", "--modle x", "--modle"},
             {"file name", "x.ini", "x.ini"},
             {"no value", "--model", "--model"},
             {"model", "--model TGX", "'TGX'; there are TGX-830"},
             {"serial", "--serial 1/2", "'1/2'"},
             {"public address", "--address 0.0.0.0", "127.0.0.0/8"},
             {"fault", "--fault fire", "fault 'fire' is unknown"},
             {"fault range", "--fault busy=-1", "from 0 to 86400"},
             {"fault with value", "--fault opc-zero=1", "takes no value"},
             {"config and switch", "--config x --serial 1", "--config"},
             {"missing config", "--config /nowhere/x", "'/nowhere/x'"}},
            [](QString arguments, QString words) {
                QString error;
                QVERIFY(!parse(arguments.split(' '), error));
                QVERIFY2(error.contains(words), qPrintable(error));
            });
}

void TestSimulatorOptions::config()
{
    const TestFolder folder;
    QVERIFY(folder.store("some.ini",
                         "; two instruments\r\n[generator]\r\nmodel = TGX-810 ; old\r\n"
                         "serial=42\r\nroot = files/gen\r\nfault = opc-zero, queue=3\r\n"
                         "fault=\"idn=A,B ;C\"\r\noptions = \"X1,X2\"\r\n"
                         "address=127.0.0.7\r\n\r\n# behind a gateway\r\n"
                         "[analyzer]\r\nmodel=PAX-630\r\ngateway=0\r\ngpib=20"));
    QString error;
    const auto options = parse({"--config", folder.path("some.ini")}, error);
    QVERIFY2(options, qPrintable(error));
    QCOMPARE(options->instruments.size(), 2U);
    const InstrumentPlace &generator = options->instruments[0];
    QCOMPARE(generator.instrument.model->name, "TGX-810");
    QCOMPARE(generator.instrument.faults.list(), "idn=A,B ;C,opc-zero,queue=3");
    QCOMPARE(generator.instrument.options, "X1,X2");
    QCOMPARE(QString::fromStdString(generator.instrument.root), folder.path("files/gen"));
    QCOMPARE(generator.address, "127.0.0.7");
    const InstrumentPlace &analyzer = options->instruments[1];
    QCOMPARE(analyzer.gateway.value_or(1), 0);
    QCOMPARE(analyzer.gpib, 20U);
    QCOMPARE(analyzer.instrument.serial, "100002"); // by its place
}

void TestSimulatorOptions::wrongConfig()
{
    forRows({{"empty", "", "no group"},
             {"no place", "[a]\nmodel=TVX", "[a] needs either"},
             {"both places", "[a]\naddress=127.0.0.2\ngateway=2000\ngpib=1", "[a] address"},
             {"gpib alone", "[a]\naddress=127.0.0.2\ngpib=1", "[a] gpib"},
             {"low port", "[a]\ngateway=1024\ngpib=1", "1025 to 65535"},
             {"gpib range", "[a]\ngateway=2000\ngpib=31", "0 to 30"},
             {"same gpib", "[a]\ngateway=2000\ngpib=1\n[b]\ngateway=2000\ngpib=1",
              "gateway 2000, gpib 1"},
             {"same address", "[a]\naddress=127.0.0.2\n[b]\naddress=127.0.0.2", "127.0.0.2"},
             {"key", "[a]\ncolour=red", "line 2: unknown key 'colour'"},
             {"key twice", "[a]\nmodel=TVX\nmodel=TVX", "line 3: the key 'model'"},
             {"before a group", "model=TVX", "line 1: 'model=TVX' stands before"},
             {"no key", "[a]\nwhat", "line 2: 'what' is neither"},
             {"open bracket", "[a\n", "line 1: '[a' lacks"},
             {"fault", "[a]\naddress=127.0.0.2\nfault=x", "[a] fault 'x'"}},
            [](QString text, QString words) {
                std::string error;
                const auto entries = protocols::parseIni(text.toStdString(), error);
                if (entries) {
                    QVERIFY(!instrumentsOf(*entries, "/x", error));
                }
                QVERIFY2(QString::fromStdString(error).contains(words), error.c_str());
            });
}

// What stands for a disk depends on model and options.
void TestSimulatorOptions::folders()
{
    QCOMPARE(rootFolders(*findModel("TGX-870"), "TGX870-P13").size(), 2U);
    QCOMPARE(rootFolders(*findModel("TGX-870"), "TGX870-P9").size(), 1U);
    QCOMPARE(rootFolders(*findModel("PAX-710"), "").size(), 3U);
    QVERIFY(rootFolders(*findModel("TQX-120"), "").empty());
}

QTEST_APPLESS_MAIN(TestSimulatorOptions)
#include "tst_simulatoroptions.moc"
