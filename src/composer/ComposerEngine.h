// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "ComposerPasses.h"
#include "Composition.h"
#include "SegmentBuffers.h"

#include "streams/TempStream.h"
#include "streams/levels.h"
#include "wvfile/SampleCoding.h"

#include <QObject>

#include <atomic>
#include <functional>
#include <memory>
#include <vector>

/// Renders a composition into one waveform file, over temporary streams, so that memory doesn't
/// grow with the length. Pass 1 reads the sources, pass 2 brings them to the target clock, pass 3
/// shifts their frequencies, each segment on a thread of its own; then the tracks are summed and
/// the sum is scaled to full scale and saved.
///
/// An engine serves one run. It works on a copy of the document, in the calling thread, which lets
/// its event loop run every 100 ms; that is how slot_cancel() comes through. The output file is
/// touched in the last step alone.
class ComposerEngine : public QObject
{
    Q_OBJECT

public:
    static constexpr int MostThreads = 8;

    explicit ComposerEngine(Composition composition, QObject *parent = nullptr);
    ~ComposerEngine() override;

    /// The number of segments that a pass works on at a time. Without a call all cores are used, up
    /// to MostThreads.
    void setMaxThreads(int count) { m_maxThreads = count; }

    /// Without it a target that stands there already is left alone. At first it is replaced.
    void setOverwrites(bool overwrites) { m_overwrites = overwrites; }

    /// The whole render. False, with the reason logged, on failure and cancel.
    [[nodiscard]] bool runComposer();

    /// One of the passes 1 to 3; any other number fails.
    [[nodiscard]] bool runPass(int pass);

    /// The sum of the tracks, its scaling and its saving.
    [[nodiscard]] bool combine();

    /// Values of the sum, I and Q each, that lay beyond full scale before the scaling.
    [[nodiscard]] const ClipCount &clipped() const { return m_clipped; }

public slots:
    void slot_cancel();

signals:
    void overallProgress(int percent);
    void taskProgress(int percent);

    /// Lines for the user, plain text.
    void message(const QString &text);
    void headline(const QString &text); ///< start and end of the run
    void warningMessage(const QString &text);
    void errorMessage(const QString &text);

    /// Ends the work of all threads.
    void cancelTasks();

private:
    struct Job;
    using Jobs = std::vector<Job>;

    [[nodiscard]] Jobs makeJobs(int pass);
    void startJobs(int pass, Jobs &jobs);
    void waitWhile(Jobs &jobs, const std::function<bool(int running)> &condition);
    [[nodiscard]] bool endJobs(int pass, Jobs &jobs);
    [[nodiscard]] bool mixTracks(BufferedIO &data, BufferedIO &markers, LevelSums &levels);
    [[nodiscard]] bool scaleAndSave(BufferedIO &data, BufferedIO &markers, const LevelSums &levels);
    void reportClipping();
    [[nodiscard]] bool hasTemporaryRoom() const;
    void cleanUp();

    Composition m_composition;
    SegmentBufferMap m_buffers;
    int m_maxThreads = 0; ///< 0: not chosen yet
    bool m_overwrites = true;
    ClipCount m_clipped;
    std::atomic<bool> m_cancelled{false};
};
