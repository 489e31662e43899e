// SPDX-License-Identifier: Apache-2.0
#include "support/files.h"
#include "support/rows.h"
#include "visa/Configuration.h"
#include "visa/FindExpression.h"
#include "visa/ResourceName.h"
#include "visa/formattext.h"
#include "visa/statustext.h"

#include <QElapsedTimer>
#include <QTest>

using namespace visa;

/// The texts that the VISA layer takes apart: resource strings, search expressions, formats and the
/// configuration file.
class TestVisaText : public QObject
{
    Q_OBJECT

private slots:
    void resourceNames();
    void findExpressions();
    void nestedRepetitionsEnd();
    void formats();
    void configuration();
    void configurationErrors();
    void configurationFile();
};

void TestVisaText::resourceNames()
{

    struct Row
    {
        const char *name;
        QString fullText;
    };
    // 255 characters in full, which fit a buffer of 256; one more is refused.
    const QByteArray longest = "TCPIP::" + QByteArray(255 - 8 - 14, 'h');
    const QByteArray tooLong = longest + 'h';
    forRows<Row>({{"TCPIP::192.168.1.5::INSTR", "TCPIP0::192.168.1.5::inst0::INSTR"},
                  {"TCPIP::box::hislip0", "TCPIP0::box::hislip0::INSTR"},
                  {"TCPIP1::box::HiSLIP1,4880::INSTR", "TCPIP1::box::HiSLIP1::INSTR"},
                  {"TCPIP::box::hislip0,5880::INSTR", "TCPIP0::box::hislip0,5880::INSTR"},
                  {"TCPIP::box::hislip0,0::INSTR", ""},
                  {"tcpip2::bench-7::inst1::instr", "TCPIP2::bench-7::inst1::INSTR"},
                  {"TCPIP0::gate::gpib0,28", "TCPIP0::gate::gpib0,28::INSTR"},
                  {"TCPIP::10.0.0.1::5025::SOCKET", "TCPIP0::10.0.0.1::5025::SOCKET"},
                  {"TCPIP::10.0.0.1::65536::SOCKET", ""},
                  {"TCPIP::[fe80::1%eth0]::INSTR", "TCPIP0::[fe80::1%eth0]::inst0::INSTR"},
                  {"TCPIP::[::1]::hislip0", "TCPIP0::[::1]::hislip0::INSTR"},
                  {"TCPIP2::[2001:db8::7]::5025::SOCKET", "TCPIP2::[2001:db8::7]::5025::SOCKET"},
                  {"TCPIP::[::1::INSTR", ""},
                  {"TCPIP::[::1]x::INSTR", ""},
                  {"TCPIP::x[::1]::INSTR", ""},
                  {"TCPIP::[]::INSTR", ""},
                  {"TCPIP::", ""},
                  {"TCPIP::::INSTR", ""},
                  {"TCPIP::two words::INSTR", ""},
                  {"USB::0x7fe3::0x00af::100001::INSTR", "USB0::0x7FE3::0x00AF::100001::INSTR"},
                  {"USB1::0x7FE3::0xAF::A/1::2::INSTR", "USB1::0x7FE3::0x00AF::A/1::2::INSTR"},
                  {"USB0::0x7FE3::0xAF::INSTR", ""},
                  {"USB0::0x7FE3::0xAF::1::256::INSTR", ""},
                  {"GPIB::28", "GPIB0::28::INSTR"},
                  {"GPIB1::5::96::INSTR", "GPIB1::5::96::INSTR"},
                  {"GPIB0::31::INSTR", ""},
                  {"ASRL1::INSTR", ""},
                  {"::", ""},
                  {longest.data(), "TCPIP0::" + longest.mid(7) + "::inst0::INSTR"},
                  {tooLong.data(), ""}},
                 [](const Row &row) {
                     const auto name = parseResourceName(row.name);
                     QCOMPARE(name ? QString::fromStdString(resourceText(*name)) : QString(),
                              row.fullText);
                     if (name) {
                         QVERIFY2(parseResourceName(resourceText(*name)) == name,
                                  "full form means another resource");
                     }
                 });
}

void TestVisaText::findExpressions()
{
    const char *gpib = "GPIB0::28::INSTR";
    const char *usb = "USB0::0x7FE3::0x00AF::100001::INSTR";
    const char *lan = "TCPIP0::10.0.0.1::inst0::INSTR";
    const char *raw = "TCPIP0::10.0.0.1::5025::SOCKET";
    struct Row
    {
        const char *name;
        QString text;
        int result;
    };
    forRows<Row>({{"?*INSTR", raw, 0},
                  {"GPIB?*INSTR", gpib, 1},
                  {"gpib?*instr", gpib, 1},
                  {"USB[0-9]::0x7FE3::?*INSTR", usb, 1},
                  {"GPIB[^0]::?*", gpib, 0},
                  {"GPIB0::2?::INSTR", "GPIB0::2::INSTR", 0},
                  {"GPIB0::28::INS", gpib, 0},
                  {"?*::28::?*|?*::SOCKET", raw, 1},
                  {"(GPIB|TCPIP)[0-9]+::?*INSTR", lan, 1},
                  {"GPIB0::28[0-9]*::INSTR", gpib, 1},
                  {"TCPIP0::10\\.0\\.0\\.1::?*", lan, 1},
                  {"a\\?b", "axb", 0},
                  {"[\\]\\-]", "-", 1},
                  {"(ab)+", "ababab", 1},
                  {"", gpib, -1},
                  {"a||b", gpib, -1},
                  {"(GPIB", gpib, -1},
                  {"GPIB)", gpib, -1},
                  {"[0-9", gpib, -1},
                  {"[9-0]", gpib, -1},
                  {"GPIB\\", gpib, -1},
                  {"?*{VI_ATTR_INTF_NUM == 0}", gpib, -1}},
                 [](const Row &row) {
                     const auto pattern = FindExpression::parse(row.name);
                     QCOMPARE(pattern ? int{pattern->matches(row.text.toStdString())} : -1,
                              row.result);
                 });
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

void TestVisaText::formats()
{

    forRows({{"plain", "*IDN?", {"*IDN?"}, true},
             {"percent", "LEV 50%%;FREQ 1", {"LEV 50%;FREQ 1"}, true},
             {"string conversion", ":MMEM:CAT? '%s'", {}, false},
             {"lone percent", "100%", {}, false},
             {"escaped line feed", "*CLS\\n*IDN?\\r\\n", {"*CLS\n", "*IDN?\r\n"}, true},
             {"octal", "\\101\\60\\0122", {"A0\n", "2"}, true},
             {"path in apostrophes",
              ":MMEM:CAT? 'D:\\new\\temp\\101'",
              {":MMEM:CAT? 'D:\\new\\temp\\101'"},
              true},
             {"lone apostrophe", "it's\\n", {"it's\n"}, true},
             {"percent in a string", ":MMEM:CAT? '50%'", {}, false}},
            [](QByteArray format, QByteArrayList messages, bool isValid) {
                const auto result =
                    formatMessages(std::string_view(format.data(), std::size_t(format.size())));
                QCOMPARE(result.has_value(), isValid);
                QByteArrayList actual;
                if (result) {
                    for (const std::string &message : *result) {
                        actual << QByteArray::fromStdString(message);
                    }
                }
                QCOMPARE(actual, messages);
            });
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

void TestVisaText::configurationErrors()
{

    forRows(
        {{"line 1: 'port = 1' stands before the first section.", "port = 1",
          "line 1: 'port = 1' stands before the first section."},
         {"line 3: port '99999' is not 1 to 65535.", "[GPIB0]\nhost = a\nport = 99999",
          "line 3: port '99999' is not 1 to 65535."},
         {"line 3: section 'GPIB0' names no host.", "[GPIB0]\nport = 1\n[general]",
          "line 3: section 'GPIB0' names no host."},
         {"line 3: addresses '9-5' are no list of 0 to 30 such as '5, 20-22'.",
          "[GPIB0]\nhost=a\naddresses = 9-5",
          "line 3: addresses '9-5' are no list of 0 to 30 such as '5, 20-22'."},
         {"line 3: section 'GPIB' stands twice.", "[GPIB0]\nhost=a\n[GPIB]\nhost=b",
          "line 3: section 'GPIB' stands twice."},
         {"line 1: section 'USB0::1::2::3' is none of 'general', a GPIB board such "
          "as 'GPIB0' or a TCPIP resource.",
          "[USB0::1::2::3]",
          "line 1: section 'USB0::1::2::3' is none of 'general', a GPIB board such "
          "as 'GPIB0' or a TCPIP resource."},
         {"line 2: key 'TIMEOUT' of section 'general' is not allowed; 'open_timeout_ms' would be.",
          "[general]\ntimeout = 1",
          "line 2: key 'TIMEOUT' of section 'general' is not allowed; 'open_timeout_ms' would be."},
         {"line 2: key 'PORT' of section 'TCPIP::a::1::SOCKET' is "
          "not allowed; 'port' of an INSTR resource would be.",
          "[TCPIP::a::1::SOCKET]\nport = 1",
          "line 2: key 'PORT' of section 'TCPIP::a::1::SOCKET' is "
          "not allowed; 'port' of an INSTR resource would be."}},
        [](QString text, QString error) {
            std::string actual;
            QVERIFY(!parseConfiguration(text.toStdString(), actual));
            QCOMPARE(QString::fromStdString(actual), error);
        });
}

void TestVisaText::configurationFile()
{
    const TestFolder folder;
    std::string error;
    qunsetenv("CORVANE_VISA_CONFIG");
    qputenv("XDG_CONFIG_HOME", folder.path().toUtf8());
    QVERIFY2(loadConfiguration(error), "a missing default file is no fault");
    QVERIFY(folder.store("corvane-visa.ini", "[GPIB3]\nhost = here\n"));
    const auto configuration = loadConfiguration(error);
    QVERIFY2(configuration && configuration->gateways.contains(3), "the default file is not read");

    QVERIFY(folder.store("large.ini", QByteArray(2 << 20, ';')));
    forRows({{"missing", "/nowhere/visa.ini", "'/nowhere/visa.ini' cannot be read."},
             {"folder", folder.path().toUtf8(), "cannot be read"},
             {"large", folder.path("large.ini").toUtf8(), "above 1 MiB"}},
            [&](QByteArray name, QString words) {
                qputenv("CORVANE_VISA_CONFIG", name);
                QVERIFY(!loadConfiguration(error));
                QVERIFY2(QString::fromStdString(error).contains(words), error.c_str());
            });
}

QTEST_APPLESS_MAIN(TestVisaText)
#include "tst_visa_text.moc"
