// SPDX-License-Identifier: Apache-2.0
//
// Reading, writing and scanning of waveform files, against bare loops over the same bytes on the
// same file system in the same run. The folder is $CORVANE_BENCH_DIR (the system's temporary folder
// without it), the length $CORVANE_BENCH_SAMPLES (100 million without it).
#include "bareLoops.h"

#include "log/Tracer.h"
#include "streams/BufferedIO.h"
#include "streams/TempStream.h"
#include "wvfile/HvFileIO.h"
#include "wvfile/WvTypes.h"

#include <benchmark/benchmark.h>

#include <QCoreApplication>
#include <QDir>
#include <QElapsedTimer>
#include <QFile>
#include <QFileInfo>
#include <QTemporaryDir>

#include <algorithm>
#include <array>
#include <memory>
#include <vector>

#include <sys/resource.h>

namespace {

constexpr double nanosecond = 1e-9;
constexpr int blockSamples = 256 * 1024;

qint64 sampleCount()
{
    static const qint64 count = [] {
        const qint64 wanted = qEnvironmentVariable("CORVANE_BENCH_SAMPLES").toLongLong();
        return wanted > 0 ? std::min(wanted, MaxSamples) : 100'000'000;
    }();
    return count;
}

/// Which marker lists a file has.
enum Markers {
    NoMarkers = 0,
    FewMarkers = 1,  ///< each marker changes every 1000 samples
    ManyMarkers = 2, ///< each marker changes every 10 samples
};

qint64 markerPeriod(qint64 markers)
{
    return markers == ManyMarkers ? 10 : 1000;
}

QByteArray markerTags(qint64 markers)
{
    if (markers == NoMarkers) {
        return {};
    }
    QByteArray tags = "{CONTROL LENGTH: " + QByteArray::number(sampleCount()) + '}';
    const qint64 period = markerPeriod(markers);
    for (int marker = 1; marker <= MarkerCount; ++marker) {
        tags += "{MARKER LIST " + QByteArray::number(marker) + ": 0:0";
        for (qint64 at = marker, state = 1; at < sampleCount(); at += period, state = 1 - state) {
            tags += ';' + QByteArray::number(at) + (state == 1 ? ":1" : ":0");
        }
        tags += '}';
    }
    return tags;
}

/// A folder with what the benchmarks read; gone at the end of the program.
class Fixture
{
public:
    static Fixture &instance()
    {
        static Fixture fixture;
        return fixture;
    }

    QString folder() const { return m_folder.path(); }

    /// Path of a .wv file, and where its samples begin in it.
    std::pair<QString, qint64> waveform(qint64 markers)
    {
        const QString path = m_folder.filePath(QString("in%1.wv").arg(markers));
        if (QFileInfo::exists(path)) {
            return {path, m_offsets[static_cast<size_t>(markers)]};
        }
        const QByteArray head = "{TYPE: TGX-WV,0}{CLOCK:1000000}{LEVEL OFFS:3.0,0.0}{SAMPLES:" +
                                QByteArray::number(sampleCount()) + '}' + markerTags(markers) +
                                "{WAVEFORM-" + QByteArray::number(4 * sampleCount() + 1) + ": #";
        QFile file(path);
        if (file.open(QIODevice::WriteOnly | QIODevice::Unbuffered)) {
            file.write(head);
            writeWords(file);
            file.write("}");
        }
        m_offsets[static_cast<size_t>(markers)] = head.size();
        return {path, head.size()};
    }

private:
    Fixture()
        : m_folder(QDir(qEnvironmentVariable("CORVANE_BENCH_DIR", QDir::tempPath()))
                       .filePath("corvane-bench-XXXXXX"))
    {
    }

    static void writeWords(QFile &file)
    {
        std::vector<quint32> block(blockSamples);
        quint32 state = 1;
        for (qint64 done = 0; done < sampleCount();) {
            const qint64 count = std::min<qint64>(blockSamples, sampleCount() - done);
            for (quint32 &word : block) {
                state = state * 1664525U + 1013904223U;
                word = state;
            }
            file.write(reinterpret_cast<const char *>(block.data()), 4 * count);
            done += count;
        }
    }

    QTemporaryDir m_folder;
    std::array<qint64, ManyMarkers + 1> m_offsets{};
};

/// Peak memory of this process since resetPeak, MiB.
double peakMebibytes()
{
    QFile status("/proc/self/status");
    if (!status.open(QIODevice::ReadOnly)) {
        return 0;
    }
    for (const QByteArray &line : status.readAll().split('\n')) {
        if (line.startsWith("VmHWM:")) {
            return line.mid(6).simplified().split(' ').first().toDouble() / 1024;
        }
    }
    return 0;
}

void resetPeak()
{
    QFile clear("/proc/self/clear_refs");
    if (clear.open(QIODevice::WriteOnly)) {
        clear.write("5");
    }
}

/// Wall time, and processor time of all threads with the system's share, s. The second is the one
/// to look at on a machine that is busy with other things.
struct Cost
{
    double wall = 1e9;
    double processor = 1e9;

    void keepBest(const Cost &other)
    {
        wall = std::min(wall, other.wall);
        processor = std::min(processor, other.processor);
    }
};

double processorSeconds()
{
    rusage usage{};
    ::getrusage(RUSAGE_SELF, &usage);
    const auto seconds = [](const timeval &time) {
        return static_cast<double>(time.tv_sec) + static_cast<double>(time.tv_usec) * 1e-6;
    };
    return seconds(usage.ru_utime) + seconds(usage.ru_stime);
}

template <typename Work>
Cost costOf(const Work &work)
{
    const double before = processorSeconds();
    QElapsedTimer timer;
    timer.start();
    work();
    return {static_cast<double>(timer.nsecsElapsed()) * nanosecond, processorSeconds() - before};
}

/// Runs the bare loop and the job in turn; the counter `of_bare` is the speed of the job in parts
/// of that of the loop, best against best.
template <typename Prepare, typename Bare, typename Job>
void compare(benchmark::State &state, const Prepare &prepare, const Bare &bare, const Job &job)
{
    Cost bestBare;
    Cost bestJob;
    double peak = 0;
    // Making room for the next file is no part of either time.
    const QString bareTarget = Fixture::instance().folder() + "/bare";
    for (auto _ : state) {
        bestBare.keepBest(costOf([&] {
            if (bare(bareTarget.toStdString()) != sampleCount()) {
                state.SkipWithError("the bare loop failed");
            }
        }));
        QFile::remove(bareTarget);
        prepare();
        resetPeak();
        const Cost cost = costOf([&] {
            if (!job()) {
                state.SkipWithError("the job failed");
            }
        });
        peak = std::max(peak, peakMebibytes());
        bestJob.keepBest(cost);
        state.SetIterationTime(cost.wall);
    }
    const auto samples = static_cast<double>(sampleCount());
    state.counters["Msamples_per_s"] = samples / bestJob.wall / 1e6;
    state.counters["bare_Msamples_per_s"] = samples / bestBare.wall / 1e6;
    state.counters["of_bare"] = bestBare.wall / bestJob.wall;
    state.counters["of_bare_processor"] = bestBare.processor / bestJob.processor;
    state.counters["peak_MiB"] = peak;
}

void readWaveform(benchmark::State &state)
{
    const auto [path, offset] = Fixture::instance().waveform(state.range(0));
    std::unique_ptr<TempStream> data;
    std::unique_ptr<TempStream> markers;
    compare(
        state,
        [&] {
            data = std::make_unique<TempStream>();
            markers = std::make_unique<TempStream>();
        },
        [path = path, offset = offset](const std::string &target) {
            return bareDecode(path.toStdString(), offset, sampleCount(), target);
        },
        [&, path = path] {
            WvFileInfo info;
            info.fileName = path;
            info.dataStream = data->stream();
            info.markerStream = markers->stream();
            return data->open() && markers->open() && HvFileIO().readWaveform(&info) &&
                   info.samples == sampleCount();
        });
}

void writeWaveform(benchmark::State &state)
{
    const QString folder = Fixture::instance().folder();
    QFile data(folder + "/data.iqf");
    QFile markers(folder + "/markers");
    WvFileInfo info;
    BufferedIO dataStream;
    BufferedIO markerStream;
    info.fileName = Fixture::instance().waveform(state.range(0)).first;
    info.dataStream = &dataStream;
    info.markerStream = &markerStream;
    if (!dataStream.initBuf(&data, BufferedIO::ReadWrite) ||
        !markerStream.initBuf(&markers, BufferedIO::ReadWrite) || !HvFileIO().readWaveform(&info)) {
        state.SkipWithError("cannot prepare the streams");
        return;
    }
    WvWriteJob job;
    job.clock = info.clock;
    job.markerClock = info.clock;
    job.samples = info.samples;
    job.levelsValid = true;
    const QString out = folder + "/out.wv";
    compare(
        state, [&] { QFile::remove(out); },
        [&](const std::string &target) {
            return bareEncode(data.fileName().toStdString(), BufferedIO::HeaderSize, sampleCount(),
                              target);
        },
        [&] {
            return HvFileIO().writeWaveform(job, out, &dataStream,
                                            state.range(0) == NoMarkers ? nullptr : &markerStream,
                                            nullptr);
        });
    QFile::remove(out);
    dataStream.releaseBuf();
    markerStream.releaseBuf();
    data.remove();
    markers.remove();
}

void scanSparseFile(benchmark::State &state)
{
    constexpr qint64 samples = 500'000'000;
    const QString path = Fixture::instance().folder() + "/sparse.wv";
    QFile file(path);
    if (!file.open(QIODevice::WriteOnly)) {
        state.SkipWithError("cannot create the sparse file");
        return;
    }
    file.write("{TYPE: TGX-WV,0}{CLOCK:1000000}{LEVEL OFFS:3.0,0.0}{SAMPLES:500000000}"
               "{WAVEFORM-2000000001: #");
    file.seek(file.pos() + 4 * samples);
    file.write("}");
    file.close();
    WvFileSummary summary;
    for (auto _ : state) {
        if (!HvFileIO().readWaveformInfo(path, &summary) || summary.samples != samples) {
            state.SkipWithError("the scan failed");
        }
    }
    QFile::remove(path);
}

BENCHMARK(readWaveform)
    ->ArgName("markers")
    ->DenseRange(NoMarkers, ManyMarkers)
    ->Iterations(3)
    ->UseManualTime()
    ->Unit(benchmark::kMillisecond);
BENCHMARK(writeWaveform)
    ->ArgName("markers")
    ->DenseRange(NoMarkers, ManyMarkers)
    ->Iterations(3)
    ->UseManualTime()
    ->Unit(benchmark::kMillisecond);
BENCHMARK(scanSparseFile)->Unit(benchmark::kMicrosecond);

} // namespace

int main(int argc, char **argv)
{
    const QCoreApplication app(argc, argv);
    // The temporary streams are to lie where the files lie.
    qputenv("TMPDIR", qEnvironmentVariable("CORVANE_BENCH_DIR", QDir::tempPath()).toUtf8());
    benchmark::Initialize(&argc, argv);
    benchmark::RunSpecifiedBenchmarks();
    for (const Tracer::Entry &entry : Tracer::takeEntries()) {
        if ((entry.second & (Tracer::Error | Tracer::Severe)) != 0) {
            fputs(qPrintable(entry.first + '\n'), stderr);
        }
    }
    return 0;
}
