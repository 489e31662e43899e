// SPDX-License-Identifier: Apache-2.0
#include "simulator/SimulatorProcess.h"
#include "simulator/Vxi11Client.h"
#include "support/files.h"
#include "support/rows.h"
#include "support/seed.h"

#include <QFileInfo>
#include <QTest>

#include <cmath>
#include <complex>
#include <cstring>
#include <numbers>

// Commands, files, captures and faults through a gateway, which needs no special rights.
class TestSimulatorScpi : public QObject
{
    Q_OBJECT

private slots:
    void initTestCase();
    void init() { m_client = std::make_unique<Vxi11Client>(); }
    void commands();
    void statusByte();
    void answers();
    void files();
    void cutBlock();
    void lineFeedInGpibMode();
    void waveformStart();
    void capture();
    void captureFollowsSettings();
    void sweepWaitsForTrigger();
    void faultsByCommand();
    void wrongBlocks();
    void dropAfter();

private:
    [[nodiscard]] bool connectTo(int gpib);
    [[nodiscard]] QByteArray ask(const QByteArray &command) { return m_client->ask(command); }
    [[nodiscard]] QByteArray errors();
    [[nodiscard]] bool isComplete();

    SimulatorProcess m_program;
    std::unique_ptr<Vxi11Client> m_client;
    bool m_complete = false;
};

namespace {

constexpr int CoderGenerator = 28;
constexpr int DriveGenerator = 5;
constexpr int PlainGenerator = 6;
constexpr int NoFilesGenerator = 7;
constexpr int IqAnalyzer = 20;
constexpr int SteppedAnalyzer = 21;

constexpr double CarrierHz = 62.5e3;
constexpr double SpurHz = -93.75e3;

QByteArray blockHead(qsizetype size)
{
    const QByteArray count = QByteArray::number(size);
    return '#' + QByteArray::number(count.size()) + count;
}

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

void TestSimulatorScpi::initTestCase()
{
    const QString config = "[a]\nmodel=TGX-870\nroot=%ROOT%/a\ngateway=0\ngpib=28\n"
                           "[b]\nmodel=TGX-830\nroot=%ROOT%/b\ngateway=0\ngpib=5\n"
                           "[c]\nmodel=TGX-840\nroot=%ROOT%/c\ngateway=0\ngpib=6\n"
                           "[d]\nmodel=TQX-120\nserial=77\nfirmware=2.5\noptions=\n"
                           "root=%ROOT%/d\ngateway=0\ngpib=7\nfault=queue=2,opc-zero\n"
                           "[e]\nmodel=PAX-630\nroot=%ROOT%/e\ngateway=0\ngpib=20\nseed=7\n"
                           "[f]\nmodel=PAX-610\nroot=%ROOT%/f\ngateway=0\ngpib=21\n";
    QVERIFY2(m_program.startConfig(config, 6), qPrintable(m_program.errorOutput()));
    QVERIFY(m_program.ready().first().endsWith(" gpib0,28"));
    QVERIFY(m_client == nullptr);
    init();
    QVERIFY(m_client->open(m_program.gatewayPort()) && m_client->link("gpib0,7") == 0);
    QCOMPARE(ask("SYST:ERR:COUN?;*OPC?;:SYST:FAUL?;FAUL:CLE"), "2;0;\"opc-zero,queue=2\"\n");
}

bool TestSimulatorScpi::connectTo(int gpib)
{
    init();
    m_complete = false;
    return m_client->open(m_program.gatewayPort()) &&
           m_client->link(QString("gpib0,%1").arg(gpib)) == 0 &&
           m_client->write("SYST:FAUL:CLE;*RST;*CLS") == 0;
}

// The numbers of all waiting errors.
QByteArray TestSimulatorScpi::errors()
{
    QByteArray numbers;
    for (;;) {
        const QByteArray number = ask(":SYST:ERR?").split(',').first();
        if (number == "0" || number.isEmpty()) {
            return numbers.trimmed();
        }
        numbers += number + ' ';
    }
}

// Whether the bit of *OPC was seen; it is seen only once, the question stays answered.
bool TestSimulatorScpi::isComplete()
{
    m_complete = m_complete || ask("*ESR?") == "1\n";
    return m_complete;
}

void TestSimulatorScpi::commands()
{
    struct Row
    {
        const char *name; // the commands
        int gpib;
        QByteArray answer;
        QByteArray errorNumbers;
    };
    std::vector<Row> rows;
    const auto row = [&](int gpib, const char *command, const char *answer,
                         const char *numbers = "") {
        rows.push_back({command, gpib, answer, numbers});
    };
    const int gen = CoderGenerator;
    row(gen, "*IDN?", "Halvorn,TGX-870,TGX870/100001/01,1.0\n");
    row(IqAnalyzer, "*IDN?", "Halvorn,PAX-630,100005/01,1.0\n");
    row(NoFilesGenerator, "*IDN?;*OPT?", "Halvorn,TQX-120,TQX120/77/01,2.5;0\n");
    row(gen, " *TST? ;\t:SYST:VERS?\r\n", "0;1999.0\n");

    // Compound messages: common commands keep the place, a colon leaves it.
    row(gen, "SYST:ERR?;VERS?", "0,\"No error\";1999.0\n");
    row(gen, "SYST:ERR:COUN?;SYST:VERS?", "0\n", "-113");
    row(gen, "FREQ 1.5 GHz;POW -10;:FREQ?;POW?", "1500000000;-10\n");

    // An error ends its unit, not its message; the answer to *OPC? comes all the same.
    row(gen, "FOO:BAR; *OPC?", "1\n", "-113");
    row(gen, "FREQ 1 s; *OPC?", "1\n", "-131");
    row(gen, "FREQ 'x';FREQ 1,2;FREQ;FREQ FAST;*OPC?", "1\n", "-104 -108 -109 -141");
    row(gen, "*CLS?;*IDN;*OPC?", "1\n", "-113 -113");
    row(gen, "*OPC?;FREQ 'x", "1\n", "-151");
    row(gen, "SOUR2:FREQ 1;*OPC?", "1\n", "-114");
    row(gen, "FREQ #18abcdefgh;*OPC?", "1\n", "-104");
    row(gen, "*SRE 255;*SRE?;*SRE 0", "191\n");

    // Status: PON went with *CLS; each class of errors has its bit of ESR.
    row(gen, "FOO;*ESR?;*ESR?", "32;0\n", "-113");
    row(gen, "*OPC;*ESR?", "1\n");

    // Each kind of instrument has its own commands.
    row(PlainGenerator, "SOUR:BB:ARB:STAT?;*OPC?", "1\n", "-113");
    row(PlainGenerator, "SOUR:STAT?;:STAT?", "0;0\n");
    row(IqAnalyzer, "INP:ATT?;:DISP:TRAC:Y:RLEV?;:TRIG:LEV:IFP -20.5;IFP?", "10;-10;-20.5\n");
    row(IqAnalyzer, "INST:SEL SAN;SEL?;:UNIT:POW DBM;POW?;:INIT:CONT?", "SAN;DBM;1\n");
    row(SteppedAnalyzer, "INP:SEL AIQ; *OPC?", "1\n", "-200");

    // Files.
    row(NoFilesGenerator, "MMEM:CAT?", "\n", "-241");
    row(gen, "MMEM:CAT? '/var/../..'", "\n", "-257");
    row(gen, "MMEM:DEL '/var/user/none'; *OPC?", "1\n", "-256");
    row(gen, "MMEM:DATA '../x',#11x;*OPC?", "1\n", "-257");
    row(gen, "MMEM:CDIR?;CDIR '/hdd';CDIR?;:MMEM:CDIR '/none'", "\"/var/user/\";\"/hdd/\"\n",
        "-256");
    row(gen, "SOUR:BB:ARB:WAV:SEL '/var/user/none';*OPC?", "1\n", "-256");
    row(gen, "SOUR:BB:ARB:STAT ON;*OPC?", "1\n", "-221");
    row(IqAnalyzer, "TRAC:IQ:DATA:MEM?;*OPC?", "1\n", "-221");
    row(IqAnalyzer, "TRAC:IQ ON;IQ:DATA:MEM?;*OPC?", "1\n", "-230");

    row(SteppedAnalyzer, "TRAC:IQ:SRAT 1.1e6;SRAT?;SRAT 100e6;SRAT?", "1000000;32000000\n");
    row(IqAnalyzer, "TRAC:IQ:SET NORM,1e5,1e6,IMM,POS,0,3;*OPC?", "1\n", "-222");
    row(IqAnalyzer, "TRAC:IQ:SET NORM,1e7,1e6,IMM,POS,0,125000000;*OPC?", "1\n", "-222");
    forRows(rows, [this](const Row &one) {
        QVERIFY(connectTo(one.gpib));
        QCOMPARE(ask(one.name), one.answer);
        QCOMPARE(errors(), one.errorNumbers);
    });
}

void TestSimulatorScpi::statusByte()
{
    QVERIFY(connectTo(CoderGenerator));
    QCOMPARE(m_client->statusByte(), 0);
    QCOMPARE(m_client->write("*ESE 32;*SRE 32;FOO"), 0U);
    QCOMPARE(m_client->statusByte(), 4 + 32 + 64); // error queue, ESB, master summary
    QCOMPARE(m_client->write("*IDN?"), 0U);
    QCOMPARE(m_client->statusByte(), 4 + 16 + 32 + 64); // and an answer
    QCOMPARE(m_client->generic(Vxi11Client::DeviceClear), 0U);
    QCOMPARE(m_client->statusByte(), 4 + 32 + 64);
    QCOMPARE(ask("*STB?;*CLS;*STB?"), "100;0\n");
}

void TestSimulatorScpi::answers()
{
    QVERIFY(connectTo(CoderGenerator));
    QCOMPARE(m_client->write("*IDN?"), 0U);
    QCOMPARE(ask("*OPC?"), "1\n");
    QCOMPARE(errors(), "-410"); // the answer that nobody read is lost
    QCOMPARE(m_client->read(100, 20).error, 15U);
    QCOMPARE(errors(), "-420");
    QCOMPARE(m_client->write("*OPC", 0), 0U); // half a query is none yet
    QCOMPARE(m_client->read(100, 20).error, 15U);
    QCOMPARE(ask("?"), "1\n");
    QCOMPARE(errors(), "-420");

    QCOMPARE(m_client->write("*IDN?"), 0U);
    auto part = m_client->read(7);
    QCOMPARE(part.data, "Halvorn");
    QCOMPARE(part.reason, quint32{Vxi11Client::RequestCount});
    part = m_client->read(100, 1000, ',');
    QCOMPARE(part.data, ",");
    QCOMPARE(part.reason, quint32{Vxi11Client::TermCharSeen});
    part = m_client->read(100, 1000, '\n');
    QCOMPARE(part.data, "TGX-870,TGX870/100001/01,1.0\n");
    QCOMPARE(part.reason, quint32{Vxi11Client::TermCharSeen | Vxi11Client::EndSeen});
    QCOMPARE(errors(), "");
}

// As a controller moves files: header without END, pieces, END with the last; head, count, data and
// terminator are read one after the other.
void TestSimulatorScpi::files()
{
    const auto check = [this](int gpib, QByteArray path, QString place, int size, int piece) {
        const QByteArray content = randomBytes(size);
        const QByteArray head = blockHead(size);
        QVERIFY(connectTo(gpib));
        QCOMPARE(m_client->write(":MMEM:DATA '" + path + "'," + head, 0), 0U);
        for (int begin = 0; begin < size; begin += piece) {
            const bool last = begin + piece >= size;
            const quint32 flags = last ? quint32{Vxi11Client::End} : 0;
            QCOMPARE(m_client->write(content.mid(begin, piece), flags), 0U);
        }
        QCOMPARE(errors(), "");
        QVERIFY(load(m_program.root() + '/' + place) == content);

        const QByteArray name = path.mid(path.lastIndexOf(path.contains('\\') ? '\\' : '/') + 1);
        const QByteArray catalog = ask(":MMEM:CAT? '" + path + "'");
        QVERIFY2(catalog.endsWith(",\"" + name + ",BIN," + QByteArray::number(size) + "\"\n"),
                 catalog.constData());
        QCOMPARE(m_client->write(":MMEM:DATA? '" + path + "'"), 0U);
        QCOMPARE(m_client->read(2).data, head.left(2));
        QCOMPARE(m_client->read(static_cast<quint32>(head.size() - 2)).data, head.mid(2));
        QByteArray received;
        while (received.size() < size) {
            const qsizetype wanted = std::min<qsizetype>(32768, size - received.size());
            const auto part = m_client->read(static_cast<quint32>(wanted));
            QCOMPARE(part.data.size(), wanted);
            QCOMPARE(part.reason, quint32{Vxi11Client::RequestCount});
            received += part.data;
        }
        QVERIFY(received == content);
        const auto terminator = m_client->read(1);
        QCOMPARE(terminator.data, "\n");
        QCOMPARE(terminator.reason, quint32{Vxi11Client::RequestCount | Vxi11Client::EndSeen});
        QCOMPARE(ask("MMEM:DEL '" + path + "'; *OPC?"), "1\n");
        QVERIFY(!QFile::exists(m_program.root() + '/' + place));
        QCOMPARE(errors(), "");
    };
    const QByteArray disk = "/var/user/a.wv";
    forRows({{"1 byte", CoderGenerator, disk, "a/var/user/a.wv", 1, 1024},
             {"1025 bytes", CoderGenerator, disk, "a/var/user/a.wv", 1025, 1024},
             {"odd pieces", DriveGenerator, "D:\\a b,c.wv", "b/D:/a b,c.wv", 100'000, 777},
             {"disk", CoderGenerator, "/hdd/a.wv", "a/hdd/a.wv", 3'000'000, 1'000'000}},
            check);
}

// The file stays as far as it came, and the instrument takes the next command.
void TestSimulatorScpi::cutBlock()
{
    enum class Cut { End, Clear, Disconnect };
    forRows({{"END", Cut::End, 501, "-161"},
             {"clear", Cut::Clear, 500, ""},
             {"disconnect", Cut::Disconnect, 500, ""}},
            [this](Cut cut, qint64 size, QByteArray errorNumbers) {
                QVERIFY(connectTo(DriveGenerator));
                QCOMPARE(m_client->write("MMEM:DATA 'D:\\cut.wv',#41000", 0), 0U);
                QCOMPARE(m_client->write(randomBytes(500), 0), 0U);
                if (cut == Cut::End) {
                    QCOMPARE(m_client->write(" "), 0U);
                } else if (cut == Cut::Disconnect) {
                    QVERIFY(connectTo(DriveGenerator));
                } else {
                    QCOMPARE(m_client->generic(Vxi11Client::DeviceClear), 0U);
                }
                QCOMPARE(errors(), errorNumbers);
                const QString file = m_program.root() + "/b/D:/cut.wv";
                QTRY_COMPARE(QFileInfo(file).size(), size);
                QCOMPARE(ask("MMEM:DEL 'D:\\cut.wv'; *OPC?"), "1\n");
                QVERIFY(!QFile::exists(file));
            });
}

void TestSimulatorScpi::lineFeedInGpibMode()
{
    QVERIFY(connectTo(CoderGenerator));
    QCOMPARE(ask("*OPC?\n*OPC?"), "1\n");
    QCOMPARE(errors(), "-410"); // two messages
    QCOMPARE(ask(":SYST:COMM:GPIB:LTER EOI; *OPC?"), "1\n");
    QCOMPARE(ask("*OPC?\n;*OPC?"), "1;1\n");
    QCOMPARE(ask(":SYST:COMM:GPIB:LTER STAN; *OPC?;LTER?"), "1;STAN\n");
    QCOMPARE(errors(), "");
}

void TestSimulatorScpi::waveformStart()
{
    QVERIFY(connectTo(CoderGenerator));
    QCOMPARE(ask("MMEM:DATA '/var/user/run.wv',#15hello;*OPC?"), "1\n");
    QCOMPARE(m_client->write("SYST:FAUL \"busy\",3600"), 0U);
    QCOMPARE(m_client->write("SOUR:BB:ARB:WAV:SEL '/var/user/run.wv'"), 0U);
    QCOMPARE(ask("STAT:OPER:COND?;:SOUR:BB:PROG:MCOD?"), "2;0\n");
    // Loading is an overlapped operation: *OPC? has to wait for it.
    QCOMPARE(m_client->write("*OPC?"), 0U);
    QCOMPARE(m_client->read(10, 30).error, 15U);
    QCOMPARE(m_client->generic(Vxi11Client::DeviceClear), 0U);
    QCOMPARE(errors(), "");

    QCOMPARE(m_client->write("SYST:FAUL:CLE"), 0U);
    QCOMPARE(m_client->write("SOUR:BB:ARB:WAV:SEL '/var/user/run.wv'"), 0U);
    QCOMPARE(ask("SOUR:BB:ARB:STAT ON; *OPC?"), "1\n");
    QCOMPARE(ask("STAT:OPER:COND?;:SOUR:BB:PROG:MCOD?;:BB:ARB:STAT?;:BB:ARB:WAV:SEL?"),
             "0;100;1;\"/var/user/run.wv\"\n");
    QCOMPARE(errors(), "");
}

// The whole exchange of a capture; the signal is compared with the formula of its description.
void TestSimulatorScpi::capture()
{
    constexpr int Count = 4096;
    QVERIFY(connectTo(IqAnalyzer));
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
    QTRY_VERIFY(isComplete());
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
void TestSimulatorScpi::captureFollowsSettings()
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
            QVERIFY(connectTo(IqAnalyzer));
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
    QVERIFY(connectTo(IqAnalyzer));
    QCOMPARE(ask("DISP:TRAC:Y:RLEV -40;:TRAC:IQ ON;:INIT;*OPC?"), "1\n");
    for (const auto &sample : samplesOf(ask("FORM REAL,32;:TRAC:IQ:DATA:FORM IQP;MEM?"))) {
        QVERIFY(std::abs(sample.real()) <= 1 && std::abs(sample.imag()) <= 1);
    }
}

void TestSimulatorScpi::sweepWaitsForTrigger()
{
    QVERIFY(connectTo(IqAnalyzer));
    QCOMPARE(m_client->write("TRAC:IQ ON;IQ:SET NORM,1e7,1e6,EXT,NEG,0,100;:INIT;*OPC"), 0U);
    QCOMPARE(ask("*ESR?;:STAT:OPER:COND?"), "0;32\n");
    QCOMPARE(m_client->write("ABORT"), 0U);
    QCOMPARE(ask("*ESR?;:STAT:OPER:COND?"), "1;0\n");
    QCOMPARE(ask("TRAC:IQ:DATA:MEM?;*OPC?"), "1\n");
    QCOMPARE(errors(), "-230");

    QCOMPARE(m_client->write("INIT;*OPC"), 0U);
    QCOMPARE(ask("*ESR?"), "16\n");
    QCOMPARE(m_client->generic(Vxi11Client::DeviceTrigger), 0U);
    QTRY_VERIFY(isComplete());

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

void TestSimulatorScpi::faultsByCommand()
{
    QVERIFY(connectTo(DriveGenerator));
    QCOMPARE(ask("SYST:FAUL 'opc-zero';*OPC?"), "0\n");
    QCOMPARE(ask("SYST:FAUL \"busy\",\"5\";FAUL 'slow-answer',1;FAUL?"),
             "\"busy=5,opc-zero,slow-answer=1\"\n");
    QCOMPARE(ask("SYST:FAUL:CLE 'busy';:SYST:FAUL?"), "\"opc-zero,slow-answer=1\"\n");
    QCOMPARE(ask("SYST:FAUL:CLE;:SYST:FAUL?;*OPC?"), "\"\";1\n");
    QCOMPARE(ask("SYST:FAUL 'fire';FAUL 'busy';FAUL 'busy','x';:SYST:ERR:COUN?"), "3\n");
    QCOMPARE(ask("*CLS;:SYST:FAUL 'idn','Other,BOX,1,2';*IDN?"), "Other,BOX,1,2\n");
    const QList<QByteArray> all = ask("SYST:FAUL 'queue',500;:SYST:ERR:ALL?").trimmed().split(',');
    QCOMPARE(all.size(), 200);
    QCOMPARE(all.at(198), "-350");

    QVERIFY(connectTo(DriveGenerator));
    QCOMPARE(m_client->write("SYST:FAUL 'slow-answer',60"), 0U);
    QCOMPARE(m_client->write("*IDN?"), 0U);
    QCOMPARE(m_client->read(100, 10).error, 15U); // too impatient
    QVERIFY(m_client->read(100).data.startsWith("Halvorn,"));
    QCOMPARE(m_client->write("SYST:FAUL:CLE;:SYST:FAUL 'empty-dir-469';:MMEM:MDIR 'D:\\empty'"),
             0U);
    QCOMPARE(ask("MMEM:CAT? 'D:\\empty'"), "\n");
    QVERIFY(errors().endsWith("469"));
}

// What each fault makes of a block of ten bytes; the missing bytes are no error of the controller.
void TestSimulatorScpi::wrongBlocks()
{
    forRows({{"no terminator", "'no-terminator'", "#210HalloHallo", ""},
             {"half", "'short-block'", "#210Hallo", ""},
             {"three less", "'short-block',3", "#210HalloHa", ""},
             {"nothing", "'short-block',1000", "#210", ""},
             {"small", "'small-block'", "#12Ha\n", ""},
             {"long", "'long-block',2", QByteArray("#212HalloHallo\0\0\n", 17), ""},
             {"error", "'error-after-transfer'", "#210HalloHallo\n", "-310"},
             {"given error", "'error-after-transfer',-254", "#210HalloHallo\n", "-254"}},
            [this](QByteArray fault, QByteArray block, QByteArray errorNumbers) {
                QVERIFY(connectTo(DriveGenerator));
                QCOMPARE(ask("MMEM:DATA 'D:\\f',#210HalloHallo;*OPC?"), "1\n");
                QCOMPARE(ask("SYST:FAUL " + fault + ";:MMEM:DATA? 'D:\\f'"), block);
                if (!block.endsWith('\n')) {
                    QCOMPARE(m_client->read(1, 20).error, 15U);
                }
                QCOMPARE(errors(), errorNumbers);
            });
}

void TestSimulatorScpi::dropAfter()
{
    const QByteArray data(5000, 'x');
    const QByteArray path = "'D:\\dropped'";
    forRows({{"upload", true, 2500}, {"upload at once", true, 0}, {"download", false, 2500}},
            [&](bool upload, int limit) {
                QVERIFY(connectTo(DriveGenerator));
                QCOMPARE(ask("MMEM:DATA " + path + ",#45000" + data + ";*OPC?"), "1\n");
                const QByteArray fault = "SYST:FAUL 'drop-after',";
                QCOMPARE(m_client->write(fault + QByteArray::number(limit)), 0U);
                quint32 error = 0;
                if (upload) {
                    error = m_client->write("MMEM:DATA " + path + ",#45000", 0);
                    for (int begin = 0; begin < data.size() && error == 0; begin += 1000) {
                        error = m_client->write(data.mid(begin, 1000), 0);
                    }
                    const QString file = m_program.root() + "/b/D:/dropped";
                    QTRY_COMPARE(QFileInfo(file).size(), limit);
                } else {
                    qsizetype received = -6; // the block's head
                    error = m_client->write("MMEM:DATA? " + path);
                    while (error == 0) {
                        const auto part = m_client->read(1000);
                        received += part.data.size();
                        error = part.error;
                    }
                    QVERIFY2(received <= limit, qPrintable(QString::number(received)));
                }
                QCOMPARE(error, Vxi11Client::NoReply);
                // The next connection finds the instrument in order.
                QVERIFY(connectTo(DriveGenerator));
                QCOMPARE(ask("*OPC?;:SYST:ERR?"), "1;0,\"No error\"\n");
            });
}

QTEST_GUILESS_MAIN(TestSimulatorScpi)
#include "tst_simulatorscpi.moc"
