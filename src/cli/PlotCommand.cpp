// SPDX-License-Identifier: Apache-2.0
#include "CliOptions.h"
#include "Console.h"
#include "RangeArguments.h"
#include "commands.h"

#include "base/ProgressClock.h"
#include "display/renderplot.h"
#include "jobs/SampleReadJob.h"

#include <QFileInfo>
#include <QImageWriter>
#include <QRegularExpression>

#include <algorithm>
#include <atomic>
#include <vector>

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

/// Reads the samples and paints them as the viewer's display would.
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
        if (!fetch(source, begin, count)) {
            return false;
        }
        PlotRequest request;
        request.view = static_cast<PlotView>(m_arguments.view);
        request.samples = m_samples;
        request.markers = m_markers;
        request.firstSample = begin;
        request.clockHz = source.info().clock;
        request.size = m_arguments.size;
        request.showMarkers = m_arguments.markers;
        QImageWriter writer(m_arguments.output, "png");
        return writer.write(renderPlot(request)) ||
               Tracer::fail("Cannot write '" + m_arguments.output + "': " + writer.errorString());
    }

private:
    [[nodiscard]] bool fetch(SourceWaveform &source, qint64 begin, qint64 count)
    {
        if (!source.data()->restartAtPosition(BufferedIO::HeaderSize +
                                              begin * BufferedIO::RecordSize) ||
            !source.markers()->restartAtPosition(begin)) {
            return Tracer::fail("Cannot set I/Q data stream start position.");
        }
        m_samples.resize(static_cast<size_t>(count));
        m_markers.resize(static_cast<size_t>(count));
        constexpr qint64 blockSamples = 64 * 1024;
        std::vector<float> values(2 * static_cast<size_t>(std::min(count, blockSamples)));
        const std::atomic<bool> never{false};
        ProgressClock progress([this](int percent) { emit ProgressUpdate(percent); }, never);
        for (qint64 done = 0; done < count;) {
            if (progress.shouldStop(done, count) || isCancelled()) {
                return Tracer::fail("Action aborted by user.");
            }
            const auto wanted = static_cast<int>(std::min(count - done, blockSamples));
            const int bytes = wanted * BufferedIO::RecordSize;
            if (source.data()->readBlock(bytes, values.data()) != bytes ||
                source.markers()->readBlock(wanted, m_markers.data() + done) != wanted) {
                return Tracer::fail("Cannot read I/Q data.");
            }
            for (int i = 0; i < wanted; ++i) {
                const auto at = 2 * static_cast<size_t>(i);
                m_samples[static_cast<size_t>(done + i)] = {values[at], values[at + 1]};
            }
            done += wanted;
        }
        return true;
    }

    const PlotArguments &m_arguments;
    std::vector<IqSample> m_samples;
    std::vector<quint8> m_markers;
};

int runPlot(PlotArguments &arguments)
{
    Console &console = arguments.console;
    if (!mayWrite(console, arguments.output, arguments.force)) {
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
        constexpr int smallest = 64;
        constexpr int largest = 16384;
        const QSize wanted(match.captured(1).toInt(), match.captured(2).toInt());
        if (!match.hasMatch() || wanted.width() < smallest || wanted.height() < smallest ||
            wanted.width() > largest || wanted.height() > largest) {
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
    addText(command, "-o,--output", plot->output, "Picture to write, PNG")
        ->type_name("FILE")
        ->required();
    command.add_flag("--force", plot->force, "Overwrite an existing file");
}
