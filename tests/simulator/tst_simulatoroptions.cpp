// SPDX-License-Identifier: Apache-2.0
#include "simulator/Options.h"

#include <QFile>
#include <QTemporaryDir>
#include <QTest>

#include <set>

using namespace simulator;

class tst_SimulatorOptions : public QObject
{
    Q_OBJECT

private slots:
    void switches();
    void wrongSwitches_data();
    void wrongSwitches();
    void config();
    void wrongConfig_data();
    void wrongConfig();
    void models();

private:
    static std::optional<Options> parse(const QStringList &arguments, QString &error)
    {
        std::vector<std::string> texts;
        for (const QString &argument : arguments)
            texts.push_back(argument.toStdString());
        const std::vector<std::string_view> views(texts.begin(), texts.end());
        std::string reason;
        auto options = parseOptions(views, reason);
        error = QString::fromStdString(reason);
        return options;
    }
};

void tst_SimulatorOptions::switches()
{
    QString error;
    auto options = parse({}, error);
    QVERIFY2(options, qPrintable(error));
    QCOMPARE(options->instruments.size(), 1U);
    const InstrumentPlace &preset = options->instruments.front();
    QCOMPARE(preset.instrument.model->name, "TGX-870");
    QCOMPARE(preset.instrument.serial, "100001");
    QCOMPARE(preset.instrument.firmware, "1.0");
    QCOMPARE(preset.address, "127.0.0.2");
    QVERIFY(!preset.gateway);

    options = parse({"--model=PAX-610", "--serial", "7", "--options", "", "--address", "127.1.2.3",
                     "--fault", "queue=25", "--fault=idn=A,B", "--verbose"},
                    error);
    QVERIFY2(options, qPrintable(error));
    const InstrumentPlace &given = options->instruments.front();
    QVERIFY(options->verbose);
    QVERIFY(given.instrument.model->analyzer);
    QCOMPARE(given.instrument.options, "");
    QCOMPARE(given.instrument.faults.number("queue"), 25);
    QCOMPARE(given.instrument.faults.text("idn"), "A,B");
}

void tst_SimulatorOptions::wrongSwitches_data()
{
    QTest::addColumn<QStringList>("arguments");
    QTest::addColumn<QString>("words"); // that the message has to hold

    QTest::newRow("unknown") << QStringList{"--modle", "x"} << "'--modle'";
    QTest::newRow("file name") << QStringList{"x.ini"} << "'x.ini'";
    QTest::newRow("no value") << QStringList{"--model"} << "--model needs a value";
    QTest::newRow("model") << QStringList{"--model", "TGX"} << "'TGX'; there are TGX-830";
    QTest::newRow("serial") << QStringList{"--serial", "1/2"} << "'1/2'";
    QTest::newRow("public address") << QStringList{"--address", "0.0.0.0"} << "127.0.0.0/8";
    QTest::newRow("no address") << QStringList{"--address", "localhost"} << "'localhost'";
    QTest::newRow("fault") << QStringList{"--fault", "fire"} << "fault 'fire' is unknown";
    QTest::newRow("fault range") << QStringList{"--fault", "busy=-1"} << "from 0 to 86400";
    QTest::newRow("fault without value") << QStringList{"--fault", "busy"} << "busy=SECONDS";
    QTest::newRow("fault with value") << QStringList{"--fault", "opc-zero=1"} << "takes no value";
    QTest::newRow("config and switch")
        << QStringList{"--config", "x", "--serial", "1"} << "no switches";
    QTest::newRow("missing config") << QStringList{"--config", "/nowhere/x"} << "'/nowhere/x'";
}

void tst_SimulatorOptions::wrongSwitches()
{
    QFETCH(QStringList, arguments);
    QFETCH(QString, words);
    QString error;
    QVERIFY(!parse(arguments, error));
    QVERIFY2(error.contains(words), qPrintable(error));
}

void tst_SimulatorOptions::config()
{
    const QTemporaryDir folder;
    QFile file(folder.filePath("some.ini"));
    QVERIFY(file.open(QIODevice::WriteOnly));
    file.write("; two instruments\r\n[generator]\r\nmodel = TGX-810 \r\nserial=42\r\n"
               "root = files/gen\r\nfault = opc-zero, queue=3\r\nfault=\"idn=A,B\"\r\n"
               "options = \"X1,X2\"\r\naddress=127.0.0.7\r\n\r\n"
               "# behind a gateway\r\n[analyzer]\r\nmodel=PAX-630\r\ngateway=0\r\ngpib=20");
    file.close();
    QString error;
    const auto options = parse({"--config", file.fileName()}, error);
    QVERIFY2(options, qPrintable(error));
    QCOMPARE(options->instruments.size(), 2U);
    const InstrumentPlace &generator = options->instruments[0];
    QCOMPARE(generator.instrument.faults.list(), "idn=A,B,opc-zero,queue=3");
    QCOMPARE(generator.instrument.options, "X1,X2");
    QCOMPARE(QString::fromStdString(generator.instrument.root), folder.filePath("files/gen"));
    QCOMPARE(generator.address, "127.0.0.7");
    const InstrumentPlace &analyzer = options->instruments[1];
    QCOMPARE(analyzer.gateway.value_or(1), 0);
    QCOMPARE(analyzer.gpib, 20U);
    QCOMPARE(analyzer.instrument.serial, "100002"); // by its place
}

void tst_SimulatorOptions::wrongConfig_data()
{
    QTest::addColumn<QString>("text");
    QTest::addColumn<QString>("words");

    QTest::newRow("empty") << ""
                           << "no group";
    QTest::newRow("no place") << "[a]\nmodel=TVX"
                              << "[a] needs either";
    QTest::newRow("both places") << "[a]\naddress=127.0.0.2\ngateway=2000\ngpib=1"
                                 << "[a] address";
    QTest::newRow("gpib alone") << "[a]\naddress=127.0.0.2\ngpib=1"
                                << "[a] gpib";
    QTest::newRow("low port") << "[a]\ngateway=1024\ngpib=1"
                              << "1025 to 65535";
    QTest::newRow("high port") << "[a]\ngateway=65536\ngpib=1"
                               << "'65536'";
    QTest::newRow("gpib range") << "[a]\ngateway=2000\ngpib=31"
                                << "0 to 30";
    QTest::newRow("no gpib") << "[a]\ngateway=2000"
                             << "0 to 30";
    QTest::newRow("same gpib") << "[a]\ngateway=2000\ngpib=1\n[b]\ngateway=2000\ngpib=1"
                               << "gateway 2000, gpib 1";
    QTest::newRow("same address") << "[a]\naddress=127.0.0.2\n[b]\naddress=127.0.0.2"
                                  << "address 127.0.0.2";
    QTest::newRow("key") << "[a]\ncolour=red"
                         << "line 2: unknown key 'colour'";
    QTest::newRow("key twice") << "[a]\nmodel=TVX\nmodel=TVX"
                               << "line 3: the key 'model'";
    QTest::newRow("before a group") << "model=TVX"
                                    << "line 1: a group";
    QTest::newRow("no key") << "[a]\nwhat"
                            << "line 2: neither";
    QTest::newRow("open bracket") << "[a\n"
                                  << "line 1: ']'";
    QTest::newRow("fault") << "[a]\naddress=127.0.0.2\nfault=x"
                           << "[a] fault 'x'";
}

void tst_SimulatorOptions::wrongConfig()
{
    QFETCH(QString, text);
    QFETCH(QString, words);
    std::string error;
    const auto entries = parseConfig(text.toStdString(), error);
    if (entries)
        QVERIFY(!instrumentsOf(*entries, "/x", error));
    QVERIFY2(QString::fromStdString(error).contains(words), error.c_str());
}

void tst_SimulatorOptions::models()
{
    QCOMPARE(modelTable().size(), 28U);
    std::set<std::string_view> names;
    for (const ModelInfo &model : modelTable())
        names.insert(model.name);
    QCOMPARE(names.size(), 28U);
    const ModelInfo *model = findModel("TGX-870");
    QVERIFY(model != nullptr);
    QCOMPARE(rootFolders(*model, "TGX870-P13").size(), 2U);
    QCOMPARE(rootFolders(*model, "TGX870-P9").size(), 1U);
    QCOMPARE(rootFolders(*findModel("PAX-710"), "").size(), 3U);
    QVERIFY(rootFolders(*findModel("TQX-120"), "").empty());
}

QTEST_APPLESS_MAIN(tst_SimulatorOptions)
#include "tst_simulatoroptions.moc"
