// SPDX-License-Identifier: Apache-2.0
#include "CliOptions.h"
#include "Console.h"
#include "RangeArguments.h"
#include "commands.h"

#include "base/OutputFile.h"
#include "base/ProgressClock.h"
#include "display/renderplot.h"
#include "jobs/SampleReadJob.h"

#include <QBuffer>
#include <QRegularExpression>

#include <atomic>
#include <span>

namespace {

struct PlotArguments
{
    Console &console;
    SampleRange range;
    int view = 0;
    QSize size{800, 600};
    bool markers = false;
    QString output;
    bool force = false;
};

/// The samples of a file, with the progress and the cancel of a job.
class PlotSource : public StreamSource
{
public:
    PlotSource(ToolJob &job, SourceWaveform &source, qint64 first, qint64 count)
        : StreamSource(*source.data(), *source.markers(), first, count)
        , m_job(job)
        , m_progress([&job](int percent) { emit job.ProgressUpdate(percent); }, m_never)
    {
    }

    [[nodiscard]] bool restart() override
    {
        m_done = 0;
        return StreamSource::restart();
    }

    [[nodiscard]] bool next(std::span<IqSample> samples, std::span<quint8> markers) override
    {
        // The tick lets the interrupt through, which the job then knows of.
        if (m_progress.shouldStop(m_done, count()) || m_job.isCancelled()) {
            return Tracer::fail("Action aborted by user.");
        }
        m_done += static_cast<qint64>(samples.size());
        return StreamSource::next(samples, markers);
    }

private:
    ToolJob &m_job;
    const std::atomic<bool> m_never{false};
    ProgressClock m_progress;
    qint64 m_done = 0;
};

/// Paints a range of a file as the viewer's display would.
class PlotJob : public SampleReadJob
{
public:
    explicit PlotJob(const PlotArguments &arguments)
        : SampleReadJob(arguments.range)
        , m_arguments(arguments)
    {
    }

protected:
    [[nodiscard]] bool process(SourceWaveform &source, qint64 begin, qint64 count) override
    {
        PlotRequest request;
        request.view = static_cast<PlotView>(m_arguments.view);
        request.clockHz = source.info().clock;
        request.size = m_arguments.size;
        request.showMarkers = m_arguments.markers;
        PlotSource samples(*this, source, begin, count);
        emit stepStarted("Painting...");
        const QImage picture = renderPlot(request, samples);
        if (picture.isNull()) {
            return false;
        }
        QBuffer png;
        if (!picture.save(&png, "PNG")) {
            return Tracer::fail("Cannot make the picture for '" + m_arguments.output + "'.");
        }
        // A cancel that came with the painting counts, too.
        ProgressClock::runEvents();
        if (!mayProceed()) {
            return false;
        }
        OutputFile file(m_arguments.output, existingFile(m_arguments.force));
        return (file.open() && file.write(png.data()) && file.commit()) ||
               Tracer::fail("Cannot write '" + m_arguments.output + "': " + file.errorString());
    }

private:
    const PlotArguments &m_arguments;
};

int runPlot(PlotArguments &arguments)
{
    Console &console = arguments.console;
    if (!mayWrite(console, arguments.output, arguments.force) ||
        !isNoSource(console, arguments.output, arguments.range.fileName)) {
        return console.failed();
    }
    int exitCode = ExitDone;
    if (!rangeFits(console, arguments.range, exitCode)) {
        return exitCode;
    }
    PlotJob job(arguments);
    return console.run(job);
}

void addSize(CLI::App &command, QSize &size)
{
    const auto take = [&size](const std::string &text) {
        static const QRegularExpression form("^(\\d{1,5})[xX](\\d{1,5})$");
        const auto match = form.match(QString::fromStdString(text));
        constexpr int Smallest = 64;
        constexpr int Largest = 16384;
        const QSize wanted(match.captured(1).toInt(), match.captured(2).toInt());
        if (!match.hasMatch() || wanted.width() < Smallest || wanted.height() < Smallest ||
            wanted.width() > Largest || wanted.height() > Largest) {
            throw CLI::ValidationError("--size: " + text +
                                       " is not permitted; permitted: 64x64 to 16384x16384");
        }
        size = wanted;
    };
    command.add_option_function<std::string>("--size", take, "Size in pixels (default: 800x600)")
        ->type_name("WxH");
}

} // namespace

void addPlotCommand(CommandSet &commands)
{
    auto plot = std::make_shared<PlotArguments>(
        PlotArguments{.console = commands.console, .range = {}, .output = {}});
    CLI::App &command =
        addCommand<PlotArguments>(commands.app, "plot", "Paint samples as the viewer shows them",
                                  commands.action, plot, runPlot);
    addRange(command, plot->range);
    addChoice(command, "--view", plot->view, plotViewNames(), "What to show (default: iq)");
    addSize(command, plot->size);
    command.add_flag("--markers", plot->markers, "Show the marker rows, in the views over time");
    addOutputFile(command, plot->output, "Picture to write, PNG")->required();
    command.add_flag("--force", plot->force, "Overwrite an existing file");
}
