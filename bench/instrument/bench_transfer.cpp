// SPDX-License-Identifier: Apache-2.0
// Files to and from a simulated instrument over loopback, beside two limits for the same blocks:
// the bare calls of the VISA layer with the data in memory, and bare round trips over TCP of
// requests and replies as large as those of VXI-11.
#include "RoundTripPeer.h"

#include "instrument/VisaDevice.h"
#include "simulator/SimulatorProcess.h"
#include "visa/visa.h"

#include <QCoreApplication>
#include <QFile>
#include <QTemporaryDir>

#include <benchmark/benchmark.h>

#include <algorithm>
#include <memory>
#include <string>
#include <vector>

namespace {

constexpr int Repetitions = 7;
constexpr qint64 FileBytes = 50'000'000;
constexpr ViUInt32 WriteBlock = 1024;
constexpr ViUInt32 ReadBlock = 32768;
const char *const Resource = "GPIB0::28::INSTR";
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

bool openDevice(benchmark::State &state, VisaDevice &device)
{
    const bool isOpen = device.openResource(Resource);
    if (!isOpen) {
        state.SkipWithError("cannot open the simulated instrument");
    }
    return isOpen;
}

void put(benchmark::State &state)
{
    VisaDevice device;
    if (!openDevice(state, device)) {
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

void get(benchmark::State &state)
{
    VisaDevice device;
    if (!openDevice(state, device) || !device.writeRemoteFile(localName(), RemoteName)) {
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

/// A session of the VISA layer alone.
class BareSession
{
public:
    BareSession()
    {
        viOpenDefaultRM(&m_manager);
        m_isOpen = viOpen(m_manager, Resource, VI_NO_LOCK, 0, &m_session) == VI_SUCCESS;
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

void bareWrites(benchmark::State &state)
{
    const BareSession session;
    const std::string head = ":MMEM:DATA '/var/user/bench.wv',#8" + std::to_string(FileBytes);
    const std::vector<char> block(WriteBlock);
    bool done = session.isOpen();
    for (auto _ : state) {
        done = done && session.write(head.data(), static_cast<ViUInt32>(head.size()), false);
        ViUInt32 written = 0;
        qint64 remaining = FileBytes;
        for (; done && remaining > WriteBlock; remaining -= WriteBlock) {
            done = session.send(block.data(), WriteBlock, written);
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

void roundTrips(benchmark::State &state, std::size_t request, std::size_t reply, qint64 block)
{
    RoundTripPeer peer(request, reply);
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

void add(const char *name, void (*function)(benchmark::State &))
{
    // The fastest of some runs is the one that nothing else on the machine disturbed.
    benchmark::RegisterBenchmark(name, function)
        ->UseRealTime()
        ->Unit(benchmark::kMillisecond)
        ->Repetitions(Repetitions)
        ->ReportAggregatesOnly()
        ->ComputeStatistics("fastest", [](const std::vector<double> &values) {
            return *std::min_element(values.begin(), values.end());
        });
}

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
    config.close();
    local.write(QByteArray(FileBytes, 'x'));
    local.close();
    qputenv("CORVANE_VISA_CONFIG", config.fileName().toLocal8Bit());

    add("put", put);
    add("put/visa", bareWrites);
    add("put/roundtrips", [](benchmark::State &state) {
        roundTrips(state, WriteCallBytes + WriteBlock, WriteReplyBytes, WriteBlock);
    });
    add("get", get);
    add("get/visa", bareReads);
    add("get/roundtrips", [](benchmark::State &state) {
        roundTrips(state, ReadCallBytes, ReadReplyBytes + ReadBlock, ReadBlock);
    });
    benchmark::Initialize(&argc, argv);
    benchmark::RunSpecifiedBenchmarks();
    return 0;
}
