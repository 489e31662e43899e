// SPDX-License-Identifier: Apache-2.0
#include "simulator/ScpiFixture.h"
#include "support/rows.h"

#include <QTest>

#include <cmath>
#include <complex>
#include <cstring>
#include <numbers>

// What an analyzer records, against the formula of its description.
class TestSimulatorAnalyzer : public QObject, private ScpiFixture
{
    Q_OBJECT

private slots:
    void initTestCase();
    void capture();
    void captureFollowsSettings();
    void sweepWaitsForTrigger();
};

namespace {

constexpr int Gpib = 20;
constexpr double CarrierHz = 62.5e3;
constexpr double SpurHz = -93.75e3;

using Samples = std::vector<std::complex<double>>;

// The samples of a block of I and Q as little-endian floats.
Samples samplesOf(const QByteArray &block)
{
    const qsizetype begin = 2 + block.mid(1, 1).toInt();
    Samples samples;
    for (qsizetype place = begin; place + 8 <= block.size(); place += 8) {
        float values[2];
        std::memcpy(values, block.constData() + place, sizeof(values));
        samples.emplace_back(values[0], values[1]);
    }
    return samples;
}

// Amplitude of a tone, by correlation.
double amplitudeOf(const Samples &samples, double cyclesPerSample)
{
    std::complex<double> sum = 0;
    for (std::size_t k = 0; k < samples.size(); ++k) {
        const double phase = -2 * std::numbers::pi * cyclesPerSample * static_cast<double>(k);
        sum += samples[k] * std::polar(1.0, phase);
    }
    return std::abs(sum) / static_cast<double>(samples.size());
}

} // namespace

void TestSimulatorAnalyzer::initTestCase()
{
    QVERIFY2(m_program.startConfig("[a]\nmodel=PAX-630\nroot=%ROOT%\ngateway=0\ngpib=20\n"),
             qPrintable(m_program.errorOutput()));
}

// The whole exchange of a capture; the signal is compared with the formula of its description.
void TestSimulatorAnalyzer::capture()
{
    constexpr int Count = 4096;
    QVERIFY(connectTo(Gpib));
    for (const char *command :
         {"INST:SEL SAN; *OPC?", "TRAC:IQ:STAT ON; *OPC?", "INP:SEL RF; *OPC?",
          "TRAC:IQ:SET NORM,1e+07Hz,1.5e+06,IFP,POS,0,4096; *OPC?", "UNIT:POW DBM; *OPC?",
          "TRIG:LEV:IFP -20; *OPC?"}) {
        QCOMPARE(ask(command), "1\n");
    }
    QCOMPARE(ask("TRACE:IQ:SRATE?"), "1500000\n");
    QCOMPARE(ask("TRAC:IQ:SET?"), "NORM,10000000,1500000,IFP,POS,0,4096\n");
    QCOMPARE(ask("FREQ:CENT?;:INP:ATT?;:DISP:TRAC:Y:RLEV?"), "1000000000;10;-10\n");
    for (const char *command : {"*CLS", "*ESE 1", "INIT:IMM", "*OPC"}) {
        QCOMPARE(m_client->write(command), 0U);
    }
    QTRY_COMPARE(ask("STAT:OPER:COND?"), "0\n");
    QCOMPARE(ask("*ESR?"), "1\n");
    QCOMPARE(ask("FORM REAL,32; *OPC?"), "1\n");
    QCOMPARE(ask("TRAC:IQ:DATA:FORM IQP; *OPC?"), "1\n");
    const QByteArray answer = ask("TRAC:IQ:DATA:MEMORY?");
    QCOMPARE(answer.left(7), "#532768");
    QCOMPARE(answer.size(), 7 + Count * 8 + 1);

    double squares = 0;
    const Samples samples = samplesOf(answer);
    for (std::size_t k = 0; k < Count; ++k) {
        const double turn = 2 * std::numbers::pi * static_cast<double>(k) / 1.5e6;
        const std::complex<double> error = samples[k] -
                                           std::polar(std::pow(10, -6 / 20.0), turn * CarrierHz) -
                                           std::polar(std::pow(10, -26 / 20.0), turn * SpurHz);
        QVERIFY(std::abs(error.real()) < 0.006 && std::abs(error.imag()) < 0.006);
        squares += std::norm(error);
    }
    const double deviation = std::sqrt(squares / (2 * Count));
    QVERIFY2(std::abs(deviation / 0.001 - 1) < 0.05, qPrintable(QString::number(deviation)));

    // The same again, in parts of an odd size, and with the values in blocks or as text.
    QCOMPARE(m_client->write("TRAC:IQ:DATA:MEM? 1,100"), 0U);
    QByteArray part;
    while (!part.endsWith('\n') || part.size() < 806) {
        part += m_client->read(13).data;
    }
    QCOMPARE(part, "#3800" + answer.mid(7 + 8, 800) + '\n');
    const QByteArray pairs = answer.mid(7 + 1023 * 8, 16);
    const QByteArray blocks = ask("TRAC:IQ:DATA:FORM IQBL;MEM? 1023,2");
    QCOMPARE(blocks, "#216" + pairs.mid(0, 4) + pairs.mid(8, 4) + pairs.mid(4, 4) +
                         pairs.mid(12, 4) + '\n');
    const QByteArray text = ask("FORM ASC;:TRAC:IQ:DATA:FORM IQP;MEM? 0,1");
    QVERIFY(std::abs(text.split(',').first().toDouble() - samples[0].real()) < 1e-6);
    QCOMPARE(ask("TRAC:IQ:STAT OFF; *OPC?"), "1\n");
    QCOMPARE(errors(), "");
}

// 3000 samples at the rate and settings of a row; amplitudes of the tone above the centre, of the
// one below, and of the first one's mirror.
void TestSimulatorAnalyzer::captureFollowsSettings()
{
    const double carrier = std::pow(10, -6 / 20.0);
    forRows(
        {{"usual", "", "NORM,1e7,1e6,IMM,POS,0", 1e6, carrier, 0.0501, 0},
         {"higher rate", "", "NORM,1e7,3e6,IMM,POS,0", 3e6, carrier, 0.0501, 0},
         {"spur outside", "", "NORM,1e7,2e5,IMM,POS,0", 2e5, carrier, 0, 0},
         {"reference level", ":DISP:TRAC:Y:RLEV 10;", "NORM,1e7,1e6,IMM,POS,0", 1e6, carrier / 10,
          0.00501, 0},
         {"I/Q input", ":INP:SEL AIQ;", "NORM,1e7,1e6,IMM,POS,0", 1e6, 0, 0, 0.5},
         {"digital input", ":INP:SEL DIQ;", "NORM,1e7,1e6,IMM,POS,0", 1e6, 0.5, 0, 0},
         {"half before the trigger", "", "NORM,1e7,1e6,IFP,POS,1500", 1e6, carrier / 2, 0.025, 0},
         {"all before the edge", "", "NORM,1e7,1e6,IFP,NEG,3000", 1e6, carrier, 0.0501, 0}},
        [this](QByteArray before, QByteArray record, double rate, double above, double below,
               double mirror) {
            QVERIFY(connectTo(Gpib));
            QCOMPARE(ask(before + ":TRAC:IQ ON;IQ:SET " + record + ",3000;:INIT;*OPC?").right(2),
                     "1\n");
            const QByteArray block = ask("FORM REAL,32;:TRAC:IQ:DATA:FORM IQP;MEM?");
            const Samples samples = samplesOf(block);
            QCOMPARE(samples.size(), 3000U);
            QVERIFY(std::abs(amplitudeOf(samples, CarrierHz / rate) - above) < 0.003);
            QVERIFY(std::abs(amplitudeOf(samples, SpurHz / rate) - below) < 0.003);
            QVERIFY(std::abs(amplitudeOf(samples, -CarrierHz / rate) - mirror) < 0.003);
            QCOMPARE(errors(), "");
        });
    // Beyond the reference level the converter cuts off.
    QVERIFY(connectTo(Gpib));
    QCOMPARE(ask("DISP:TRAC:Y:RLEV -40;:TRAC:IQ ON;:INIT;*OPC?"), "1\n");
    for (const auto &sample : samplesOf(ask("FORM REAL,32;:TRAC:IQ:DATA:FORM IQP;MEM?"))) {
        QVERIFY(std::abs(sample.real()) <= 1 && std::abs(sample.imag()) <= 1);
    }
}

void TestSimulatorAnalyzer::sweepWaitsForTrigger()
{
    QVERIFY(connectTo(Gpib));
    QCOMPARE(m_client->write("TRAC:IQ ON;IQ:SET NORM,1e7,1e6,EXT,NEG,0,100;:INIT;*OPC"), 0U);
    QCOMPARE(ask("*ESR?;:STAT:OPER:COND?"), "0;32\n");
    QCOMPARE(m_client->write("ABORT"), 0U);
    QCOMPARE(ask("*ESR?;:STAT:OPER:COND?"), "1;0\n");
    QCOMPARE(ask("TRAC:IQ:DATA:MEM?;*OPC?"), "1\n");
    QCOMPARE(errors(), "-230");

    QCOMPARE(m_client->write("INIT;*OPC"), 0U);
    QCOMPARE(ask("*ESR?"), "16\n");
    QCOMPARE(m_client->generic(device_trigger), 0U);
    QTRY_COMPARE(ask("STAT:OPER:COND?"), "0\n");
    QCOMPARE(ask("*ESR?"), "1\n");

    // The carrier of -16 dBm does not reach the trigger level.
    QCOMPARE(m_client->write("TRIG:LEV:IFP -15;:TRAC:IQ:SET NORM,1e7,1e6,IFP,NEG,0,100;:INIT"), 0U);
    QCOMPARE(ask("STAT:OPER:COND?"), "32\n");

    // A sweep that takes an hour is waited for, and can be ended.
    QCOMPARE(m_client->write("ABOR;:SYST:FAUL 'slow-sweep',3600000;"
                             ":TRAC:IQ:SET NORM,1e7,1e6,IMM,POS,0,100;*CLS;:INIT;*OPC"),
             0U);
    QCOMPARE(ask("*ESR?;:STAT:OPER:COND?"), "0;8\n");
    QCOMPARE(ask("ABOR;*ESR?"), "1\n");
}

QTEST_GUILESS_MAIN(TestSimulatorAnalyzer)
#include "tst_simulatoranalyzer.moc"
