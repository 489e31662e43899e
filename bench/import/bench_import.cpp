// SPDX-License-Identifier: Apache-2.0
//
// The import readers, from a file into a sample stream, against what others need for the same
// bytes in the same run: numpy's and pandas' readers of text, zlib that inflates into a file, sox
// that converts to floats, and a bare loop of read, convert and write. The folder is
// $CORVANE_BENCH_DIR, the length $CORVANE_BENCH_SAMPLES (4 million without it).
#include "wvfile/bareLoops.h"

#include "import/DataFileAccess.h"
#include "import/MatFileAccess.h"
#include "import/RiqFileAccess.h"
#include "import/WavFileAccess.h"
#include "log/Tracer.h"
#include "streams/TempStream.h"

#include <benchmark/benchmark.h>

#include <QCoreApplication>
#include <QDir>
#include <QElapsedTimer>
#include <QFile>
#include <QProcess>
#include <QTemporaryDir>

#include <vector>

#include <zlib.h>

namespace {

qint64 sampleCount()
{
    static const qint64 count = [] {
        const qint64 wanted = qEnvironmentVariable("CORVANE_BENCH_SAMPLES").toLongLong();
        return wanted > 0 ? wanted : 4'000'000;
    }();
    return count;
}

/// A folder with the files; gone at the end of the program.
class Fixture
{
public:
    static const Fixture &instance()
    {
        static const Fixture fixture;
        return fixture;
    }

    [[nodiscard]] QString path(const QString &name) const { return m_folder.filePath(name); }

    /// Runs a program in the folder; what it has printed, null if it failed.
    [[nodiscard]] QByteArray run(const QString &program, const QStringList &arguments) const
    {
        QProcess process;
        process.setWorkingDirectory(m_folder.path());
        process.setProcessChannelMode(QProcess::ForwardedErrorChannel);
        process.start(program, arguments);
        const bool done = process.waitForFinished(-1) && process.exitCode() == 0;
        return done ? process.readAllStandardOutput() + ' ' : QByteArray();
    }

    [[nodiscard]] QByteArray python(const QString &script) const
    {
        return run("/usr/bin/python3",
                   {"-c", "import time, numpy as np\nt = time.perf_counter\n" + script});
    }

private:
    Fixture()
        : m_folder(QDir(qEnvironmentVariable("CORVANE_BENCH_DIR", QDir::tempPath()))
                       .filePath("corvane-bench-XXXXXX"))
    {
        const QByteArray made = python(QString(R"(
import scipy.io as io, struct, wave
n = %1
r = np.random.default_rng(7)
w = r.integers(-23000, 23000, (n, 2)).astype('<i2') # no vector beyond full scale
z = w[:, 0] / 32768.0 + 1j * w[:, 1] / 32768.0
np.savetxt('a.csv', np.c_[z.real, z.imag], delimiter=',', fmt='%.9g')
io.savemat('a.mat', {'abc': z}, do_compression=True)
w.tofile('a.bin')
with wave.open('a.wav', 'wb') as f:
    f.setnchannels(2); f.setsampwidth(2); f.setframerate(48000); f.writeframes(w.tobytes())
with open('a.riq', 'wb') as f:
    for i in range(0, n, 1024):
        b = w[i:i + 1024]
        f.write(struct.pack('>ihhhhihhhbbI', 0xC4D70, 1, 0, 0, 0, 0, 901, 0, len(b), 0, 56,
                            0xA0000000))
        f.write(struct.pack('<hhiIihhhhqqIiq', 0, 4, 1000000, 100000000, 80000, 0, 0, 0, 0, 0, 0,
                            0, 0, 1700000000 * 10**9))
        f.write(b.tobytes())
)")
                                           .arg(sampleCount()));
        if (made.isNull()) {
            qFatal("Cannot make the files.");
        }
    }

    QTemporaryDir m_folder;
};

/// Times a reader that fills a stream; its result is the count of samples.
template <typename Read>
void timeReader(benchmark::State &state, Read read)
{
    const Fixture &fixture = Fixture::instance();
    for (auto _ : state) {
        TempStream stream;
        if (!stream.open() || !read(fixture, *stream.stream()) || !stream->restartAtBegining() ||
            stream->deviceSize() != BufferedIO::HeaderSize + 8 * sampleCount()) {
            state.SkipWithError("reading failed");
            break;
        }
        static_cast<void>(Tracer::takeEntries());
    }
    state.SetItemsProcessed(state.iterations() * sampleCount());
}

/// Takes the seconds that a script prints as the time.
void timeScript(benchmark::State &state, const QString &script)
{
    for (auto _ : state) {
        const QByteArray printed = Fixture::instance().python(script);
        if (printed.isNull()) {
            state.SkipWithError("the script failed");
            break;
        }
        state.SetIterationTime(printed.trimmed().toDouble());
    }
    state.SetItemsProcessed(state.iterations() * sampleCount());
}

void text(benchmark::State &state)
{
    timeReader(state, [](const Fixture &fixture, BufferedIO &stream) {
        WvImportJob job;
        job.file1 = fixture.path("a.csv");
        job.format.dataFormat = DataFormat::Rational;
        job.scaling = ImportScaling::None;
        WvWriteJob result;
        return DataFileAccess().importData(job, &result, &stream, 0);
    });
}

void textNumpy(benchmark::State &state)
{
    timeScript(state, "s = t(); a = np.loadtxt('a.csv', delimiter=','); print(t() - s)");
}

void textPandas(benchmark::State &state)
{
    timeScript(state, "import pandas as pd\ns = t(); a = pd.read_csv('a.csv', header=None, "
                      "engine='c'); print(t() - s)");
}

void matlab(benchmark::State &state)
{
    timeReader(state, [](const Fixture &fixture, BufferedIO &stream) {
        MatFileAccess file;
        return file.open(fixture.path("a.mat")) && file.readDirectory() &&
               file.readVariable("abc", &stream, nullptr);
    });
}

void matlabVariable(benchmark::State &state)
{
    MatFileAccess file;
    if (!file.open(Fixture::instance().path("a.mat")) || !file.readDirectory()) {
        state.SkipWithError("no directory");
        return;
    }
    timeReader(state, [&file](const Fixture &, BufferedIO &stream) {
        return file.readVariable("abc", &stream, nullptr);
    });
}

/// Inflates the one element of the file into another file.
void matlabZlib(benchmark::State &state)
{
    constexpr qint64 headSize = 136;
    constexpr qint64 blockSize = 256 * 1024;
    for (auto _ : state) {
        QFile in(Fixture::instance().path("a.mat"));
        QFile out(Fixture::instance().path("inflated"));
        if (!in.open(QIODevice::ReadOnly | QIODevice::Unbuffered) ||
            !out.open(QIODevice::WriteOnly | QIODevice::Unbuffered) || !in.seek(headSize)) {
            state.SkipWithError("no files");
            break;
        }
        z_stream stream{};
        std::vector<char> packed(blockSize);
        std::vector<char> plain(blockSize);
        int result = inflateInit(&stream);
        while (result == Z_OK) {
            if (stream.avail_in == 0) {
                stream.avail_in = static_cast<uInt>(in.read(packed.data(), blockSize));
                stream.next_in = reinterpret_cast<Bytef *>(packed.data());
            }
            stream.next_out = reinterpret_cast<Bytef *>(plain.data());
            stream.avail_out = static_cast<uInt>(blockSize);
            result = inflate(&stream, Z_NO_FLUSH);
            out.write(plain.data(), blockSize - stream.avail_out);
        }
        inflateEnd(&stream);
        if (result != Z_STREAM_END || out.size() < 16 * sampleCount()) {
            state.SkipWithError("inflating failed");
        }
    }
    state.SetItemsProcessed(state.iterations() * sampleCount());
}

void wav(benchmark::State &state)
{
    timeReader(state, [](const Fixture &fixture, BufferedIO &stream) {
        WavFileAccess file;
        return file.open(fixture.path("a.wav")) && file.readHeader() &&
               file.readSamples(&stream, 0);
    });
}

void wavSox(benchmark::State &state)
{
    for (auto _ : state) {
        QElapsedTimer timer;
        timer.start();
        if (Fixture::instance().run("sox", {"a.wav", "-t", "f32", "sox.raw"}).isNull()) {
            state.SkipWithError("sox failed");
            break;
        }
        constexpr double nanosecond = 1e-9;
        state.SetIterationTime(static_cast<double>(timer.nsecsElapsed()) * nanosecond);
    }
    state.SetItemsProcessed(state.iterations() * sampleCount());
}

void riq(benchmark::State &state)
{
    timeReader(state, [](const Fixture &fixture, BufferedIO &stream) {
        RiqFileAccess file;
        return file.open(fixture.path("a.riq")) && file.readDirectory() &&
               file.readSamples(0, &stream, 0);
    });
}

void binary(benchmark::State &state)
{
    timeReader(state, [](const Fixture &fixture, BufferedIO &stream) {
        WvImportJob job;
        job.file1 = fixture.path("a.bin");
        job.binary = true;
        job.scaling = ImportScaling::None;
        WvWriteJob result;
        return DataFileAccess().importData(job, &result, &stream, 0);
    });
}

void bareLoop(benchmark::State &state)
{
    for (auto _ : state) {
        const QString target = Fixture::instance().path("bare");
        QFile::remove(target);
        if (bareDecode(Fixture::instance().path("a.bin").toStdString(), 0, sampleCount(),
                       target.toStdString()) != sampleCount()) {
            state.SkipWithError("the loop failed");
            break;
        }
    }
    state.SetItemsProcessed(state.iterations() * sampleCount());
}

} // namespace

BENCHMARK(text)->Unit(benchmark::kMillisecond)->UseRealTime();
BENCHMARK(textNumpy)->Unit(benchmark::kMillisecond)->UseManualTime();
BENCHMARK(textPandas)->Unit(benchmark::kMillisecond)->UseManualTime();
BENCHMARK(matlab)->Unit(benchmark::kMillisecond)->UseRealTime();
BENCHMARK(matlabVariable)->Unit(benchmark::kMillisecond)->UseRealTime();
BENCHMARK(matlabZlib)->Unit(benchmark::kMillisecond)->UseRealTime();
BENCHMARK(wav)->Unit(benchmark::kMillisecond)->UseRealTime();
BENCHMARK(wavSox)->Unit(benchmark::kMillisecond)->UseManualTime();
BENCHMARK(riq)->Unit(benchmark::kMillisecond)->UseRealTime();
BENCHMARK(binary)->Unit(benchmark::kMillisecond)->UseRealTime();
BENCHMARK(bareLoop)->Unit(benchmark::kMillisecond)->UseRealTime();

int main(int argc, char **argv)
{
    const QCoreApplication application(argc, argv);
    benchmark::Initialize(&argc, argv);
    benchmark::RunSpecifiedBenchmarks();
    return 0;
}
