// SPDX-License-Identifier: Apache-2.0
#include "visa/Configuration.h"
#include "visa/FindExpression.h"
#include "visa/ResourceName.h"
#include "visa/formattext.h"
#include "visa/statustext.h"

#include <QElapsedTimer>
#include <QFile>
#include <QTemporaryDir>
#include <QTest>

using namespace visa;

/// The texts that the VISA layer takes apart: resource strings, search expressions, formats and the
/// configuration file.
class TestVisaText : public QObject
{
    Q_OBJECT

private slots:
    void resourceNames_data();
    void resourceNames();
    void findExpressions_data();
    void findExpressions();
    void nestedRepetitionsEnd();
    void formats_data();
    void formats();
    void configuration();
    void configurationErrors_data();
    void configurationErrors();
    void configurationFile();
};

void TestVisaText::resourceNames_data()
{
    QTest::addColumn<QString>("text");
    QTest::addColumn<QString>("fullText"); // empty: refused

    const auto row = [](const char *text, const char *fullText) {
        QTest::newRow(text) << text << fullText;
    };
    row("TCPIP::192.168.1.5", "TCPIP0::192.168.1.5::inst0::INSTR");
    row("TCPIP::192.168.1.5::INSTR", "TCPIP0::192.168.1.5::inst0::INSTR");
    row("tcpip2::bench-7::inst1::instr", "TCPIP2::bench-7::inst1::INSTR");
    row("TCPIP0::gate::gpib0,28", "TCPIP0::gate::gpib0,28::INSTR");
    row("TCPIP::10.0.0.1::5025::SOCKET", "TCPIP0::10.0.0.1::5025::SOCKET");
    row("TCPIP::10.0.0.1::65536::SOCKET", "");
    row("TCPIP::10.0.0.1::0::SOCKET", "");
    row("TCPIP::10.0.0.1::inst0::1::INSTR", "");
    row("TCPIP", "");
    row("TCPIP::", "");
    row("TCPIP::::INSTR", "");
    row("TCPIPx::10.0.0.1", "");
    row("TCPIP::host:::inst0", "");
    row("TCPIP::host:", "");
    row("TCPIP::two words::INSTR", "");
    row("USB::0x7fe3::0x00af::100001::INSTR", "USB0::0x7FE3::0x00AF::100001::INSTR");
    row("USB0::32739::175::100001", "USB0::0x7FE3::0x00AF::100001::INSTR");
    row("USB1::0x7FE3::0xAF::A/1::2::INSTR", "USB1::0x7FE3::0x00AF::A/1::2::INSTR");
    row("USB0::0x17FE3::0xAF::1::INSTR", "");
    row("USB0::0x7FE3::0xAF::INSTR", "");
    row("USB0::0x7FE3::0xAF::1::256::INSTR", "");
    row("GPIB::28", "GPIB0::28::INSTR");
    row("GPIB1::5::96::INSTR", "GPIB1::5::96::INSTR");
    row("GPIB0::31::INSTR", "");
    row("GPIB0::-1::INSTR", "");
    row("GPIB0::INSTR", "");
    row("ASRL1::INSTR", "");
    // 255 characters in full, which fit a buffer of 256, and one more.
    const QByteArray host(255 - 8 - 14, 'h');
    QTest::newRow("longest") << QString("TCPIP::" + host)
                             << QString("TCPIP0::" + host + "::inst0::INSTR");
    QTest::newRow("too long") << QString("TCPIP::" + host + "h") << QString();
    row("", "");
    row("::", "");
}

void TestVisaText::resourceNames()
{
    QFETCH(QString, text);
    QFETCH(QString, fullText);
    const auto name = parseResourceName(text.toStdString());
    QCOMPARE(name ? QString::fromStdString(resourceText(*name)) : QString(), fullText);
    if (name)
        QVERIFY2(parseResourceName(resourceText(*name)) == name,
                 "full form means another resource");
}

void TestVisaText::findExpressions_data()
{
    QTest::addColumn<QString>("expression");
    QTest::addColumn<QString>("text");
    QTest::addColumn<int>("result"); // 1 match, 0 none, -1 refused

    const auto row = [](const char *expression, const char *text, int result) {
        QTest::addRow("%s on %s", expression, text) << expression << text << result;
    };
    const char *gpib = "GPIB0::28::INSTR";
    const char *usb = "USB0::0x7FE3::0x00AF::100001::INSTR";
    const char *lan = "TCPIP0::10.0.0.1::inst0::INSTR";
    const char *raw = "TCPIP0::10.0.0.1::5025::SOCKET";
    row("?*", raw, 1);
    row("?*INSTR", gpib, 1);
    row("?*INSTR", raw, 0);
    row("GPIB?*INSTR", gpib, 1);
    row("GPIB?*INSTR", usb, 0);
    row("gpib?*instr", gpib, 1);
    row("USB[0-9]::0x7FE3::?*INSTR", usb, 1);
    row("USB[1-9]::0x7FE3::?*INSTR", usb, 0);
    row("USB[0-9]::0x7FE4::?*INSTR", usb, 0);
    row("USB[0-9]*::0x7fe3::?*", usb, 1);
    row("GPIB[^0]::?*", gpib, 0);
    row("GPIB[^1-9]::?*", gpib, 1);
    row("GPIB[a-z]?*", "GPIBX::1::INSTR", 1);
    row("GPIB0::2?::INSTR", gpib, 1);
    row("GPIB0::2?::INSTR", "GPIB0::2::INSTR", 0);
    row("GPIB0::28::INS", gpib, 0);
    row("PIB0::28::INSTR", gpib, 0);
    row("?*::28::?*|?*::SOCKET", raw, 1);
    row("?*::28::?*|?*::SOCKET", lan, 0);
    row("(GPIB|TCPIP)[0-9]+::?*INSTR", lan, 1);
    row("(GPIB|TCPIP)[0-9]+::?*INSTR", usb, 0);
    row("GPIB0::[0-9]+::INSTR", gpib, 1);
    row("GPIB0::28[0-9]+::INSTR", gpib, 0);
    row("GPIB0::28[0-9]*::INSTR", gpib, 1);
    row("TCPIP0::10\\.0\\.0\\.1::?*", lan, 1);
    row("a\\?b", "a?b", 1);
    row("a\\?b", "axb", 0);
    row("[\\]\\-]", "-", 1);
    row("(ab)+", "ababab", 1);
    row("(ab)+", "ababa", 0);
    row("(ab)*c", "c", 1);
    row("", gpib, -1);
    row("*", gpib, -1);
    row("a||b", gpib, -1);
    row("(GPIB", gpib, -1);
    row("GPIB)", gpib, -1);
    row("[0-9", gpib, -1);
    row("[]", gpib, -1);
    row("[9-0]", gpib, -1);
    row("GPIB\\", gpib, -1);
    row("?*{VI_ATTR_INTF_NUM == 0}", gpib, -1);
}

void TestVisaText::findExpressions()
{
    QFETCH(QString, expression);
    QFETCH(QString, text);
    QFETCH(int, result);
    const auto pattern = FindExpression::parse(expression.toStdString());
    QCOMPARE(pattern ? int{pattern->matches(text.toStdString())} : -1, result);
}

void TestVisaText::nestedRepetitionsEnd()
{
    // Takes more than 2^200 steps for a matcher that tries one way after the other.
    const auto pattern = FindExpression::parse("((((((a*)*b?)*)+a*)*)*)+c");
    QVERIFY(pattern);
    QElapsedTimer timer;
    timer.start();
    QVERIFY(!pattern->matches(std::string(200, 'a')));
    QVERIFY2(timer.elapsed() < 2000, "nested repetitions take too long");
}

void TestVisaText::formats_data()
{
    QTest::addColumn<QByteArray>("format");
    QTest::addColumn<QByteArrayList>("messages");
    QTest::addColumn<bool>("isValid");

    const auto row = [](const char *name, const char *format, const QByteArrayList &messages,
                        bool isValid = true) {
        QTest::newRow(name) << QByteArray(format) << messages << isValid;
    };
    row("plain", "*IDN?", {"*IDN?"});
    row("empty", "", {});
    row("percent", "LEV 50%%;FREQ 1", {"LEV 50%;FREQ 1"});
    row("string conversion", ":MMEM:CAT? '%s'", {}, false);
    row("number conversion", "FREQ %d", {}, false);
    row("conversion after text", "abc%%%f", {}, false);
    row("lone percent", "100%", {}, false);
    row("real line feed", "*CLS\n*IDN?", {"*CLS\n", "*IDN?"});
    row("escaped line feed", "*CLS\\n*IDN?\\r\\n", {"*CLS\n", "*IDN?\r\n"});
    row("tab, quote, backslash", "a\\tb\\\"c\\\\d", {"a\tb\"c\\d"});
    row("octal", "\\101\\60\\0122", {"A0\n", "2"});
    row("unknown escape", "D:\\waves", {"D:\\waves"});
    row("backslash last", "D:\\", {"D:\\"});
    // Folders named new, temp and 101 on an instrument with drive letters.
    row("path in apostrophes", ":MMEM:CAT? 'D:\\new\\temp\\101'",
        {":MMEM:CAT? 'D:\\new\\temp\\101'"});
    row("path in quotes", ":MMEM:CAT? \"D:\\new\\\";*OPC?\\n",
        {":MMEM:CAT? \"D:\\new\\\";*OPC?\n"});
    row("lone apostrophe", "it's\\n", {"it's\n"});
    row("percent in a string", ":MMEM:CAT? '50%'", {}, false);
}

void TestVisaText::formats()
{
    QFETCH(QByteArray, format);
    QFETCH(QByteArrayList, messages);
    QFETCH(bool, isValid);
    const auto result = formatMessages(std::string_view(format.data(), std::size_t(format.size())));
    QCOMPARE(result.has_value(), isValid);
    QByteArrayList actual;
    if (result) {
        for (const std::string &message : *result)
            actual << QByteArray::fromStdString(message);
    }
    QCOMPARE(actual, messages);
}

void TestVisaText::configuration()
{
    const char *text = "; bench 3\r\n"
                       "[General]\n open_timeout_ms = 750 \n\n"
                       "[GPIB1]\nhost=gate.lab\nport = 9010\t; of the gateway\n"
                       "interface = hpib7\naddresses = 28, 5,20-22 , 5\n"
                       "# the other one\n[gpib]\nHOST = 10.0.0.9\n"
                       "[TCPIP1::127.0.0.1]\nport=0x2000\n"
                       "[TCPIP::127.0.0.1::5025::SOCKET]";
    std::string error;
    const auto result = parseConfiguration(text, error);
    QVERIFY2(result, error.c_str());
    QCOMPARE(result->openTimeoutMs, 750U);
    QCOMPARE(result->gateways.size(), std::size_t{2});
    const Gateway &gateway = result->gateways.at(1);
    QCOMPARE(gateway.host, std::string("gate.lab"));
    QCOMPARE(gateway.port, ViUInt16{9010});
    QCOMPARE(gateway.interface, std::string("hpib7"));
    QCOMPARE(gateway.addresses, (std::vector<ViUInt16>{5, 20, 21, 22, 28}));
    QCOMPARE(result->gateways.at(0).interface, std::string("gpib0"));
    QCOMPARE(result->gateways.at(0).port, ViUInt16{0});
    QCOMPARE(result->instruments.size(), std::size_t{2});
    QCOMPARE(result->fixedPort(*parseResourceName("TCPIP1::127.0.0.1::inst0::INSTR")), 0x2000);
    QCOMPARE(result->fixedPort(*parseResourceName("TCPIP0::127.0.0.1::inst0::INSTR")), 0);
}

void TestVisaText::configurationErrors_data()
{
    QTest::addColumn<QString>("text");
    QTest::addColumn<QString>("error");

    const auto row = [](const char *text, const char *error) {
        QTest::newRow(error) << text << error;
    };
    row("port = 1", "line 1: 'port = 1' stands before the first section.");
    row("[GPIB0]\nhost = a\nport = 99999", "line 3: port '99999' is not 1 to 65535.");
    row("[GPIB0]\nhost = a\nport = 0", "line 3: port '0' is not 1 to 65535.");
    row("[GPIB0]\nport = 1\n[general]", "line 3: section 'GPIB0' names no host.");
    row("[GPIB0]\nport = 1", "line 2: section 'GPIB0' names no host.");
    row("[GPIB0]\nhost=a\naddresses = 5-31",
        "line 3: addresses '5-31' are no list of 0 to 30 such as '5, 20-22'.");
    row("[GPIB0]\nhost=a\naddresses = 9-5",
        "line 3: addresses '9-5' are no list of 0 to 30 such as '5, 20-22'.");
    row("[GPIB0]\nhost=a\n[GPIB]\nhost=b", "line 3: section 'GPIB' stands twice.");
    row("[GPIBX]", "line 1: 'GPIBX' is no GPIB board such as 'GPIB0'.");
    row("[USB0::1::2::3]",
        "line 1: section 'USB0::1::2::3' is none of 'general', a GPIB board such "
        "as 'GPIB0' or a TCPIP resource.");
    row("[general", "line 1: '[general' lacks its closing bracket.");
    row("[general]\nopen_timeout_ms = -1", "line 2: open time-out '-1' is not 1 to 600000 ms.");
    row("[general]\ntimeout = 1",
        "line 2: key 'TIMEOUT' of section 'general' is not allowed; 'open_timeout_ms' would be.");
    row("[general]\nword", "line 2: 'word' is neither a [section] nor a key = value.");
    row("[TCPIP::a::1::SOCKET]\nport = 1", "line 2: key 'PORT' of section 'TCPIP::a::1::SOCKET' is "
                                           "not allowed; 'port' of an INSTR resource would be.");
}

void TestVisaText::configurationErrors()
{
    QFETCH(QString, text);
    QFETCH(QString, error);
    std::string actual;
    QVERIFY(!parseConfiguration(text.toStdString(), actual));
    QCOMPARE(QString::fromStdString(actual), error);
}

void TestVisaText::configurationFile()
{
    const QTemporaryDir folder;
    const QString path = folder.filePath("corvane-visa.ini");
    std::string error;

    qunsetenv("CORVANE_VISA_CONFIG");
    qputenv("XDG_CONFIG_HOME", folder.path().toUtf8());
    QVERIFY2(loadConfiguration(error), "a missing default file is no fault");

    QFile file(path);
    QVERIFY(file.open(QIODevice::WriteOnly));
    file.write("[GPIB3]\nhost = here\n");
    file.close();
    auto configuration = loadConfiguration(error);
    QVERIFY(configuration);
    QVERIFY2(configuration->gateways.contains(3), "the default file was not read");

    qputenv("CORVANE_VISA_CONFIG", "/nowhere/visa.ini");
    QVERIFY(!loadConfiguration(error));
    QCOMPARE(error, std::string("The configuration file '/nowhere/visa.ini' cannot be read."));

    qputenv("CORVANE_VISA_CONFIG", folder.path().toUtf8());
    QVERIFY2(!loadConfiguration(error), "a folder was taken for a file");

    QVERIFY(file.open(QIODevice::WriteOnly));
    file.write(QByteArray(2 << 20, ';'));
    file.close();
    qputenv("CORVANE_VISA_CONFIG", path.toUtf8());
    QVERIFY(!loadConfiguration(error));
    QVERIFY(QString::fromStdString(error).contains("above 1 MiB"));
}

QTEST_APPLESS_MAIN(TestVisaText)
#include "tst_visa_text.moc"
