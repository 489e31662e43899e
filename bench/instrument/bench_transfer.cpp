// SPDX-License-Identifier: Apache-2.0
// Files to and from a simulated instrument over loopback, beside two limits for the same blocks:
// the bare calls of the VISA layer with the data in memory, and bare round trips over TCP of
// requests and replies as large as those of VXI-11; over HiSLIP beside a plain copy of the file
// through a socket. HiSLIP, and networks with longer round trips, only where the ports 111, 4880
// and 5025 may be opened, as in a namespace: unshare -Urn sh -c "ip link set lo up;
// bench_transfer".
#include "DelayedRoad.h"
#include "RoundTripPeer.h"
#include "SocketCopy.h"

#include "instrument/VisaDevice.h"
#include "simulator/SimulatorProcess.h"
#include "streams/TempStream.h"
#include "visa/visa.h"

#include <QCoreApplication>
#include <QFile>
#include <QTemporaryDir>

#include <benchmark/benchmark.h>

#include <algorithm>
#include <array>
#include <chrono>
#include <memory>
#include <string>
#include <vector>

namespace {

constexpr int Repetitions = 7;
constexpr qint64 FileBytes = 50'000'000;
constexpr ViUInt32 WriteBlock = 1024;
constexpr ViUInt32 ReadBlock = 32768;
const char *const Resource = "GPIB0::28::INSTR";
/// Blocks on a network.
constexpr ViUInt32 NetworkBlock = 64 * 1024;
/// The simulator itself, and where a slower road to it begins.
constexpr std::array NetworkHosts{"127.0.0.1", "127.0.0.3"};
const char *const HislipHost = "127.0.0.4";
const char *const HislipResource = "TCPIP0::127.0.0.4::hislip0::INSTR";
const QString RemoteName = "/var/user/bench.wv";

/// Record mark, RPC header and parameters of device_write and device_read, and of their replies.
constexpr std::size_t WriteCallBytes = 4 + 40 + 20;
constexpr std::size_t WriteReplyBytes = 4 + 24 + 8;
constexpr std::size_t ReadCallBytes = 4 + 40 + 24;
constexpr std::size_t ReadReplyBytes = 4 + 24 + 12;

QTemporaryDir *folder = nullptr;

QString localName()
{
    return folder->filePath("local.wv");
}

void countBytes(benchmark::State &state)
{
    state.SetBytesProcessed(state.iterations() * FileBytes);
}

bool openDevice(benchmark::State &state, VisaDevice &device, const char *resource = Resource)
{
    const bool isOpen = device.openResource(resource);
    if (!isOpen) {
        state.SkipWithError("cannot open the simulated instrument");
    }
    return isOpen;
}

void put(benchmark::State &state, const char *resource)
{
    VisaDevice device;
    if (!openDevice(state, device, resource)) {
        return;
    }
    for (auto _ : state) {
        if (!device.writeRemoteFile(localName(), RemoteName)) {
            state.SkipWithError("put failed");
            return;
        }
    }
    countBytes(state);
}

void get(benchmark::State &state, const char *resource)
{
    VisaDevice device;
    if (!openDevice(state, device, resource) || !device.writeRemoteFile(localName(), RemoteName)) {
        return;
    }
    const QString backName = folder->filePath("back.wv");
    for (auto _ : state) {
        state.PauseTiming();
        QFile::remove(backName);
        state.ResumeTiming();
        if (!device.readRemoteFile(RemoteName, backName)) {
            state.SkipWithError("get failed");
            return;
        }
    }
    countBytes(state);
}

/// As a capture takes its samples: in small pieces, into a stream on the temporary disk.
void getStream(benchmark::State &state)
{
    VisaDevice device;
    if (!openDevice(state, device, Resource) || !device.writeRemoteFile(localName(), RemoteName)) {
        return;
    }
    for (auto _ : state) {
        TempStream stream;
        if (!stream.open() || !device.sendCommand(":MMEM:DATA? '" + RemoteName + "'") ||
            !device.readBinaryBlock(stream.stream(), FileBytes)) {
            state.SkipWithError("reading the block failed");
            return;
        }
    }
    countBytes(state);
}

/// Files over a bare TCP connection, which is all that HiSLIP needs of the network.
void socketPut(benchmark::State &state)
{
    SocketCopy copy(folder->filePath("far.wv"));
    bool done = true;
    for (auto _ : state) {
        done = done && copy.put(localName());
    }
    if (!done) {
        state.SkipWithError("copy failed");
    }
    countBytes(state);
}

void socketGet(benchmark::State &state)
{
    SocketCopy copy(folder->filePath("far.wv"));
    bool done = copy.put(localName());
    const QString backName = folder->filePath("back.wv");
    for (auto _ : state) {
        state.PauseTiming();
        QFile::remove(backName);
        state.ResumeTiming();
        done = done && copy.get(backName);
    }
    if (!done) {
        state.SkipWithError("copy failed");
    }
    countBytes(state);
}

/// A session of the VISA layer alone.
class BareSession
{
public:
    explicit BareSession(const char *resource = Resource)
    {
        viOpenDefaultRM(&m_manager);
        m_isOpen = viOpen(m_manager, resource, VI_NO_LOCK, 0, &m_session) == VI_SUCCESS;
        viSetAttribute(m_session, VI_ATTR_TMO_VALUE, 5000);
    }
    ~BareSession() { viClose(m_manager); }
    BareSession(const BareSession &) = delete;
    BareSession &operator=(const BareSession &) = delete;

    [[nodiscard]] bool isOpen() const { return m_isOpen; }

    [[nodiscard]] bool write(const char *bytes, ViUInt32 count, bool end) const
    {
        ViUInt32 written = 0;
        viSetAttribute(m_session, VI_ATTR_SEND_END_EN, end ? VI_TRUE : VI_FALSE);
        return send(bytes, count, written) && written == count;
    }

    /// Without a change of END.
    [[nodiscard]] bool send(const char *bytes, ViUInt32 count, ViUInt32 &written) const
    {
        return viWrite(m_session, reinterpret_cast<const ViByte *>(bytes), count, &written) ==
               VI_SUCCESS;
    }

    [[nodiscard]] bool read(std::vector<char> &buffer, ViUInt32 count, ViUInt32 &received) const
    {
        return viRead(m_session, reinterpret_cast<ViByte *>(buffer.data()), count, &received) >=
               VI_SUCCESS;
    }

private:
    ViSession m_manager = VI_NULL;
    ViSession m_session = VI_NULL;
    bool m_isOpen = false;
};

void bareWrites(benchmark::State &state, const char *resource, ViUInt32 blockBytes)
{
    const BareSession session(resource);
    const std::string head = ":MMEM:DATA '/var/user/bench.wv',#8" + std::to_string(FileBytes);
    const std::vector<char> block(blockBytes);
    bool done = session.isOpen();
    for (auto _ : state) {
        done = done && session.write(head.data(), static_cast<ViUInt32>(head.size()), false);
        ViUInt32 written = 0;
        qint64 remaining = FileBytes;
        for (; done && remaining > blockBytes; remaining -= blockBytes) {
            done = session.send(block.data(), blockBytes, written);
        }
        done = done && session.write(block.data(), static_cast<ViUInt32>(remaining), true);
    }
    if (!done) {
        state.SkipWithError("write failed");
    }
    countBytes(state);
}

void bareReads(benchmark::State &state)
{
    VisaDevice device;
    if (!openDevice(state, device) || !device.writeRemoteFile(localName(), RemoteName)) {
        return;
    }
    device.closeResource();
    const BareSession session;
    const std::string query = ":MMEM:DATA? '/var/user/bench.wv'";
    std::vector<char> block(ReadBlock);
    bool done = session.isOpen();
    for (auto _ : state) {
        done = done && session.write(query.data(), static_cast<ViUInt32>(query.size()), true);
        ViUInt32 received = 0;
        done = done && session.read(block, 10, received);
        for (qint64 remaining = FileBytes + 1; done && remaining > 0; remaining -= received) {
            done = session.read(
                block, static_cast<ViUInt32>(std::min<qint64>(remaining, ReadBlock)), received);
        }
    }
    if (!done) {
        state.SkipWithError("read failed");
    }
    countBytes(state);
}

void roundTrips(benchmark::State &state, std::size_t request, std::size_t reply, qint64 block,
                std::chrono::microseconds delay = {})
{
    RoundTripPeer peer(request, reply, delay);
    bool done = peer.isConnected();
    for (auto _ : state) {
        for (qint64 remaining = FileBytes; done && remaining > 0; remaining -= block) {
            done = peer.exchange();
        }
    }
    if (!done) {
        state.SkipWithError("no connection");
    }
    countBytes(state);
}

template <typename Function>
void add(const std::string &name, Function function)
{
    // The fastest of some runs is the one that nothing else on the machine disturbed.
    benchmark::RegisterBenchmark(name.c_str(), function)
        ->UseRealTime()
        ->Unit(benchmark::kMillisecond)
        ->Repetitions(Repetitions)
        ->ReportAggregatesOnly()
        ->ComputeStatistics("fastest", [](const std::vector<double> &values) {
            return *std::min_element(values.begin(), values.end());
        });
}

/// The same files over networks with round trips of 0, 0.3 and 1.2 ms.
struct Networks
{
    struct Road
    {
        const char *name;
        std::chrono::microseconds delay;
        const char *resource;
    };
    static constexpr std::array<Road, 3> Roads{
        {{"0ms", std::chrono::microseconds(0), "TCPIP0::127.0.0.1::gpib0,28::INSTR"},
         {"0.3ms", std::chrono::microseconds(300), "TCPIP1::127.0.0.3::gpib0,28::INSTR"},
         {"1.2ms", std::chrono::microseconds(1200), "TCPIP2::127.0.0.3::gpib0,28::INSTR"}}};

    std::vector<std::unique_ptr<DelayedRoad>> roads;

    /// Adds its part of the configuration of the VISA layer; nothing where the ports that an
    /// instrument must answer on can't be had.
    QByteArray open(quint16 target)
    {
        QByteArray config;
        for (const char *host : NetworkHosts) {
            if (listenOn(host, 111) < 0 || listenOn(host, 5025) < 0) {
                return config;
            }
        }
        for (const Road &road : Roads) {
            quint16 port = target;
            if (road.delay.count() > 0) {
                roads.push_back(
                    std::make_unique<DelayedRoad>(NetworkHosts.back(), target, road.delay));
                port = roads.back()->port();
            }
            config += QString("[%1]\nport=%2\n").arg(road.resource).arg(port).toLatin1();
        }
        return config;
    }

    void addAll() const
    {
        if (roads.empty()) {
            return;
        }
        for (const Road &road : Roads) {
            const std::string name = road.name;
            add("network/put/" + name,
                [&road](benchmark::State &state) { put(state, road.resource); });
            add("network/put/visa/" + name, [&road](benchmark::State &state) {
                bareWrites(state, road.resource, NetworkBlock);
            });
            add("network/put/roundtrips/" + name, [&road](benchmark::State &state) {
                roundTrips(state, WriteCallBytes + NetworkBlock, WriteReplyBytes, NetworkBlock,
                           road.delay);
            });
            add("network/get/" + name,
                [&road](benchmark::State &state) { get(state, road.resource); });
            add("network/get/roundtrips/" + name, [&road](benchmark::State &state) {
                roundTrips(state, ReadCallBytes, ReadReplyBytes + ReadBlock, ReadBlock, road.delay);
            });
        }
    }
};

} // namespace

int main(int argc, char **argv)
{
    const QCoreApplication application(argc, argv);
    qputenv("CORVANE_BIN", (QCoreApplication::applicationDirPath() + "/../bin").toLocal8Bit());
    QTemporaryDir files;
    folder = &files;
    SimulatorProcess simulator;
    runOnProcessor(Side::Instrument);
    if (!simulator.startConfig("[a]\nroot=%ROOT%\ngateway=0\ngpib=28\n")) {
        qCritical("%s", qPrintable(simulator.errorOutput()));
        return 1;
    }
    runOnProcessor(Side::Controller);
    QFile config(files.filePath("visa.ini"));
    QFile local(localName());
    if (!config.open(QIODevice::WriteOnly) || !local.open(QIODevice::WriteOnly)) {
        return 1;
    }
    config.write(
        QString("[GPIB0]\nhost=127.0.0.1\nport=%1\n").arg(simulator.gatewayPort()).toLatin1());
    Networks networks;
    config.write(networks.open(static_cast<quint16>(simulator.gatewayPort())));
    config.close();
    local.write(QByteArray(FileBytes, 'x'));
    local.close();
    qputenv("CORVANE_VISA_CONFIG", config.fileName().toLocal8Bit());

    add("put", [](benchmark::State &state) { put(state, Resource); });
    add("put/visa", [](benchmark::State &state) { bareWrites(state, Resource, WriteBlock); });
    add("put/roundtrips", [](benchmark::State &state) {
        roundTrips(state, WriteCallBytes + WriteBlock, WriteReplyBytes, WriteBlock);
    });
    add("get", [](benchmark::State &state) { get(state, Resource); });
    add("get/stream", getStream);
    add("get/visa", bareReads);
    add("get/roundtrips", [](benchmark::State &state) {
        roundTrips(state, ReadCallBytes, ReadReplyBytes + ReadBlock, ReadBlock);
    });
    SimulatorProcess hislip;
    runOnProcessor(Side::Instrument);
    const bool hasHislip = hislip.start({"--address", HislipHost});
    runOnProcessor(Side::Controller);
    if (hasHislip) {
        add("hislip/put", [](benchmark::State &state) { put(state, HislipResource); });
        add("hislip/put/copy", socketPut);
        add("hislip/get", [](benchmark::State &state) { get(state, HislipResource); });
        add("hislip/get/copy", socketGet);
    } else {
        qWarning("Without HiSLIP: %s", qPrintable(hislip.errorOutput()));
    }
    networks.addAll();
    benchmark::Initialize(&argc, argv);
    benchmark::RunSpecifiedBenchmarks();
    return 0;
}
