// SPDX-License-Identifier: Apache-2.0
#include "view/plotscale.h"

#include <QTest>

#include <vector>

class TestPlotScale : public QObject
{
    Q_OBJECT

private slots:
    void niceStep_data();
    void niceStep();
    void powerText_data();
    void powerText();
    void powerToDbm();
    void labelStride();
};

void TestPlotScale::niceStep_data()
{
    QTest::addColumn<double>("value");
    QTest::addColumn<double>("step");
    QTest::newRow("zero") << 0.0 << 0.0;
    QTest::newRow("exact 1") << 1.0 << 1.0;
    QTest::newRow("to 2") << 1.01 << 2.0;
    QTest::newRow("exact 2") << 0.2 << 0.2;
    QTest::newRow("to 5") << 2.5e6 << 5e6;
    QTest::newRow("to 10") << 0.0051 << 0.01;
    QTest::newRow("a thousand, whose logarithm rounds") << 1000.0 << 1000.0;
    QTest::newRow("negative") << -30.0 << -50.0;
}

void TestPlotScale::niceStep()
{
    QFETCH(double, value);
    QTEST(::niceStep(value), "step");
}

void TestPlotScale::powerText_data()
{
    QTest::addColumn<double>("value");
    QTest::addColumn<bool>("relative");
    QTest::addColumn<bool>("linear");
    QTest::addColumn<QString>("text");
    QTest::newRow("dBm") << -3.456 << false << false << " -3.46 dBm";
    QTest::newRow("dB") << 12.0 << true << false << " 12.00 dB ";
    QTest::newRow("0 in dB") << 0.0 << false << false << "  0.00 dBm";
    QTest::newRow("0 in watts") << 0.0 << false << true << "";
    QTest::newRow("GW") << 2.5e9 << false << true << "  2.500 GW";
    QTest::newRow("MW, negative") << -1e6 << false << true << " -1.000 MW";
    QTest::newRow("kW") << 999999.0 << false << true << "999.999 kW";
    QTest::newRow("W") << 1.0 << false << true << "  1.000 W ";
    QTest::newRow("mW") << 0.02 << false << true << " 20.000 mW";
    QTest::newRow("pW") << 1e-12 << false << true << "  1.000 pW";
    QTest::newRow("below pW") << 9e-13 << false << true << "";
}

void TestPlotScale::powerText()
{
    QFETCH(double, value);
    QFETCH(bool, relative);
    QFETCH(bool, linear);
    QTEST(::powerText(value, relative, linear), "text");
}

void TestPlotScale::powerToDbm()
{
    QCOMPARE(::powerToDbm(0.001), 0.0);
    QCOMPARE(::powerToDbm(-1.0), 30.0);
    QCOMPARE(::powerToDbm(0.0), -60.0);

    std::vector<double> in{0, 0, 0.01, 0, 0.1};
    std::vector<double> out(in.size());
    ::powerToDbm(in, out);
    QCOMPARE(out, std::vector<double>({10, 10, 10, 10, 20}));
    QCOMPARE(in, std::vector<double>({0.01, 0.01, 0.01, 0.01, 0.1}));

    std::vector<double> silent{0, 0};
    out.resize(2);
    ::powerToDbm(silent, out);
    QCOMPARE(silent, std::vector<double>({-60, -60}));
    QCOMPARE(out[1], 47.781512503836435); // 10 log10(60) + 30
}

void TestPlotScale::labelStride()
{
    QCOMPARE(::labelStride(20, 14), 1);
    QCOMPARE(::labelStride(13, 14), 2);
    QCOMPARE(::labelStride(5, 14), 5);
    QCOMPARE(::labelStride(0, 14), 1);
}

QTEST_APPLESS_MAIN(TestPlotScale)
#include "tst_plotscale.moc"
