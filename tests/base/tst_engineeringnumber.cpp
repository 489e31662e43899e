// SPDX-License-Identifier: Apache-2.0
#include "base/EngineeringNumber.h"
#include "support/rows.h"
#include "support/seed.h"

#include <QTest>

#include <cmath>
#include <limits>

class TestEngineeringNumber : public QObject
{
    Q_OBJECT

private slots:
    void format();
    void parse();
    void stepDigit();
    void shownValueReadsBack();
};

void TestEngineeringNumber::format()
{
    forRows({{"kilo", 1500, "Hz", true, true, 0, "1.5 kHz"},
             {"exactly kilo", 1000, "Hz", true, false, 0, "1 kHz"},
             {"nothing above giga", 1e12, "Hz", true, true, 0, "1000 GHz"},
             {"a prefix without unit", 1500, "", true, true, 0, "1.5 k"},
             {"micro", 20e-6, "s", true, true, 0, "20 us"},
             {"femto keeps the factor of pico", 5e-13, "s", true, true, 0, "0.5 fs"},
             {"too small for any prefix", 9e-19, "s", true, true, 0, "0 s"},
             {"small without lower prefixes", 0.0015, "s", true, false, 0, "0.0015 s"},
             {"a minus of nothing", -1e-9, "s", true, false, 0, "0 s"},
             {"unscaled and small", 2e-19, "", false, true, 0, "0"},
             {"zeros of a whole number stay", 100, "Hz", true, true, 3, "100 Hz"},
             {"precision rounds", 1.23456, "dB", true, true, 2, "1.23 dB"},
             {"precision six by default", 1.0 / 3, "", true, false, -1, "0.333333"},
             {"milli by default", 1.0 / 3, "", true, true, 0, "333.333333 m"}},
            [](double value, const QString &unit, bool scaled, bool lower, int precision,
               const QString &text) {
                QCOMPARE(formatNumber(value, NumberFormat{unit, scaled, lower, precision}), text);
            });
}

void TestEngineeringNumber::parse()
{
    forRows({{"comma", "1,5M", "Hz", false, 1.5e6},
             {"lower prefix", "2 mHz", "Hz", true, 2e-3},
             {"no lower prefix, so mega", "2 mHz", "Hz", false, 2e6},
             {"unit in capitals", "2 MHZ", "Hz", false, 2e6},
             {"no blank", "10us", "s", true, 10e-6},
             {"no unit", "3p", "s", true, 3e-12},
             {"blanks", "  -3   dB ", "dB", true, -3},
             {"groups", "1 000 000", "Hz", false, 1e6},
             {"exponent and prefix", "1.5E-3 k", "Hz", false, 1.5},
             {"femto", "5 fHz", "Hz", true, 5e-15},
             {"tera", "1 T", "", false, 1e12},
             {"capital kilo", "5 K", "Hz", true, 5e3},
             {"any unit", "5 kg", "", false, 5e3},
             {"no digit before the point", "+.5", "", false, 0.5}},
            [](const QString &text, const QString &unit, bool lower, double value) {
                const std::optional<ParsedNumber> number = parseNumber(text, unit, lower);
                QVERIFY(number.has_value());
                QVERIFY2(std::fabs(number->value - value) <= 1e-15 * std::fabs(value),
                         qPrintable(QString::number(number->value, 'g', 17)));
            });
    for (const char *text :
         {"", "   ", "kHz", "1.2.3", "--1", "1 x", "0x10", "inf", "nan", "1e999", "1;2"}) {
        QVERIFY2(!parseNumber(text, "Hz", true).has_value(), text);
        QVERIFY2(!parseNumber(text, "Hz", false).has_value(), text);
    }
}

void TestEngineeringNumber::stepDigit()
{
    forRows(
        {// The texts are "1.234 kHz", "12 MHz" and "-120.5 Hz".
         {"a digit behind the point", 1234.0, 10.0, 3},
         {"the first digit", 1234.0, 1000.0, 0},
         {"a step of 20 stands for its decade", 1234.0, 20.0, 3},
         {"before the shown digits", 1234.0, 10'000.0, -1},
         {"before the point of a whole number", 12e6, 1e6, 1},
         {"behind a minus", -120.5, 10.0, 2},
         {"the minus is no digit", -120.5, 1000.0, -1}},
        [&](double value, double step, int position) {
            const FormattedNumber number = formatNumber(value, NumberFormat{.unit = "Hz"}, step);
            QCOMPARE(number.stepPosition, position);
        });
}

/// What a field shows it can read, within the digits that it shows.
void TestEngineeringNumber::shownValueReadsBack()
{
    std::mt19937 random = randomGenerator();
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
