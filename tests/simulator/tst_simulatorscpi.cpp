// SPDX-License-Identifier: Apache-2.0
#include "simulator/SimulatorProcess.h"
#include "simulator/Vxi11Client.h"

#include <QDir>
#include <QElapsedTimer>
#include <QFile>
#include <QRandomGenerator>
#include <QTest>

#include <cmath>
#include <cstring>
#include <numbers>

// Commands and files through a gateway, which needs no special rights.
class tst_SimulatorScpi : public QObject
{
    Q_OBJECT

private slots:
    void initTestCase();
    void init();
    void commands_data();
    void commands();
    void statusByte();
    void unreadAnswerIsLost();
    void readWithoutAnswer();
    void answerInPieces();
    void files_data();
    void files();
    void cutBlock_data();
    void cutBlock();
    void lineFeedInGpibMode();
    void waveformStart();
    void capture();
    void captureAsText();
    void sweepWaitsForTrigger();
    void sampleRateSteps();

private:
    [[nodiscard]] bool connectTo(Vxi11Client &client, int gpib);
    [[nodiscard]] QByteArray errors(Vxi11Client &client);

    /// Whether the bit of *OPC was seen; it is seen only once, the question stays answered.
    [[nodiscard]] bool isComplete(Vxi11Client &client);

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

QByteArray randomBytes(qsizetype size)
{
    QByteArray bytes((size + 3) / 4 * 4, '\0');
    QRandomGenerator generator(20240229);
    generator.fillRange(reinterpret_cast<quint32 *>(bytes.data()), bytes.size() / 4);
    bytes.truncate(size);
    return bytes;
}

QByteArray blockHead(qsizetype size)
{
    const QByteArray count = QByteArray::number(size);
    return '#' + QByteArray::number(count.size()) + count;
}

QByteArray fileContent(const QString &name)
{
    QFile file(name);
    return file.open(QIODevice::ReadOnly) ? file.readAll() : QByteArray();
}

} // namespace

void tst_SimulatorScpi::initTestCase()
{
    const QString config = "[a]\nmodel=TGX-870\nroot=%ROOT%/a\ngateway=0\ngpib=28\n"
                           "[b]\nmodel=TGX-830\nroot=%ROOT%/b\ngateway=0\ngpib=5\n"
                           "[c]\nmodel=TGX-840\nroot=%ROOT%/c\ngateway=0\ngpib=6\n"
                           "[d]\nmodel=TQX-120\nserial=77\nfirmware=2.5\noptions=\n"
                           "root=%ROOT%/d\ngateway=0\ngpib=7\n"
                           "[e]\nmodel=PAX-630\nroot=%ROOT%/e\ngateway=0\ngpib=20\nseed=7\n"
                           "[f]\nmodel=PAX-610\nroot=%ROOT%/f\ngateway=0\ngpib=21\n";
    QVERIFY2(m_program.startConfig(config, 6), qPrintable(m_program.errorOutput()));
    QVERIFY(m_program.ready().first().endsWith(" gpib0,28"));
}

void tst_SimulatorScpi::init()
{
    m_client = std::make_unique<Vxi11Client>();
    m_complete = false;
}

bool tst_SimulatorScpi::connectTo(Vxi11Client &client, int gpib)
{
    return client.open(m_program.gatewayPort()) &&
           client.link(QString("gpib0,%1").arg(gpib)) == 0 && client.write("*RST;*CLS") == 0;
}

// The numbers of all waiting errors.
QByteArray tst_SimulatorScpi::errors(Vxi11Client &client)
{
    QByteArray numbers;
    for (;;) {
        const QByteArray number = client.ask(":SYST:ERR?").split(',').first();
        if (number == "0")
            return numbers.trimmed();
        numbers += number + ' ';
    }
}

bool tst_SimulatorScpi::isComplete(Vxi11Client &client)
{
    m_complete = m_complete || client.ask("*ESR?") == "1\n";
    return m_complete;
}

void tst_SimulatorScpi::commands_data()
{
    QTest::addColumn<int>("gpib");
    QTest::addColumn<QByteArray>("command");
    QTest::addColumn<QByteArray>("answer"); // null: none comes
    QTest::addColumn<QByteArray>("errorNumbers");

    const auto row = [](int gpib, const char *command, const char *answer,
                        const char *numbers = "") {
        QTest::addRow("%d: %s", gpib, command)
            << gpib << QByteArray(command) << QByteArray(answer) << QByteArray(numbers);
    };
    const int gen = CoderGenerator;
    row(gen, "*IDN?", "Halvorn,TGX-870,TGX870/100001/01,1.0\n");
    row(gen, "*opt?", "TGX870-R16,TGX870-P9,TGX870-P10,TGX870-P13,TGX870-K1\n");
    row(IqAnalyzer, "*IDN?", "Halvorn,PAX-630,100005/01,1.0\n");
    row(NoFilesGenerator, "*IDN?;*OPT?", "Halvorn,TQX-120,TQX120/77/01,2.5;0\n");
    row(gen, " *TST? ;\t:SYST:VERS?\r\n", "0;1999.0\n");

    // Compound messages: common commands keep the place, a colon leaves it.
    row(gen, "SYST:ERR?;VERS?", "0,\"No error\";1999.0\n");
    row(gen, "SYST:ERR:COUN?;*OPC?;NEXT?", "0;1;0,\"No error\"\n");
    row(gen, "SYST:ERR:COUN?;SYST:VERS?", "0\n", "-113");
    row(gen, "FREQ 1.5 GHz;POW -10;:FREQ?;POW?", "1500000000;-10\n");
    row(gen, "FREQ? MAX;FREQ? MIN;FREQ? DEF", "6000000000;9000;1000000000\n");
    row(gen, "OUTP ON;OUTP?;OUTP 0;OUTP?", "1;0\n");

    // An error ends its unit, not its message; the answer to *OPC? comes all the same.
    row(gen, "FOO:BAR; *OPC?", "1\n", "-113");
    row(gen, "FREQ 1 s; *OPC?", "1\n", "-131");
    row(gen, "FREQ 7 GHz;*OPC?", "1\n", "-222");
    row(gen, "FREQ 'x';FREQ 1,2;FREQ;FREQ FAST;*OPC?", "1\n", "-104 -108 -109 -141");
    row(gen, "*CLS?;*IDN;*OPC?", "1\n", "-113 -113");
    row(gen, "*OPC?;FREQ 'x", "1\n", "-151");
    row(gen, "*ESE 300;*ESE?", "0\n", "-222");
    row(gen, "SOUR2:FREQ 1;*OPC?", "1\n", "-114");
    row(gen, "FREQ #18abcdefgh;*OPC?", "1\n", "-104");
    row(gen, "*SRE 255;*SRE?;*SRE 0", "191\n");

    // Status: PON went with *CLS; each class of errors has its bit of ESR.
    row(gen, "*ESR?", "0\n");
    row(gen, "FOO;*ESR?;*ESR?", "32;0\n", "-113");
    row(gen, "FREQ 0;*ESR?", "16\n", "-222");
    row(gen, "*OPC;*ESR?", "1\n");
    row(gen, "STAT:OPER:COND?;ENAB 65535;ENAB?;:STAT:PRES;OPER:ENAB?", "0;32767;0\n");

    // Each kind of instrument has its own commands.
    row(gen, "SOUR:WAV:SEL?;*OPC?", "1\n", "-113");
    row(PlainGenerator, "SOUR:BB:ARB:STAT?;*OPC?", "1\n", "-113");
    row(PlainGenerator, "SOUR:STAT?;:STAT?", "0;0\n");
    row(gen, "TRAC:IQ:STAT ON;*OPC?", "1\n", "-113");
    row(IqAnalyzer, "FREQ:CENT 2.4GHz;:FREQ:CENT?", "2400000000\n");
    row(IqAnalyzer, "INP:ATT?;:DISP:TRAC:Y:RLEV?;:TRIG:LEV:IFP -20.5;IFP?", "10;-10;-20.5\n");
    row(IqAnalyzer, "INST:SEL SAN;SEL?;:UNIT:POW DBM;POW?;:INIT:CONT?", "SAN;DBM;1\n");
    row(IqAnalyzer, "INP:SEL DIQ;SEL?;:INP:SEL AIQ;SEL?", "DIQ;AIQ\n");
    row(SteppedAnalyzer, "INP:SEL AIQ; *OPC?", "1\n", "-200");

    // Files.
    row(NoFilesGenerator, "MMEM:CAT?", "\n", "-241");
    row(gen, "MMEM:CAT? '/none'", "\n", "-256");
    row(gen, "MMEM:CAT? '/var/../..'", "\n", "-257");
    row(gen, "MMEM:DEL '/var/user/none'; *OPC?", "1\n", "-256");
    row(gen, "MMEM:DATA? '/etc/passwd';*OPC?", "1\n", "-256");
    row(gen, "MMEM:DATA 'x',5;*OPC?", "1\n", "-104");
    row(gen, "MMEM:DATA '../x',#11x;*OPC?", "1\n", "-257");
    row(gen, "MMEM:CDIR?;CDIR '/hdd';CDIR?;:MMEM:CDIR '/none'", "\"/var/user/\";\"/hdd/\"\n",
        "-256");
    row(DriveGenerator, "MMEM:MDIR 'd:/x';CAT? 'D:\\x';RDIR 'x'", nullptr);
    row(gen, "SOUR:BB:ARB:WAV:SEL '/var/user/none';*OPC?", "1\n", "-256");
    row(gen, "SOUR:BB:ARB:STAT ON;*OPC?", "1\n", "-221");
    row(IqAnalyzer, "TRAC:IQ:DATA:MEM?;*OPC?", "1\n", "-221");
    row(IqAnalyzer, "TRAC:IQ ON;IQ:DATA:MEM?;*OPC?", "1\n", "-230");
}

void tst_SimulatorScpi::commands()
{
    QFETCH(int, gpib);
    QFETCH(QByteArray, command);
    QFETCH(QByteArray, answer);
    QFETCH(QByteArray, errorNumbers);

    QVERIFY(connectTo(*m_client, gpib));
    const QByteArray got = m_client->ask(command);
    if (!answer.isNull())
        QCOMPARE(got, answer);
    QCOMPARE(errors(*m_client), errorNumbers);
}

void tst_SimulatorScpi::statusByte()
{
    QVERIFY(connectTo(*m_client, CoderGenerator));
    const auto status = [&] {
        XdrArguments arguments;
        arguments.number(m_client->linkId()).number(0).number(0).number(0);
        const auto reply =
            m_client->call(Vxi11Client::CoreProgram, Vxi11Client::DeviceReadStb, arguments.bytes());
        return reply ? static_cast<int>(reply->back()) & 0xFF : -1;
    };
    QCOMPARE(status(), 0);
    QCOMPARE(m_client->write("*ESE 32;*SRE 32;FOO"), 0U);
    QCOMPARE(status(), 4 + 32 + 64); // error queue, ESB, master summary
    QCOMPARE(m_client->write("*IDN?"), 0U);
    QCOMPARE(status(), 4 + 16 + 32 + 64); // and an answer
    QCOMPARE(m_client->generic(Vxi11Client::DeviceClear), 0U);
    QCOMPARE(status(), 4 + 32 + 64);
    QCOMPARE(m_client->ask("*STB?;*CLS;*STB?"), "100;0\n");
}

void tst_SimulatorScpi::unreadAnswerIsLost()
{
    QVERIFY(connectTo(*m_client, CoderGenerator));
    QCOMPARE(m_client->write("*IDN?"), 0U);
    QCOMPARE(m_client->ask("*OPC?"), "1\n");
    QCOMPARE(errors(*m_client), "-410");
}

void tst_SimulatorScpi::readWithoutAnswer()
{
    QVERIFY(connectTo(*m_client, CoderGenerator));
    QCOMPARE(m_client->read(100, 20).error, 15U);
    QCOMPARE(errors(*m_client), "-420");
    // Half a query is none yet.
    QCOMPARE(m_client->write("*OPC", 0), 0U);
    QCOMPARE(m_client->read(100, 20).error, 15U);
    QCOMPARE(m_client->ask("?"), "1\n");
}

void tst_SimulatorScpi::answerInPieces()
{
    QVERIFY(connectTo(*m_client, CoderGenerator));
    QCOMPARE(m_client->write("*IDN?"), 0U);
    auto part = m_client->read(7);
    QCOMPARE(part.data, "Halvorn");
    QCOMPARE(part.reason, quint32{Vxi11Client::RequestCount});
    part = m_client->read(100, 1000, ',');
    QCOMPARE(part.data, ",");
    QCOMPARE(part.reason, quint32{Vxi11Client::TermCharSeen});
    part = m_client->read(100, 1000, ',');
    QCOMPARE(part.data, "TGX-870,");
    part = m_client->read(100, 1000, '\n');
    QCOMPARE(part.data, "TGX870/100001/01,1.0\n");
    QCOMPARE(part.reason, quint32{Vxi11Client::TermCharSeen | Vxi11Client::EndSeen});
    QCOMPARE(errors(*m_client), "");
}

void tst_SimulatorScpi::files_data()
{
    QTest::addColumn<int>("gpib");
    QTest::addColumn<QByteArray>("path");
    QTest::addColumn<QString>("place");
    QTest::addColumn<int>("size");
    QTest::addColumn<int>("piece");

    const QByteArray unixPath = "/var/user/a.wv";
    QTest::newRow("1 byte") << CoderGenerator << unixPath << "a/var/user/a.wv" << 1 << 1024;
    QTest::newRow("1024 bytes") << CoderGenerator << unixPath << "a/var/user/a.wv" << 1024 << 1024;
    QTest::newRow("1025 bytes") << CoderGenerator << unixPath << "a/var/user/a.wv" << 1025 << 1024;
    QTest::newRow("odd pieces") << DriveGenerator << QByteArray("D:\\a b,c.wv") << "b/D:/a b,c.wv"
                                << 100'000 << 777;
    QTest::newRow("disk") << CoderGenerator << QByteArray("/hdd/a.wv") << "a/hdd/a.wv" << 3'000'000
                          << 1'000'000;
}

// As a controller moves files: header without END, pieces, END with the last; head, count, data and
// terminator are read one after the other.
void tst_SimulatorScpi::files()
{
    QFETCH(int, gpib);
    QFETCH(QByteArray, path);
    QFETCH(QString, place);
    QFETCH(int, size);
    QFETCH(int, piece);

    const QByteArray content = randomBytes(size);
    const QByteArray head = blockHead(size);
    QVERIFY(connectTo(*m_client, gpib));
    QCOMPARE(m_client->write(":MMEM:DATA '" + path + "'," + head, 0), 0U);
    for (int begin = 0; begin < size; begin += piece) {
        const bool last = begin + piece >= size;
        QCOMPARE(m_client->write(content.mid(begin, piece), last ? quint32{Vxi11Client::End} : 0),
                 0U);
    }
    QCOMPARE(errors(*m_client), "");
    QVERIFY(fileContent(m_program.root() + '/' + place) == content);

    const QByteArray name = path.mid(path.lastIndexOf(path.contains('\\') ? '\\' : '/') + 1);
    const QByteArray catalog = m_client->ask(":MMEM:CAT? '" + path + "'");
    QVERIFY2(catalog.endsWith(",\"" + name + ",BIN," + QByteArray::number(size) + "\"\n"),
             catalog.constData());

    QCOMPARE(m_client->write(":MMEM:DATA? '" + path + "'"), 0U);
    QCOMPARE(m_client->read(2).data, head.left(2));
    QCOMPARE(m_client->read(static_cast<quint32>(head.size() - 2)).data, head.mid(2));
    QByteArray received;
    while (received.size() < size) {
        const auto wanted =
            static_cast<quint32>(std::min<qsizetype>(32768, size - received.size()));
        const auto part = m_client->read(wanted);
        QCOMPARE(part.error, 0U);
        QCOMPARE(part.data.size(), static_cast<qsizetype>(wanted));
        QCOMPARE(part.reason, quint32{Vxi11Client::RequestCount});
        received += part.data;
    }
    QVERIFY(received == content);
    const auto terminator = m_client->read(1);
    QCOMPARE(terminator.data, "\n");
    QCOMPARE(terminator.reason, quint32{Vxi11Client::RequestCount | Vxi11Client::EndSeen});

    QCOMPARE(m_client->ask("MMEM:DEL '" + path + "'; *OPC?"), "1\n");
    QVERIFY(!QFile::exists(m_program.root() + '/' + place));
    QCOMPARE(errors(*m_client), "");
}

void tst_SimulatorScpi::cutBlock_data()
{
    QTest::addColumn<QString>("end");
    QTest::newRow("END") << "END";
    QTest::newRow("device clear") << "clear";
    QTest::newRow("disconnect") << "disconnect";
}

// The file stays as far as it came, and the instrument takes the next command.
void tst_SimulatorScpi::cutBlock()
{
    QFETCH(QString, end);
    QVERIFY(connectTo(*m_client, DriveGenerator));
    QCOMPARE(m_client->write("MMEM:DATA 'D:\\cut.wv',#41000", 0), 0U);
    QCOMPARE(m_client->write(randomBytes(500), 0), 0U);
    if (end == "END") {
        QCOMPARE(m_client->write(" "), 0U);
        QCOMPARE(errors(*m_client), "-161");
    } else if (end == "clear") {
        QCOMPARE(m_client->generic(Vxi11Client::DeviceClear), 0U);
        QCOMPARE(errors(*m_client), "");
    } else {
        init();
        QVERIFY(connectTo(*m_client, DriveGenerator));
    }
    const QString file = m_program.root() + "/b/D:/cut.wv";
    QTRY_COMPARE(QFile(file).size(), end == "END" ? 501 : 500);
    QCOMPARE(m_client->ask("MMEM:DEL 'D:\\cut.wv'; *OPC?"), "1\n");
    QVERIFY(!QFile::exists(file));
    QCOMPARE(errors(*m_client), "");
}

void tst_SimulatorScpi::lineFeedInGpibMode()
{
    QVERIFY(connectTo(*m_client, CoderGenerator));
    QCOMPARE(m_client->ask("*OPC?\n*OPC?"), "1\n");
    QCOMPARE(errors(*m_client), "-410"); // two messages
    QCOMPARE(m_client->ask(":SYST:COMM:GPIB:LTER EOI; *OPC?"), "1\n");
    QCOMPARE(m_client->ask("*OPC?\n;*OPC?"), "1;1\n");
    QCOMPARE(m_client->ask(":SYST:COMM:GPIB:LTER STAN; *OPC?;LTER?"), "1;STAN\n");
    QCOMPARE(errors(*m_client), "");
}

void tst_SimulatorScpi::waveformStart()
{
    QVERIFY(connectTo(*m_client, CoderGenerator));
    QCOMPARE(m_client->ask("MMEM:DATA '/var/user/run.wv',#15hello;*OPC?"), "1\n");
    QCOMPARE(m_client->write("SYST:FAUL \"busy\",3600"), 0U);
    QCOMPARE(m_client->write("SOUR:BB:ARB:WAV:SEL '/var/user/run.wv'"), 0U);
    QCOMPARE(m_client->ask("STAT:OPER:COND?;:SOUR:BB:PROG:MCOD?"), "2;0\n");
    // Loading is an overlapped operation: *OPC? has to wait for it.
    QCOMPARE(m_client->write("*OPC?"), 0U);
    QCOMPARE(m_client->read(10, 30).error, 15U);
    QCOMPARE(m_client->generic(Vxi11Client::DeviceClear), 0U);
    QCOMPARE(errors(*m_client), "");

    QCOMPARE(m_client->write("SYST:FAUL:CLE"), 0U);
    QCOMPARE(m_client->write("SOUR:BB:ARB:WAV:SEL '/var/user/run.wv'"), 0U);
    QCOMPARE(m_client->ask("SOUR:BB:ARB:STAT ON; *OPC?"), "1\n");
    QCOMPARE(m_client->ask("STAT:OPER:COND?;:SOUR:BB:PROG:MCOD?;:BB:ARB:STAT?;:BB:ARB:WAV:SEL?"),
             "0;100;1;\"/var/user/run.wv\"\n");
    QCOMPARE(errors(*m_client), "");
}

// The whole exchange of a capture; the signal is compared with the formula of its description.
void tst_SimulatorScpi::capture()
{
    constexpr int Samples = 4096;
    QVERIFY(connectTo(*m_client, IqAnalyzer));
    QCOMPARE(m_client->ask("INST:SEL SAN; *OPC?"), "1\n");
    QCOMPARE(m_client->ask("TRAC:IQ:STAT ON; *OPC?"), "1\n");
    QCOMPARE(m_client->ask("TRAC:IQ:SET NORM,1e+07Hz,1.5e+06,IFP,POS,0,4096; *OPC?"), "1\n");
    QCOMPARE(m_client->ask("TRACE:IQ:SRATE?"), "1500000\n");
    QCOMPARE(m_client->ask("TRAC:IQ:SET?"), "NORM,10000000,1500000,IFP,POS,0,4096\n");
    for (const char *command : {"*CLS", "*ESE 1", "INIT:IMM", "*OPC"})
        QCOMPARE(m_client->write(command), 0U);
    QTRY_VERIFY(isComplete(*m_client));
    QCOMPARE(m_client->ask("FORM REAL,32; *OPC?"), "1\n");
    QCOMPARE(m_client->ask("TRAC:IQ:DATA:FORM IQP; *OPC?"), "1\n");
    const QByteArray answer = m_client->ask("TRAC:IQ:DATA:MEMORY?");
    QCOMPARE(answer.left(7), "#532768");
    QCOMPARE(answer.size(), 7 + Samples * 8 + 1);
    QCOMPARE(m_client->ask("TRAC:IQ:STAT OFF; *OPC?"), "1\n");
    QCOMPARE(errors(*m_client), "");

    double squares = 0;
    for (qsizetype i = 0; i < Samples; ++i) {
        float values[2];
        std::memcpy(values, answer.constData() + 7 + 8 * i, sizeof(values));
        const double step = 2 * std::numbers::pi * static_cast<double>(i);
        const double errorI =
            values[0] - 0.5 * std::cos(step / 16) - 0.05 * std::cos(step * 3 / 32);
        const double errorQ =
            values[1] - 0.5 * std::sin(step / 16) + 0.05 * std::sin(step * 3 / 32);
        QVERIFY(std::abs(errorI) < 0.006 && std::abs(errorQ) < 0.006); // six deviations
        squares += errorI * errorI + errorQ * errorQ;
    }
    const double deviation = std::sqrt(squares / (2 * Samples));
    QVERIFY2(std::abs(deviation / 0.001 - 1) < 0.05, qPrintable(QString::number(deviation)));

    // The same again, in parts of an odd size and with the values in blocks.
    QCOMPARE(m_client->write("TRAC:IQ ON;IQ:SET NORM,1e7,1.5e6,IMM,POS,0,4096;:INIT;*WAI"), 0U);
    QCOMPARE(m_client->write("TRAC:IQ:DATA:MEM? 1,100"), 0U);
    QByteArray part;
    while (!part.endsWith('\n') || part.size() < 806)
        part += m_client->read(13).data;
    QCOMPARE(part, "#3800" + answer.mid(7 + 8, 800) + '\n');
    QCOMPARE(m_client->write("TRAC:IQ:DATA:FORM IQBL"), 0U);
    const QByteArray blocks = m_client->ask("TRAC:IQ:DATA:MEM? 0,2");
    const QByteArray pairs = answer.mid(7, 16);
    QCOMPARE(blocks, "#216" + pairs.mid(0, 4) + pairs.mid(8, 4) + pairs.mid(4, 4) +
                         pairs.mid(12, 4) + '\n');
}

void tst_SimulatorScpi::captureAsText()
{
    QVERIFY(connectTo(*m_client, IqAnalyzer));
    const QByteArray answer =
        m_client->ask("TRAC:IQ ON;IQ:SET NORM,1e7,1e6,IMM,POS,0,3;DATA:FORM IQP;:TRAC:IQ:DATA?");
    const QList<QByteArray> values = answer.trimmed().split(',');
    QCOMPARE(values.size(), 6);
    QVERIFY(std::abs(values.first().toDouble() - 0.55) < 0.006);
    QCOMPARE(m_client->ask("TRAC:IQ:SET NORM,1e5,1e6,IMM,POS,0,3;*OPC?"), "1\n");
    QCOMPARE(m_client->ask("TRAC:IQ:SET NORM,1e7,1e6,IMM,POS,0,125000000;*OPC?"), "1\n");
    QCOMPARE(errors(*m_client), "-222 -222");
}

void tst_SimulatorScpi::sweepWaitsForTrigger()
{
    QVERIFY(connectTo(*m_client, IqAnalyzer));
    QCOMPARE(m_client->write("TRAC:IQ ON;IQ:SET NORM,1e7,1e6,EXT,NEG,0,100;:INIT;*OPC"), 0U);
    QCOMPARE(m_client->ask("*ESR?;:STAT:OPER:COND?"), "0;32\n");
    QCOMPARE(m_client->write("ABORT"), 0U);
    QCOMPARE(m_client->ask("*ESR?;:STAT:OPER:COND?"), "1;0\n");
    QCOMPARE(m_client->ask("TRAC:IQ:DATA:MEM?;*OPC?"), "1\n");
    QCOMPARE(errors(*m_client), "-230");

    QCOMPARE(m_client->write("INIT;*OPC"), 0U);
    QCOMPARE(m_client->ask("*ESR?"), "16\n");
    QCOMPARE(m_client->generic(Vxi11Client::DeviceTrigger), 0U);
    QTRY_VERIFY(isComplete(*m_client));

    // The carrier, 6 dB below the reference level, does not reach the trigger level.
    QCOMPARE(m_client->write("TRIG:LEV:IFP 0;:TRAC:IQ:SET NORM,1e7,1e6,IFP,NEG,0,100;:INIT"), 0U);
    QCOMPARE(m_client->ask("STAT:OPER:COND?"), "32\n");
}

void tst_SimulatorScpi::sampleRateSteps()
{
    QVERIFY(connectTo(*m_client, SteppedAnalyzer));
    QCOMPARE(m_client->ask("TRAC:IQ:SRAT 1.1e6;SRAT?"), "1000000\n");
    QCOMPARE(m_client->ask("TRAC:IQ:SRAT 100e6;SRAT?"), "32000000\n");
    QCOMPARE(m_client->ask("TRAC:IQ:SRAT 10e3;SRAT?"), "15625\n");
}

QTEST_GUILESS_MAIN(tst_SimulatorScpi)
#include "tst_simulatorscpi.moc"
