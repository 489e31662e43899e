// SPDX-License-Identifier: Apache-2.0
// Each fault of a peer at each step over each transport: the time that a call takes, and that no
// answer is ever taken for that of another question, by then or afterwards.
#include "FaultyRoad.h"

#include "instrument/RemoteFileEntry.h"
#include "instrument/VisaDevice.h"
#include "simulator/SimulatorProcess.h"
#include "support/files.h"
#include "support/seed.h"

#include <QDir>
#include <QElapsedTimer>
#include <QFileInfo>
#include <QTest>
#include <QThread>

#include <algorithm>
#include <array>
#include <atomic>
#include <memory>
#include <vector>

namespace {

constexpr quint32 TimeoutMs = 400;
/// One time-out, a second, and what a busy machine adds.
constexpr qint64 LongestCallMs = TimeoutMs + 1000 + 1100;
constexpr qint64 LongestOpenMs = 6000;
/// An instrument with an address of its own, and where the roads to it begin.
const char *const InstrumentHost = "127.0.0.93";
const char *const RoadHost = "127.0.0.95";

enum Transport { Gateway, Vxi11, Socket, Hislip };
/// Replies of the whole exchange at which each fault is tried.
constexpr int Steps = 5;
constexpr std::array TransportNames{"gateway", "VXI-11", "socket", "HiSLIP"};

/// A fault on a road of its own, and what came of it.
struct Case
{
    Transport transport = Gateway;
    RoadFault fault;
    QString resource;
    std::unique_ptr<FaultyRoad> road;
    QString problem;      ///< empty if all was as it should be
    bool hasCome = false; ///< two replies may come at once, so that the last have no fault

    [[nodiscard]] QString name() const
    {
        static constexpr std::array Kinds{"none", "silent", "late", "reset", "half", "flood"};
        return QString("%1, %2 at reply %3, %4 ms")
            .arg(TransportNames[transport], Kinds[fault.kind])
            .arg(fault.reply)
            .arg(fault.delay.count());
    }
};

/// What is asked in each case, over and over, and the only right answers.
class Questions
{
public:
    explicit Questions(const QString &localName)
        : m_localName(localName)
    {
    }

    static QByteArray content() { return randomBytes(5000, 3) + "\n#15\n" + randomBytes(900, 4); }

    /// Whether all answers were right or none, and in time. `answered` counts those that came.
    [[nodiscard]] QString ask(VisaDevice &device, int &answered) const
    {
        answered = 0;
        QString problem;
        timed(problem, "*IDN?", [&] {
            QString identity;
            if (device.queryText("*IDN?", identity)) {
                ++answered;
                return identity.contains("TGX-870") ? QString() : "identity " + identity;
            }
            return QString();
        });
        for (const auto &[folder, names] :
             {std::pair{"/var/few", QStringList{"a.wv"}}, {"/var/two", {"b.wv", "c.wv"}}}) {
            timed(problem, folder, [&] {
                QList<RemoteFileEntry> entries;
                if (!device.listDirectory(entries, folder)) {
                    return QString();
                }
                ++answered;
                QStringList found;
                for (const RemoteFileEntry &entry : entries) {
                    found.append(entry.name);
                }
                found.sort();
                return found == names ? QString() : QString(folder) + " holds " + found.join(' ');
            });
        }
        timed(problem, "get", [&] {
            if (!device.readRemoteFile("/var/few/a.wv", m_localName)) {
                return QString();
            }
            ++answered;
            return load(m_localName) == content() ? QString() : QString("other bytes");
        });
        return problem;
    }

    static constexpr int Count = 4;

private:
    template <typename Call>
    static void timed(QString &problem, const char *name, Call call)
    {
        QElapsedTimer timer;
        timer.start();
        const QString wrong = call();
        if (!wrong.isEmpty()) {
            problem += wrong + "; ";
        }
        if (timer.elapsed() > LongestCallMs) {
            problem += QString("%1 took %2 ms; ").arg(name).arg(timer.elapsed());
        }
    }

    QString m_localName;
};

void run(Case &test, const Questions &questions)
{
    VisaDevice device;
    int answered = 0;
    if (!device.openResource(test.resource)) {
        test.problem = "doesn't open";
        return;
    }
    device.setTimeoutMs(TimeoutMs);
    test.road->arm(test.fault);
    test.problem = questions.ask(device, answered);
    test.hasCome = test.road->replyCount() > test.fault.reply;
    test.road->heal();
    test.problem += questions.ask(device, answered);
    QElapsedTimer timer;
    timer.start();
    device.closeResource();
    if (timer.elapsed() > LongestCallMs) {
        test.problem += QString("closing took %1 ms; ").arg(timer.elapsed());
    }
    timer.start();
    if (!device.openResource(test.resource) || timer.elapsed() > LongestOpenMs) {
        test.problem += QString("not open anew after %1 ms; ").arg(timer.elapsed());
    }
    test.problem += questions.ask(device, answered);
    if (answered != Questions::Count) {
        test.problem += "not all well after opening anew; ";
    }
}

} // namespace

class TestPeerFaults : public QObject
{
    Q_OBJECT
private slots:
    void initTestCase();
    void matrix();
    void wrongLength();
    void tenThousandEntries();

private:
    void addCases(Transport transport, const std::string &address, quint16 port);

    QTemporaryDir m_folder;
    SimulatorProcess m_simulator;
    SimulatorProcess m_network;                 // the same files, at an address of its own
    std::unique_ptr<ScriptedPeer> m_portMapper; // only there to be reached
    std::unique_ptr<ScriptedPeer> m_socket;
    std::vector<std::unique_ptr<Case>> m_cases;
    QByteArray m_config;
};

void TestPeerFaults::initTestCase()
{
    const QString instrument = "root=%ROOT%\ngateway=0\ngpib=28\n";
    QVERIFY2(m_simulator.startConfig("[a]\n" + instrument), qPrintable(m_simulator.errorOutput()));
    for (const auto &[name, bytes] :
         {std::pair{"few/a.wv", Questions::content()}, {"two/b.wv", "b"}, {"two/c.wv", "c"}}) {
        const QString path = m_simulator.root() + "/var/" + name;
        QVERIFY(QDir().mkpath(QFileInfo(path).path()) && store(path, bytes));
    }
    constexpr int ManyCount = 10'000;
    QVERIFY(QDir().mkpath(m_simulator.root() + "/var/many"));
    for (int i = 0; i < ManyCount; ++i) {
        QVERIFY(store(m_simulator.root() + QString("/var/many/waveform-%1.wv").arg(i), "x"));
    }
    addCases(Gateway, "127.0.0.1", m_simulator.gatewayPort());
    addCases(Vxi11, "127.0.0.1", m_simulator.gatewayPort());
    // The ports that must answer beside that of a road need special rights, and so do those of an
    // instrument with an address of its own.
    const auto hangUp = [](PeerConnection &) {};
    m_portMapper = std::make_unique<ScriptedPeer>(hangUp, RoadHost, 111);
    m_socket = std::make_unique<ScriptedPeer>(hangUp, RoadHost, 5025);
    if (m_portMapper->port() == 0 || m_socket->port() == 0 ||
        !m_network.start({"--address", InstrumentHost, "--root", m_simulator.root()})) {
        qWarning("Sockets and HiSLIP are left out: their ports need special rights here.");
    } else {
        addCases(Socket, InstrumentHost, 5025);
        addCases(Hislip, InstrumentHost, 4880);
    }
    const QString config = m_folder.filePath("visa.ini");
    QVERIFY(store(config, m_config));
    qputenv("CORVANE_VISA_CONFIG", config.toLocal8Bit());
}

void TestPeerFaults::addCases(Transport transport, const std::string &address, quint16 port)
{
    std::vector<RoadFault> faults{{}}; // to count the replies
    for (int step = 0; step < Steps; ++step) {
        for (const RoadFault::Kind kind :
             {RoadFault::Silent, RoadFault::Reset, RoadFault::Half, RoadFault::Flood}) {
            faults.push_back({kind, step});
        }
        for (const quint32 tenths : {5U, 15U, 30U}) {
            faults.push_back(
                {RoadFault::Late, step, std::chrono::milliseconds(TimeoutMs * tenths / 10)});
        }
    }
    for (const RoadFault &fault : faults) {
        auto made = std::make_unique<Case>();
        made->transport = transport;
        made->fault = fault;
        made->road = std::make_unique<FaultyRoad>(RoadHost, address, port);
        const quint16 roadPort = made->road->port();
        const auto number = static_cast<int>(m_cases.size());
        switch (transport) {
        case Gateway:
            made->resource = QString("GPIB%1::28::INSTR").arg(number);
            m_config += QString("[GPIB%1]\nhost=%2\nport=%3\n")
                            .arg(number)
                            .arg(RoadHost)
                            .arg(roadPort)
                            .toLatin1();
            break;
        case Vxi11:
            made->resource = QString("TCPIP%1::%2::gpib0,28::INSTR").arg(number).arg(RoadHost);
            m_config += QString("[%1]\nport=%2\n").arg(made->resource).arg(roadPort).toLatin1();
            break;
        case Socket:
            made->resource = QString("TCPIP0::%1::%2::SOCKET").arg(RoadHost).arg(roadPort);
            break;
        case Hislip:
            made->resource = QString("TCPIP0::%1::hislip0,%2::INSTR").arg(RoadHost).arg(roadPort);
            break;
        }
        m_cases.push_back(std::move(made));
    }
}

void TestPeerFaults::matrix()
{
    const VisaDevice keepsLibrary;
    std::array<int, TransportNames.size()> replyCounts{};
    for (const auto &test : m_cases) {
        if (test->fault.kind == RoadFault::None) {
            VisaDevice device;
            int answered = 0;
            QVERIFY2(device.openResource(test->resource), qPrintable(test->resource));
            test->road->arm({});
            const Questions questions(m_folder.filePath("probe.wv"));
            QCOMPARE(questions.ask(device, answered), QString());
            QCOMPARE(answered, Questions::Count);
            replyCounts.at(test->transport) = test->road->replyCount();
        }
    }
    // They wait most of the time.
    constexpr int ThreadCount = 40;
    std::atomic<std::size_t> next{0};
    std::vector<std::unique_ptr<QThread>> threads;
    for (int i = 0; i < ThreadCount; ++i) {
        threads.emplace_back(QThread::create([&, i] {
            const Questions questions(m_folder.filePath(QString("%1.wv").arg(i)));
            for (std::size_t k = next++; k < m_cases.size(); k = next++) {
                Case &test = *m_cases[k];
                // Spread over all replies, the first and the last among them.
                test.fault.reply =
                    test.fault.reply * (replyCounts.at(test.transport) - 1) / (Steps - 1);
                if (test.fault.kind != RoadFault::None) {
                    run(test, questions);
                }
            }
        }));
        threads.back()->start();
    }
    for (const auto &thread : threads) {
        thread->wait();
    }
    for (const auto &test : m_cases) {
        if (!test->problem.isEmpty()) {
            qWarning("%s", qPrintable(test->name() + ": " + test->problem));
        }
    }
    QVERIFY(std::ranges::all_of(m_cases, [](const auto &test) { return test->problem.isEmpty(); }));
    const auto came =
        std::ranges::count_if(m_cases, [](const auto &test) { return test->hasCome; });
    QVERIFY(came > std::ssize(m_cases) * 8 / 10);
}

void TestPeerFaults::wrongLength()
{
    for (const auto &test : m_cases) {
        if (test->fault.kind == RoadFault::None) {
            VisaDevice device;
            QVERIFY(device.openResource(test->resource));
            device.setTimeoutMs(TimeoutMs);
            QVERIFY(device.sendCommand(":SYST:FAUL 'short-block',10"));
            const Questions questions(m_folder.filePath("length.wv"));
            int answered = 0;
            QCOMPARE(questions.ask(device, answered), QString());
            QVERIFY2(answered < Questions::Count, qPrintable(test->name()));
            QVERIFY(device.sendCommand(":SYST:FAUL:CLE"));
            QCOMPARE(questions.ask(device, answered), QString());
            QCOMPARE(answered, Questions::Count);
        }
    }
}

void TestPeerFaults::tenThousandEntries()
{
    for (const auto &test : m_cases) {
        if (test->fault.kind == RoadFault::None) {
            VisaDevice device;
            QVERIFY(device.openResource(test->resource));
            QList<RemoteFileEntry> entries;
            QElapsedTimer timer;
            timer.start();
            QVERIFY(device.listDirectory(entries, "/var/many"));
            QVERIFY2(timer.elapsed() < LongestCallMs, qPrintable(test->name()));
            QCOMPARE(entries.size(), 10'000);
            int answered = 0;
            QCOMPARE(Questions(m_folder.filePath("many.wv")).ask(device, answered), QString());
            QCOMPARE(answered, Questions::Count);
        }
    }
}

QTEST_GUILESS_MAIN(TestPeerFaults)
#include "tst_peerfaults.moc"
