// SPDX-License-Identifier: Apache-2.0
#include "simulator/SimulatorProcess.h"
#include "simulator/Vxi11Client.h"

#include <QElapsedTimer>
#include <QFile>
#include <QFileInfo>
#include <QTest>

#include <memory>

// Each fault shows what it promises, by switch and by command.
class tst_SimulatorFaults : public QObject
{
    Q_OBJECT

private slots:
    void initTestCase();
    void init();
    void bySwitch();
    void byCommand();
    void errorAfterTransfer();
    void noTerminator();
    void shortBlock();
    void dropAfter_data();
    void dropAfter();
    void slowAnswer();
    void emptyDirectory();
    void fullQueue();
    void otherIdentity();

private:
    [[nodiscard]] QByteArray ask(const QByteArray &command) { return m_client->ask(command); }

    SimulatorProcess m_program;
    std::unique_ptr<Vxi11Client> m_client;
};

void tst_SimulatorFaults::initTestCase()
{
    QVERIFY2(m_program.startConfig("[a]\nmodel=TGX-830\ngateway=0\ngpib=1\nroot=%ROOT%\n"),
             qPrintable(m_program.errorOutput()));
}

void tst_SimulatorFaults::init()
{
    m_client = std::make_unique<Vxi11Client>();
    QVERIFY(m_client->open(m_program.gatewayPort()));
    QCOMPARE(m_client->link("gpib0,1"), 0U);
    QCOMPARE(m_client->write("SYST:FAUL:CLE;*RST;*CLS;:MMEM:DATA 'D:\\f',#210HalloHallo"), 0U);
}

void tst_SimulatorFaults::bySwitch()
{
    SimulatorProcess program;
    QVERIFY(program.startConfig("[a]\nmodel=TVX\ngateway=0\ngpib=1\nfault=queue=2,opc-zero\n"));
    Vxi11Client client;
    QVERIFY(client.open(program.gatewayPort()));
    QCOMPARE(client.link("gpib0,1"), 0U);
    QCOMPARE(client.ask("SYST:ERR:COUN?;*OPC?"), "2;0\n");
    QCOMPARE(client.ask("SYST:FAUL?"), "\"opc-zero,queue=2\"\n");
}

void tst_SimulatorFaults::byCommand()
{
    QCOMPARE(ask("SYST:FAUL 'opc-zero';*OPC?"), "0\n");
    QCOMPARE(ask("SYST:FAUL \"busy\",\"5\";FAUL 'slow-answer',1;FAUL?"),
             "\"busy=5,opc-zero,slow-answer=1\"\n");
    QCOMPARE(ask("SYST:FAUL:CLE 'busy';:SYST:FAUL?"), "\"opc-zero,slow-answer=1\"\n");
    QCOMPARE(ask("SYST:FAUL:CLE;:SYST:FAUL?;*OPC?"), "\"\";1\n");
    QCOMPARE(ask("SYST:FAUL 'fire';FAUL 'busy';FAUL 'busy','x';:SYST:ERR:COUN?"), "3\n");
}

void tst_SimulatorFaults::errorAfterTransfer()
{
    QCOMPARE(m_client->write("SYST:FAUL 'error-after-transfer'"), 0U);
    QCOMPARE(ask("MMEM:DATA? 'D:\\f'"), "#210HalloHallo\n");
    QCOMPARE(ask("SYST:ERR?;ERR?"), "-310,\"System error\";0,\"No error\"\n");
    QCOMPARE(ask("SYST:FAUL 'error-after-transfer',-254;:MMEM:DATA 'D:\\g',#15Hallo;:SYST:ERR?"),
             "-254,\"Media full\"\n");
    QCOMPARE(QFileInfo(m_program.root() + "/D:/g").size(), 5);
}

// The data's last byte then carries END, and the missing byte is no query error of the controller.
void tst_SimulatorFaults::noTerminator()
{
    QCOMPARE(m_client->write("SYST:FAUL 'no-terminator'"), 0U);
    QCOMPARE(m_client->write("MMEM:DATA? 'D:\\f'"), 0U);
    const auto part = m_client->read(14);
    QCOMPARE(part.data, "#210HalloHallo");
    QCOMPARE(part.reason, quint32{Vxi11Client::RequestCount | Vxi11Client::EndSeen});
    QCOMPARE(m_client->read(1, 20).error, 15U);
    QCOMPARE(ask("SYST:ERR?"), "0,\"No error\"\n");
}

void tst_SimulatorFaults::shortBlock()
{
    QCOMPARE(ask("SYST:FAUL 'short-block';:MMEM:DATA? 'D:\\f'"), "#210Hallo");
    QCOMPARE(ask("SYST:FAUL 'short-block',3;:MMEM:DATA? 'D:\\f'"), "#210HalloHa");
    QCOMPARE(ask("SYST:FAUL 'short-block',1000;:MMEM:DATA? 'D:\\f'"), "#210");
    QCOMPARE(m_client->read(1, 20).error, 15U);
    QCOMPARE(ask("SYST:ERR?"), "0,\"No error\"\n");
}

void tst_SimulatorFaults::dropAfter_data()
{
    QTest::addColumn<bool>("upload");
    QTest::addColumn<int>("limit");
    QTest::newRow("upload") << true << 2500;
    QTest::newRow("upload at once") << true << 0;
    QTest::newRow("download") << false << 2500;
    QTest::newRow("download at once") << false << 0;
}

void tst_SimulatorFaults::dropAfter()
{
    QFETCH(bool, upload);
    QFETCH(int, limit);
    const QByteArray data(5000, 'x');
    const QByteArray path = "'D:\\dropped'";
    if (!upload)
        QCOMPARE(ask("MMEM:DATA " + path + ",#45000" + data + ";*OPC?"), "1\n");
    QCOMPARE(m_client->write("SYST:FAUL 'drop-after'," + QByteArray::number(limit)), 0U);
    if (upload) {
        quint32 error = m_client->write("MMEM:DATA " + path + ",#45000", 0);
        for (int begin = 0; begin < data.size() && error == 0; begin += 1000)
            error = m_client->write(data.mid(begin, 1000), 0);
        QCOMPARE(error, Vxi11Client::NoReply);
        QTRY_COMPARE(QFileInfo(m_program.root() + "/D:/dropped").size(), limit);
    } else {
        qsizetype received = -6; // the block's head
        auto part = Vxi11Client::ReadResult{};
        if (m_client->write("MMEM:DATA? " + path) == 0) {
            do {
                part = m_client->read(1000);
                received += part.data.size();
            } while (part.error == 0);
        }
        QCOMPARE(part.error, Vxi11Client::NoReply);
        QVERIFY2(received <= limit, qPrintable(QString::number(received)));
    }
    // The next connection finds the instrument in order.
    init();
    QCOMPARE(ask("*OPC?;:SYST:ERR?"), "1;0,\"No error\"\n");
}

void tst_SimulatorFaults::slowAnswer()
{
    QCOMPARE(m_client->write("SYST:FAUL 'slow-answer',150"), 0U);
    QElapsedTimer timer;
    timer.start();
    QCOMPARE(m_client->write("*IDN?"), 0U);
    QCOMPARE(m_client->read(100, 10).error, 15U); // too impatient
    QVERIFY(m_client->read(100).data.startsWith("Halvorn,"));
    QVERIFY(timer.elapsed() >= 150);
    QCOMPARE(ask("SYST:ERR?"), "0,\"No error\"\n");
}

void tst_SimulatorFaults::emptyDirectory()
{
    QCOMPARE(m_client->write("MMEM:MDIR 'D:\\empty';:SYST:FAUL 'empty-dir-469'"), 0U);
    for (const char *path : {"D:\\empty", "D:\\missing", "D:\\*.none"}) {
        QCOMPARE(ask(QByteArray("MMEM:CAT? '") + path + "'"), "\n");
        QVERIFY(ask("SYST:ERR?").split(',').first().endsWith("469"));
    }
    QVERIFY(ask("MMEM:CAT? 'D:\\'").contains(",\"f,BIN,10\""));
    QCOMPARE(ask("SYST:ERR?"), "0,\"No error\"\n");
}

void tst_SimulatorFaults::fullQueue()
{
    QCOMPARE(ask("SYST:FAUL 'queue',25;:SYST:ERR:COUN?"), "25\n");
    QCOMPARE(ask("*CLS;:SYST:ERR:COUN?"), "0\n");
    QCOMPARE(m_client->write("SYST:FAUL 'queue',500"), 0U);
    const QList<QByteArray> all = ask("SYST:ERR:ALL?").trimmed().split(',');
    QCOMPARE(all.size(), 200);
    QCOMPARE(all.at(197), "\"System error\"");
    QCOMPARE(all.at(198), "-350");
}

void tst_SimulatorFaults::otherIdentity()
{
    QCOMPARE(ask("SYST:FAUL 'idn','Other,BOX,1,2';*IDN?"), "Other,BOX,1,2\n");
}

QTEST_GUILESS_MAIN(tst_SimulatorFaults)
#include "tst_simulatorfaults.moc"
