// SPDX-License-Identifier: Apache-2.0
#include "CliOptions.h"
#include "Console.h"
#include "RangeArguments.h"
#include "commands.h"

#include "base/OutputFile.h"
#include "base/ProgressClock.h"
#include "display/plotexport.h"
#include "display/renderplot.h"
#include "jobs/JobSource.h"
#include "jobs/SampleReadJob.h"

#include <QFileInfo>
#include <QPainter>
#include <QRegularExpression>

namespace {

struct PlotArguments
{
    Console &console;
    SampleRange range;
    int view = 0;
    QSize size{800, 600};
    double scale = 1;
    bool markers = false;
    int palette = 0;
    int theme = 0;
    std::optional<LevelRange> levels;
    QString title;
    QString output;
    bool force = false;
};

QString suffixOf(const QString &fileName)
{
    return QFileInfo(fileName).suffix().toLower();
}

/// How often a view reads the samples.
int passesOf(PlotView view)
{
    return view == PlotView::Constellation || view == PlotView::Ccdf ? 2 : 1;
}

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
        request.showMarkers = m_arguments.markers;
        request.palette = colorModeOrder()[static_cast<std::size_t>(m_arguments.palette)];
        request.theme = static_cast<PlotTheme>(m_arguments.theme);
        request.range = m_arguments.levels;
        request.title = m_arguments.title;
        JobSource samples(*this, source, begin, count, passesOf(request.view));
        emit stepStarted("Painting...");
        bool painted = false;
        const QByteArray picture = plotPicture(
            suffixOf(m_arguments.output), m_arguments.size, m_arguments.scale,
            [&](QPainter &painter) {
                painted = paintPlot(painter, QRectF(QPointF(), m_arguments.size), request, samples);
            });
        if (picture.isEmpty()) {
            return Tracer::fail("Cannot make the picture for '" + m_arguments.output +
                                "': there is no memory for its pixels.");
        }
        if (!painted) {
            return false;
        }
        // A cancel that came with the painting counts, too.
        ProgressClock::runEvents();
        if (!mayProceed()) {
            return false;
        }
        OutputFile file(m_arguments.output, existingFile(m_arguments.force));
        return (file.open() && file.write(picture) && file.commit()) ||
               Tracer::fail("Cannot write '" + m_arguments.output + "': " + file.errorString());
    }

private:
    const PlotArguments &m_arguments;
};

int runPlot(PlotArguments &arguments)
{
    Console &console = arguments.console;
    if (!pictureSuffixes().contains(suffixOf(arguments.output))) {
        return console.wrongUsage(
            QString("--output: '%1' has no suffix of a picture; permitted: .png, .svg, .pdf")
                .arg(arguments.output));
    }
    const auto view = static_cast<PlotView>(arguments.view);
    if (arguments.levels && !takesRange(view)) {
        return console.wrongUsage("--range: the view '" + plotViewNames().at(arguments.view) +
                                  "' has no scale in dB; permitted with logmag, logavg, spectrum, "
                                  "waterfall");
    }
    if (view == PlotView::Overview && (arguments.range.from || arguments.range.count)) {
        return console.wrongUsage("--view: the overview is of the whole file; permitted without "
                                  "--from and --count");
    }
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

void addScale(CLI::App &command, double &scale)
{
    const auto take = [&scale](const std::string &text) {
        constexpr double Least = 0.25;
        constexpr double Most = 16;
        const auto number = numberIn(QString::fromStdString(text), {});
        if (!number || !(*number >= Least) || !(*number <= Most)) {
            throw CLI::ValidationError("--scale: '" + text +
                                       "' is out of range; permitted: 0.25 to 16");
        }
        scale = *number;
    };
    command
        .add_option_function<std::string>(
            "--scale", take, "Enlarge the picture with its lines and texts (default: 1)")
        ->type_name("NUMBER");
}

void addLevels(CLI::App &command, std::optional<LevelRange> &levels)
{
    const auto take = [&levels](const std::string &text) {
        const QStringList parts = QString::fromStdString(text).split(',');
        const auto low = parts.size() == 2 ? numberIn(parts[0], "dB") : std::nullopt;
        const auto high = parts.size() == 2 ? numberIn(parts[1], "dB") : std::nullopt;
        constexpr double Least = -400;
        constexpr double Most = 200;
        if (!low || !high || !(*low < *high) || *low < Least || *high > Most) {
            throw CLI::ValidationError("--range: '" + text +
                                       "' is no range; permitted: two levels from -400 to 200 dB, "
                                       "the lower one first, such as -80,0");
        }
        levels = LevelRange{*low, *high};
    };
    command
        .add_option_function<std::string>(
            "--range", take,
            "Levels in dB at the ends of the scale, in the log views, the spectrum and the "
            "waterfall (default: 0 dB downwards, the waterfall as its data lie)")
        ->type_name("LO,HI");
}

} // namespace

void addPlotCommand(CommandSet &commands)
{
    auto plot = std::make_shared<PlotArguments>(PlotArguments{
        .console = commands.console, .range = {}, .levels = {}, .title = {}, .output = {}});
    CLI::App &command =
        addCommand<PlotArguments>(commands.app, "plot", "Paint samples as the viewer shows them",
                                  commands.action, plot, runPlot);
    addRange(command, plot->range);
    addChoice(command, "--view", plot->view, plotViewNames(), "What to show (default: iq)");
    addSize(command, plot->size);
    command.add_flag("--markers", plot->markers, "Show the marker rows, in the views over time");
    addScale(command, plot->scale);
    addChoice(command, "--palette", plot->palette, colorModeKeys(),
              "Colours of waterfall and constellation (default: viridis)");
    addLevels(command, plot->levels);
    addChoice(command, "--theme", plot->theme, {"dark", "light"},
              "Ground of the picture (default: dark)");
    addText(command, "--title", plot->title, "Text over the plot");
    addOutputFile(command, plot->output, "Picture to write: .png, .svg or .pdf")->required();
    command.add_flag("--force", plot->force, "Overwrite an existing file");
}
