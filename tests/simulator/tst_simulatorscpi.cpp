// SPDX-License-Identifier: Apache-2.0
#include "simulator/ScpiFixture.h"
#include "support/files.h"
#include "support/rows.h"
#include "support/seed.h"

#include <QFile>
#include <QFileInfo>
#include <QTest>

// Commands, files and faults through a gateway, which needs no special rights.
class TestSimulatorScpi : public QObject, private ScpiFixture
{
    Q_OBJECT

private slots:
    void initTestCase();
    void commands();
    void statusByte();
    void answers();
    void files();
    void cutBlock();
    void waveformStart();
    void faultsByCommand();
    void wrongBlocks();
    void dropAfter();
};

namespace {

constexpr int CoderGenerator = 28;
constexpr int DriveGenerator = 5;
constexpr int PlainGenerator = 6;
constexpr int NoFilesGenerator = 7;
constexpr int IqAnalyzer = 20;
constexpr int SteppedAnalyzer = 21;

QByteArray blockHead(qsizetype size)
{
    const QByteArray count = QByteArray::number(size);
    return '#' + QByteArray::number(count.size()) + count;
}

} // namespace

void TestSimulatorScpi::initTestCase()
{
    const QString config = "[a]\nmodel=TGX-870\nroot=%ROOT%/a\ngateway=0\ngpib=28\n"
                           "[b]\nmodel=TGX-830\nroot=%ROOT%/b\ngateway=0\ngpib=5\n"
                           "[c]\nmodel=TGX-840\nroot=%ROOT%/c\ngateway=0\ngpib=6\n"
                           "[d]\nmodel=TQX-120\nserial=77\nfirmware=2.5\noptions=\n"
                           "root=%ROOT%/d\ngateway=0\ngpib=7\nfault=queue=2,opc-zero\n"
                           "[e]\nmodel=PAX-630\nroot=%ROOT%/e\ngateway=0\ngpib=20\n"
                           "[f]\nmodel=PAX-610\nroot=%ROOT%/f\ngateway=0\ngpib=21\n";
    QVERIFY2(m_program.startConfig(config, 6), qPrintable(m_program.errorOutput()));
    QVERIFY(m_program.ready().first().endsWith(" gpib0,28"));
    QVERIFY(open(NoFilesGenerator));
    QCOMPARE(ask("SYST:ERR:COUN?;*OPC?;:SYST:FAUL?;FAUL:CLE"), "2;0;\"opc-zero,queue=2\"\n");
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
    QCOMPARE(m_client->generic(device_clear), 0U);
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
                    QCOMPARE(m_client->generic(device_clear), 0U);
                }
                QCOMPARE(errors(), errorNumbers);
                const QString file = m_program.root() + "/b/D:/cut.wv";
                QTRY_COMPARE(QFileInfo(file).size(), size);
                QCOMPARE(ask("MMEM:DEL 'D:\\cut.wv'; *OPC?"), "1\n");
                QVERIFY(!QFile::exists(file));
            });
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
    QCOMPARE(m_client->generic(device_clear), 0U);
    QCOMPARE(errors(), "");

    QCOMPARE(m_client->write("SYST:FAUL:CLE"), 0U);
    QCOMPARE(m_client->write("SOUR:BB:ARB:WAV:SEL '/var/user/run.wv'"), 0U);
    QCOMPARE(ask("SOUR:BB:ARB:STAT ON; *OPC?"), "1\n");
    QCOMPARE(ask("STAT:OPER:COND?;:SOUR:BB:PROG:MCOD?;:BB:ARB:STAT?;:BB:ARB:WAV:SEL?"),
             "0;100;1;\"/var/user/run.wv\"\n");
    QCOMPARE(errors(), "");
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
