// SPDX-License-Identifier: Apache-2.0
#include "ComposerEngine.h"

#include "TrackMixer.h"
#include "processorcores.h"

#include "base/ProgressClock.h"
#include "base/freespace.h"
#include "base/parallel.h"
#include "log/Tracer.h"
#include "streams/samplestream.h"

#include <QDateTime>
#include <QElapsedTimer>

#include <algorithm>
#include <cmath>
#include <sys/resource.h>
#include <utility>

namespace {

QString phaseWord(int pass)
{
    switch (pass) {
    case 1:
        return QStringLiteral("reading files");
    case 2:
        return QStringLiteral("resampling");
    default:
        return QStringLiteral("frequency shifting");
    }
}

std::unique_ptr<Pass23> makePass(int pass, const Pass23::Job &job)
{
    switch (pass) {
    case 1:
        return std::make_unique<Pass1>(job);
    case 2:
        return std::make_unique<Pass2>(job);
    default:
        return std::make_unique<Pass3>(job);
    }
}

/// Each segment keeps two files open, and many systems let a program have few at first.
void allowManyFiles()
{
    rlimit limit{};
    if (getrlimit(RLIMIT_NOFILE, &limit) == 0 && limit.rlim_cur < limit.rlim_max) {
        limit.rlim_cur = limit.rlim_max;
        setrlimit(RLIMIT_NOFILE, &limit);
    }
}

QString now()
{
    return QDateTime::currentDateTime().toString();
}

/// What the key of a segment can tell apart.
constexpr int MostSegments = 0x10000;

} // namespace

/// One segment's share of a pass.
struct ComposerEngine::Job
{
    Pass23::Job work;
    double weight = 0; ///< of the whole pass
    std::unique_ptr<Pass23> thread;
};

ComposerEngine::ComposerEngine(Composition composition, QObject *parent)
    : QObject(parent)
    , m_composition(std::move(composition))
{
}

ComposerEngine::~ComposerEngine() = default;

void ComposerEngine::slot_cancel()
{
    m_cancelled = true;
    emit cancelTasks();
}

bool ComposerEngine::runComposer()
{
    emit headline(QStringLiteral("Composer Engine started at ") + now());
    if (m_maxThreads < 1) {
        const int cores = detectCores();
        emit message(QStringLiteral("Detected CPUs/Cores: %1 ").arg(cores));
        m_maxThreads = std::min(cores, MostThreads);
        if (cores > 1) {
            emit message(
                QStringLiteral("Will spawn up to %1 processes where possible.").arg(m_maxThreads));
        }
    }
    bool done = hasTemporaryRoom();
    for (int pass = 1; done && pass <= 3; ++pass) {
        done = runPass(pass);
        if (done) {
            emit overallProgress(25 * pass);
        }
    }
    done = done && combine();
    emit taskProgress(100);
    emit overallProgress(100);
    cleanUp();
    emit headline(QStringLiteral("Job Completed at ") + now());
    return done;
}

/// For the samples of all segments that are read, and for those of the target.
bool ComposerEngine::hasTemporaryRoom() const
{
    qint64 samples = m_composition.target.lSamples;
    for (int track = 0; track < m_composition.trackCount(); ++track) {
        const bool isRead = m_composition.tracks()[static_cast<std::size_t>(track)].bEnable;
        for (int i = 0; isRead && i < m_composition.segmentCount(track); ++i) {
            samples += m_composition.segment(track, i)->lSamples;
        }
    }
    return hasTemporaryRoomFor(samples * BufferedIO::RecordSize);
}

void ComposerEngine::cleanUp()
{
    emit message(QStringLiteral("Cleaning up %1 Temporary Files").arg(m_buffers.size()));
    m_buffers.clear();
}

ComposerEngine::Jobs ComposerEngine::makeJobs(int pass)
{
    Jobs jobs;
    double sum = 0;
    for (int track = 0; track < m_composition.trackCount(); ++track) {
        if (!m_composition.tracks()[static_cast<std::size_t>(track)].bEnable) {
            continue;
        }
        for (int i = 0; i < m_composition.segmentCount(track); ++i) {
            const ComposerSegment &segment = *m_composition.segment(track, i);
            Job job;
            job.work = {&m_composition, &segment, &m_buffers[sampleKey(track, i)], track, i, 1};
            if (pass == 1) {
                job.weight = static_cast<double>(segment.lSamples);
            } else if (pass == 2 ? m_composition.needsResampling(segment)
                                 : segment.hasFrequencyOffset()) {
                job.weight = static_cast<double>(m_composition.targetSamples(segment));
            }
            sum += job.weight;
            jobs.push_back(std::move(job));
        }
    }
    for (Job &job : jobs) {
        job.weight = sum > 0 ? job.weight / sum : 0;
    }
    return jobs;
}

bool ComposerEngine::runPass(int pass)
{
    if (pass < 1 || pass > 3) {
        return false;
    }
    for (int track = 0; track < m_composition.trackCount(); ++track) {
        if (m_composition.segmentCount(track) > MostSegments) {
            return Tracer::fail(
                QStringLiteral("Track %1 has %2 segments; at most %3 can be rendered.")
                    .arg(track + 1)
                    .arg(m_composition.segmentCount(track))
                    .arg(MostSegments));
        }
    }
    if (pass == 1) {
        allowManyFiles();
    }
    Jobs jobs = makeJobs(pass);
    double samples = 0;
    for (const Job &job : jobs) {
        samples += static_cast<double>(job.work.segment->lSamples);
    }
    if (jobs.empty() || samples <= 0) {
        return false;
    }
    emit message(QStringLiteral("%1 %2 Waveforms, %3 Input Samples")
                     .arg(phaseWord(pass))
                     .arg(jobs.size())
                     .arg(samples, 0, 'f', 0));
    startJobs(pass, jobs);
    emit message(QStringLiteral("Waiting for all %1 tasks to finish...").arg(jobs.size()));
    ProgressClock::runEvents();
    waitWhile(jobs, [](int running) { return running > 0; });
    return endJobs(pass, jobs);
}

void ComposerEngine::startJobs(int pass, Jobs &jobs)
{
    const int threads = std::max(m_maxThreads, 1);
    // Threads that run beside each other share the processors; a single one, if it may, takes all.
    const int beside = std::min(threads, static_cast<int>(jobs.size()));
    const unsigned share =
        threads > 1 ? std::max(1U, threadCount() / static_cast<unsigned>(beside)) : 1U;
    for (std::size_t j = 0; j < jobs.size() && !m_cancelled; ++j) {
        Job &job = jobs[j];
        emit message(QStringLiteral("Processing Track %1, Segment %2 (%3 %)")
                         .arg(job.work.track + 1)
                         .arg(job.work.index + 1)
                         .arg(job.weight * 100));
        ProgressClock::runEvents();
        job.work.processors = share;
        job.thread = makePass(pass, job.work);
        connect(this, &ComposerEngine::cancelTasks, job.thread.get(), &Pass23::cancel);
        job.thread->start();
        emit overallProgress((pass - 1) * 25 + static_cast<int>(25 * j / jobs.size()));
        waitWhile(jobs, [threads](int running) { return running >= threads; });
    }
}

void ComposerEngine::waitWhile(Jobs &jobs, const std::function<bool(int running)> &condition)
{
    QElapsedTimer timer;
    timer.start();
    for (;;) {
        const auto running = std::count_if(jobs.begin(), jobs.end(), [](const Job &job) {
            return job.thread && job.thread->isRunning();
        });
        if (!condition(static_cast<int>(running))) {
            return;
        }
        if (timer.elapsed() > ProgressClock::IntervalMs) {
            timer.restart();
            double progress = 0;
            for (const Job &job : jobs) {
                progress += job.thread ? job.thread->progress() * job.weight : 0;
            }
            emit taskProgress(static_cast<int>(progress));
            ProgressClock::runEvents();
            if (m_cancelled) {
                emit cancelTasks();
            }
        }
        // Long tasks are looked at every 10 ms, and the many short ones don't wait that long.
        const auto working = std::find_if(jobs.begin(), jobs.end(), [](const Job &job) {
            return job.thread && job.thread->isRunning();
        });
        if (working != jobs.end()) {
            working->thread->wait(10);
        }
    }
}

bool ComposerEngine::endJobs(int pass, Jobs &jobs)
{
    if (m_cancelled) {
        return Tracer::fail("Action aborted by user.");
    }
    emit message(QStringLiteral("All jobs finished."));
    ProgressClock::runEvents();
    bool done = true;
    for (Job &job : jobs) {
        job.thread->wait();
        if (!job.thread->ok()) {
            emit errorMessage(QStringLiteral("%1 failed for track %2, segment %3.")
                                  .arg(phaseWord(pass))
                                  .arg(job.work.track + 1)
                                  .arg(job.work.index + 1));
            done = false;
        }
        job.thread.reset();
    }
    return done;
}

bool ComposerEngine::combine()
{
    emit message(QStringLiteral("Combining Waveforms"));
    emit taskProgress(0);
    TempStream data(SegmentBuffers::DataBufferSize);
    TempStream markers(SegmentBuffers::MarkerBufferSize);
    if (!data.open()) {
        return Tracer::fail("Cannot create temporary data buffer.");
    }
    if (!markers.open()) {
        return Tracer::fail("Cannot create temporary marker buffer.");
    }
    if (!data->writeHeader(BufferedIO::DataHeader)) {
        return Tracer::fail("Cannot write to temporary data buffer.");
    }
    LevelSums levels;
    return mixTracks(*data.stream(), *markers.stream(), levels) &&
           scaleAndSave(*data.stream(), *markers.stream(), levels);
}

bool ComposerEngine::mixTracks(BufferedIO &data, BufferedIO &markers, LevelSums &levels)
{
    const qint64 total = m_composition.target.lSamples;
    emit message(QStringLiteral("  Will Create %1 Output Samples").arg(total));
    if (total < 1 || total > MaxSamples) {
        return Tracer::fail(QStringLiteral("The target has %1 samples; 1 to %2 can be rendered.")
                                .arg(total)
                                .arg(MaxSamples));
    }
    const auto report = [this](int percent) {
        emit taskProgress(percent);
        emit overallProgress(75 + percent * 25 / 100);
    };
    ProgressClock clock(report, m_cancelled);
    TrackMixer mixer(m_composition, m_buffers);
    for (qint64 done = 0; done < total;) {
        if (clock.shouldStop(percentOf(done, total)) || m_cancelled) {
            return Tracer::fail("Action aborted by user.");
        }
        const auto count =
            static_cast<int>(std::min<qint64>(total - done, TrackMixer::BlockSamples));
        if (!mixer.mix(count)) {
            emit errorMessage(QStringLiteral("Combining failed"));
            return false;
        }
        addLevels(mixer.samples(), levels);
        countClipped(mixer.samples(), m_clipped);
        if (!data.writeBlock(static_cast<int>(mixer.samples().size_bytes()),
                             mixer.samples().data())) {
            return Tracer::fail("Cannot write data stream.");
        }
        if (!markers.writeBytes(count, mixer.markers().data())) {
            return Tracer::fail("Cannot write marker stream.");
        }
        done += count;
    }
    emit taskProgress(100);
    reportClipping();
    return true;
}

void ComposerEngine::reportClipping()
{
    if (m_clipped.values == 0) {
        return;
    }
    // The scaling that follows brings them back, so nothing is lost but the level of all else.
    emit warningMessage(
        QStringLiteral("%1 of %2 values clipped, largest %3 dB above full scale, in the sum of the "
                       "tracks. The result is scaled to full scale, so none is cut off.")
            .arg(m_clipped.values)
            .arg(2 * m_composition.target.lSamples)
            .arg(20 * std::log10(std::max(m_clipped.largest, 1.0)), 0, 'f', 2));
}

bool ComposerEngine::scaleAndSave(BufferedIO &data, BufferedIO &markers, const LevelSums &levels)
{
    const auto total = static_cast<int>(m_composition.target.lSamples);
    emit message(QStringLiteral("Rescaling Waveform Data"));
    const double scale = 1 / levels.peakLevel();
    Resample scaler;
    connect(this, &ComposerEngine::cancelTasks, &scaler, &Resample::cancel);
    connect(&scaler, &Resample::ProgressUpdate, this, &ComposerEngine::taskProgress);
    if (levels.peak == 0) {
        Tracer::Trace(Tracer::Error, "The sum of the tracks is silent, so it can't be scaled.");
    }
    if (!scaler.rescale(total, scale, &data)) {
        emit errorMessage(QStringLiteral("Rescaling failed"));
        return Tracer::fail("Rescaling of the waveform failed.");
    }
    if (m_cancelled) {
        return Tracer::fail("Action aborted by user.");
    }
    const QString &name = m_composition.target.sName;
    emit message(QStringLiteral("Saving Final Waveform to ") + name);
    WvWriteJob job;
    job.clock = m_composition.target.dUsrClk;
    job.markerClock = job.clock;
    job.samples = total;
    job.rmsOffset = levelOffset(scale * levels.rmsLevel(total), 1e-12);
    job.peakOffset = 0;
    job.levelsValid = true;
    job.overwrite = m_overwrites;
    job.comment = QStringLiteral("Created with Corvane");
    job.copyright = QStringLiteral("Halvorn");
    HvFileIO file;
    connect(this, &ComposerEngine::cancelTasks, &file, &HvFileIO::cancel);
    connect(&file, &HvFileIO::ProgressUpdate, this, &ComposerEngine::taskProgress);
    if (!file.writeWaveform(job, name, &data, &markers, nullptr)) {
        emit errorMessage(QStringLiteral("Waveform generation failed"));
        return Tracer::fail("Waveform generation failed.");
    }
    emit message(QStringLiteral("Loop point: ") + loopText(job.loop));
    if (!job.loop.isContinuous) {
        emit warningMessage(loopWarning(job.loop));
    }
    return true;
}
