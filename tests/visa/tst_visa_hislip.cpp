// SPDX-License-Identifier: Apache-2.0
#include "ScriptedPeer.h"

#include "simulator/HislipServer.h"
#include "simulator/Instrument.h"
#include "support/rows.h"
#include "visa/HislipTransport.h"

#include <protocols/hislip.h>

#include <QCoreApplication>
#include <QElapsedTimer>
#include <QTest>

#include <memory>
#include <string>
#include <string_view>

namespace hislip = protocols::hislip;
using namespace std::string_literals;

namespace {

ViStatus ask(visa::Transport &transport, std::string_view command, ViUInt32 timeoutMs,
             std::string &answer, std::size_t room = 1024, const visa::ReadOptions &options = {})
{
    const visa::Deadline deadline = visa::Deadline::after(timeoutMs);
    std::size_t count = 0;
    const std::span bytes(reinterpret_cast<const std::uint8_t *>(command.data()), command.size());
    answer.clear();
    if (!command.empty()) {
        if (const ViStatus status = transport.write(bytes, true, deadline, count);
            status != VI_SUCCESS) {
            return status;
        }
    }
    std::vector<std::uint8_t> buffer(room);
    const ViStatus status = transport.read(buffer, options, deadline, count);
    answer.assign(buffer.begin(), buffer.begin() + static_cast<std::ptrdiff_t>(count));
    return status;
}

std::string message(std::uint8_t type, std::uint32_t parameter = 0, std::uint64_t length = 0)
{
    const auto bytes = hislip::encode({type, 0, parameter, length});
    return {bytes.begin(), bytes.end()};
}

} // namespace

class TestVisaHislip : public QObject
{
    Q_OBJECT

private slots:
    void init();
    void cleanup();
    void answersInPieces();
    void lateAnswerIsNobodys();
    void clearEndsTheWaiting();
    void largeMessages();
    void badPeers();

private:
    /// Opens the device of the simulated instrument.
    [[nodiscard]] std::unique_ptr<visa::Transport> connect(const std::string &name = "hislip0")
    {
        std::unique_ptr<visa::Transport> transport;
        m_status = visa::HislipTransport::open({m_address, 0, name}, visa::Deadline::after(2000),
                                               transport);
        return transport;
    }

    std::string m_address;
    ViStatus m_status = VI_SUCCESS;
    std::unique_ptr<simulator::Instrument> m_instrument;
    std::unique_ptr<simulator::HislipServer> m_server;
};

void TestVisaHislip::init()
{
    // Tests of several builds may run on one machine at once.
    const qint64 id = QCoreApplication::applicationPid();
    m_address = "127.77." + std::to_string(id / 250 % 250) + '.' + std::to_string(2 + id % 250);
    simulator::InstrumentSetup setup;
    setup.model = simulator::findModel("TGX-870");
    setup.serial = "100001";
    setup.firmware = "1.0";
    m_instrument = std::make_unique<simulator::Instrument>(std::move(setup));
    m_server = std::make_unique<simulator::HislipServer>();
    std::string error;
    QVERIFY2(m_instrument->start(error) && m_server->open(m_address, error), error.c_str());
    m_server->start(*m_instrument, "test");
}

void TestVisaHislip::cleanup()
{
    m_instrument->stop();
    m_server.reset();
    m_instrument.reset();
}

void TestVisaHislip::answersInPieces()
{
    const auto transport = connect();
    QCOMPARE(m_status, VI_SUCCESS);
    std::string answer;
    QCOMPARE(ask(*transport, "*OPC?", 1000, answer), VI_SUCCESS);
    QCOMPARE(answer, "1\n"s);
    QCOMPARE(ask(*transport, "*IDN?", 1000, answer, 7), VI_SUCCESS_MAX_CNT);
    QCOMPARE(answer, "Halvorn"s);
    QCOMPARE(ask(*transport, "", 1000, answer, 100, {.terminator = '/'}), VI_SUCCESS_TERM_CHAR);
    QCOMPARE(answer, ",TGX-870,TGX870/"s);
    // What was left of it isn't the answer to the next query.
    QCOMPARE(ask(*transport, "*OPC?", 1000, answer), VI_SUCCESS);
    QCOMPARE(answer, "1\n"s);
    QCOMPARE(transport->controlRemote(VI_GPIB_REN_ADDRESS_GTL, visa::Deadline::after(1000)),
             VI_SUCCESS);
    const auto none = connect("hislip7");
    QVERIFY(!none && m_status != VI_SUCCESS);
}

void TestVisaHislip::lateAnswerIsNobodys()
{
    const auto transport = connect();
    std::string error;
    {
        const std::lock_guard lock(m_instrument->mutex());
        QVERIFY(m_instrument->faults().set("slow-answer=300", error));
    }
    std::string answer;
    QCOMPARE(ask(*transport, "*IDN?", 100, answer), VI_ERROR_TMO);
    QCOMPARE(ask(*transport, "*OPC?", 2000, answer), VI_SUCCESS);
    QCOMPARE(answer, "1\n"s);
}

void TestVisaHislip::clearEndsTheWaiting()
{
    const auto transport = connect();
    std::string error;
    {
        const std::lock_guard lock(m_instrument->mutex());
        QVERIFY(m_instrument->faults().set("slow-answer=60000", error));
    }
    std::string answer;
    QCOMPARE(ask(*transport, "*IDN?", 50, answer), VI_ERROR_TMO);
    QElapsedTimer timer;
    timer.start();
    QCOMPARE(transport->clear(visa::Deadline::after(5000)), VI_SUCCESS);
    QVERIFY(timer.elapsed() < 1000);
    {
        const std::lock_guard lock(m_instrument->mutex());
        QVERIFY(m_instrument->faults().set("slow-answer=0", error));
    }
    QCOMPARE(ask(*transport, "*OPC?", 1000, answer), VI_SUCCESS);
    QCOMPARE(answer, "1\n"s);
}

void TestVisaHislip::largeMessages()
{
    // More than one message of the protocol in both directions.
    const auto transport = connect();
    std::string data(3'000'000, 'x');
    for (std::size_t k = 0; k < data.size(); ++k) {
        data[k] = static_cast<char>(k * k / 7);
    }
    const std::string block = "#7" + std::to_string(data.size()) + data;
    const std::string command = ":MMEM:DATA '/var/user/a.bin'," + block;
    std::size_t count = 0;
    const visa::Deadline deadline = visa::Deadline::after(10'000);
    QCOMPARE(transport->write(
                 std::span(reinterpret_cast<const std::uint8_t *>(command.data()), command.size()),
                 true, deadline, count),
             VI_SUCCESS);
    QCOMPARE(count, command.size());
    std::string answer;
    QCOMPARE(ask(*transport, ":MMEM:DATA? '/var/user/a.bin'", 10'000, answer, 4'000'000),
             VI_SUCCESS);
    QVERIFY(answer == block + '\n');
}

void TestVisaHislip::badPeers()
{
    const std::string accepted = message(hislip::InitializeResponse, 0x01000001);
    forRows({{"silent", ""s, VI_ERROR_TMO},
             {"no protocol of ours", "SSH-2.0-OpenSSH_9.2p1\r\n"s, VI_ERROR_IO},
             {"fatal", message(hislip::FatalError), VI_ERROR_RSRC_NFOUND},
             {"a payload without end", message(hislip::Data, 0, ~0ULL) + std::string(4096, 'x'),
              VI_ERROR_TMO},
             {"no second channel", accepted, VI_ERROR_TMO}},
            [](const std::string &reply, ViStatus expected) {
                const ScriptedPeer peer([&reply](PeerConnection &connection) {
                    (void)connection.receive(hislip::HeaderSize);
                    connection.send(reply);
                    connection.waitForClose();
                });
                QElapsedTimer timer;
                timer.start();
                std::unique_ptr<visa::Transport> transport;
                const ViStatus status = visa::HislipTransport::open(
                    {"127.0.0.1", peer.port(), "hislip0"}, visa::Deadline::after(300), transport);
                QCOMPARE(status, expected);
                QVERIFY(timer.elapsed() < 1300);
            });
}

QTEST_GUILESS_MAIN(TestVisaHislip)
#include "tst_visa_hislip.moc"
