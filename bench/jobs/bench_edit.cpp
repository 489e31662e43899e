// SPDX-License-Identifier: Apache-2.0
// The editing jobs from file to file against plain reading and writing of the same file, and marker
// edits against a copy of the marker stream.
#include "jobs/FilterJob.h"
#include "jobs/LevelJob.h"
#include "jobs/MarkerJob.h"
#include "jobs/PolarJob.h"
#include "jobs/WrapJob.h"
#include "wvfile/HvFileIO.h"

#include <QCoreApplication>
#include <QTemporaryDir>

#include <benchmark/benchmark.h>

#include <vector>

namespace {

constexpr qint64 MarkerSamples = 100'000'000;
constexpr int FileSamples = 20'000'000;

class MarkerStreams
{
public:
    MarkerStreams()
    {
        const std::vector<quint8> block(1'000'000, 0x5);
        ok = source.open() && target.open();
        for (qint64 done = 0; ok && done < MarkerSamples;) {
            ok = source->writeBytes(static_cast<int>(block.size()), block.data());
            done += static_cast<qint64>(block.size());
        }
    }

    TempStream source;
    TempStream target;
    bool ok = false;
};

void markerEdits(benchmark::State &state)
{
    MarkerStreams streams;
    const QList<MarkerEdit> edits{
        {1, 0, MarkerSamples - 1, MarkerAction::High, {}},
        {2, 1000, MarkerSamples - 1000, MarkerAction::Toggle, {}},
        {4, MarkerSamples / 2, MarkerSamples - 1, MarkerAction::Pattern, "1101"}};
    MarkerEditor editor;
    for (auto _ : state) {
        if (!streams.ok || !editor.run(*streams.source.stream(), *streams.target.stream(),
                                       MarkerSamples, edits.mid(0, state.range(0)))) {
            state.SkipWithError("the edit has failed");
        }
    }
    state.SetItemsProcessed(state.iterations() * MarkerSamples);
}
BENCHMARK(markerEdits)->Arg(1)->Arg(2)->Arg(3)->Unit(benchmark::kMillisecond)->UseRealTime();

/// The peer: the bytes from one stream to the other, in blocks.
void markerCopy(benchmark::State &state)
{
    MarkerStreams streams;
    std::vector<quint8> block(256 * 1024);
    for (auto _ : state) {
        bool ok = streams.ok && streams.source->restartAtBegining() &&
                  streams.target->restartAtBegining();
        for (qint64 done = 0; ok && done < MarkerSamples;) {
            const int count = streams.source->readBlock(
                static_cast<int>(
                    std::min<qint64>(static_cast<qint64>(block.size()), MarkerSamples - done)),
                block.data());
            ok = count > 0 && streams.target->writeBytes(count, block.data());
            done += count;
        }
        if (!ok || !streams.target->restartAtBegining()) {
            state.SkipWithError("the copy has failed");
        }
    }
    state.SetItemsProcessed(state.iterations() * MarkerSamples);
}
BENCHMARK(markerCopy)->Unit(benchmark::kMillisecond)->UseRealTime();

/// A file of noise, and one to write.
class Files
{
public:
    Files()
    {
        TempStream data;
        std::vector<float> block(2'000'000);
        unsigned state = 1;
        for (float &value : block) {
            state = state * 1664525U + 1013904223U;
            value = static_cast<float>(state >> 8) * 1e-8F - 0.08F;
        }
        ok = data.open() && data->writeHeader(BufferedIO::DataHeader);
        for (int done = 0; ok && done < FileSamples; done += 1'000'000) {
            ok = data->writeBytes(static_cast<int>(block.size() * sizeof(float)), block.data());
        }
        WvWriteJob job;
        job.clock = 1e8;
        job.markerClock = 1e8;
        job.samples = FileSamples;
        job.levelsValid = true;
        ok = ok && HvFileIO().writeWaveform(job, source(), data.stream(), nullptr, nullptr);
    }

    [[nodiscard]] QString source() const { return m_folder.filePath("in.wv"); }
    [[nodiscard]] OutputOptions out(const char *name = "out.wv") const
    {
        return {m_folder.filePath(name), {}, {}};
    }

    bool ok = false;

private:
    QTemporaryDir m_folder;
};

template <typename MakeJob>
void timeJob(benchmark::State &state, MakeJob makeJob)
{
    static const Files files;
    for (auto _ : state) {
        if (!files.ok || makeJob(files)->run() != JobOutcome::Finished) {
            state.SkipWithError("the job has failed");
        }
    }
    state.SetItemsProcessed(state.iterations() * FileSamples);
}

/// The peer: the same file read, and written as it is, as often as a tool writes.
class CopyOnly : public EditJob
{
public:
    explicit CopyOnly(const Files &files, int copies = 1)
        : EditJob(files.source(), files.out(), Reading::Quiet)
        , m_copies(copies)
    {
    }

private:
    bool edit() override
    {
        bool saved = true;
        for (int i = 0; i < m_copies && saved; ++i) {
            saved =
                output().save({source().data(), source().markers(), source().tags()}, "Saving...");
        }
        return saved;
    }

    int m_copies;
};

const auto *const registered = [] {
    const auto add = [](const char *name, auto makeJob) {
        benchmark::RegisterBenchmark(
            name, [makeJob](benchmark::State &state) { timeJob(state, makeJob); })
            ->Unit(benchmark::kMillisecond)
            ->UseRealTime();
    };
    add("readAndWrite", [](const Files &f) { return std::make_unique<CopyOnly>(f); });
    add("readAndWriteTwice", [](const Files &f) { return std::make_unique<CopyOnly>(f, 2); });
    add("level", [](const Files &f) {
        return std::make_unique<LevelJob>(LevelRequest{f.source(), f.out(), {}, {}});
    });
    add("markers", [](const Files &f) {
        return std::make_unique<MarkerJob>(
            MarkerRequest{f.source(), f.out(), {{1, 10, FileSamples / 2, MarkerAction::High, {}}}});
    });
    add("wrap", [](const Files &f) {
        return std::make_unique<WrapJob>(WrapRequest{f.source(), f.out(), {}, {}});
    });
    add("polar", [](const Files &f) {
        PolarRequest request;
        request.inputFile = f.source();
        request.phase = f.out();
        request.amplitude = f.out("out2.wv");
        return std::make_unique<PolarJob>(request);
    });
    add("filter21", [](const Files &f) {
        FilterRequest request;
        request.inputFile = f.source();
        request.output = f.out();
        request.length = 21;
        return std::make_unique<FilterJob>(request);
    });
    return "all";
}();

} // namespace

int main(int argc, char **argv)
{
    const QCoreApplication application(argc, argv); // jobs let its events through
    benchmark::Initialize(&argc, argv);
    benchmark::RunSpecifiedBenchmarks();
    return registered == nullptr;
}
