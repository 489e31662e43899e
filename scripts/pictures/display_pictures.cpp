// SPDX-License-Identifier: Apache-2.0

// Writes a picture of every display and of every view into a folder, for the documents and for
// looking at them: display_pictures FOLDER

#include "display/CWidgetConstellation.h"
#include "display/CWidgetIQTrace.h"
#include "display/CWidgetSpectrum.h"
#include "display/CWidgetTimeline.h"
#include "display/renderplot.h"
#include "displaysamples.h"

#include <QApplication>
#include <QDir>
#include <QMouseEvent>
#include <QRandomGenerator>

#include <cstdio>

namespace {

constexpr double Clock = 100e6;

/// A chirp with a swelling amplitude and a little noise, and markers of four kinds.
struct Chirp
{
    IqList samples;
    QList<quint8> markers;

    explicit Chirp(qsizetype count)
        : samples(count)
        , markers(count)
    {
        QRandomGenerator random(1);
        const auto noise = [&random] { return 0.01 * (random.generateDouble() - 0.5); };
        for (qsizetype k = 0; k < count; ++k) {
            const double share = static_cast<double>(k) / static_cast<double>(count);
            const double swell = std::sin(3 * std::numbers::pi * share);
            const double size = 0.2 + 0.6 * swell * swell;
            const double turns = (0.02 + 0.075 * share) * static_cast<double>(k);
            const double angle = 2 * std::numbers::pi * turns;
            samples[k] = {size * std::cos(angle) + noise(), size * std::sin(angle) + noise()};
            const bool pulse = k > count * 45 / 100 && k < count * 455 / 1000;
            markers[k] = static_cast<quint8>((k * 8 / count % 2) | (k * 16 / count % 2 << 1) |
                                             (pulse ? 4 : 0) | (k % 10 == 0 ? 8 : 0));
        }
    }
};

/// Sixteen points with noise.
IqList symbols(qsizetype count)
{
    QRandomGenerator random(2);
    const auto level = [&random] {
        const double noise = 0.03 * (random.generateDouble() + random.generateDouble() - 1);
        return (static_cast<int>(random.bounded(4)) * 2 - 3) / 3.0 * 0.65 + noise;
    };
    IqList samples(count);
    for (IqSample &sample : samples) {
        sample.i = level();
        sample.q = level();
    }
    return samples;
}

void moveMouse(QWidget &widget, const QPointF &place)
{
    QMouseEvent move(QEvent::MouseMove, place, widget.mapToGlobal(place), Qt::NoButton,
                     Qt::NoButton, Qt::NoModifier);
    QApplication::sendEvent(&widget, &move);
}

bool savePlots(const QDir &folder, const QSize &size, double ratio, const QString &suffix)
{
    const Chirp chirp(20000);
    const IqList cloud = symbols(20000);
    bool good = true;
    for (int view = 0; view < plotViewNames().size(); ++view) {
        PlotRequest request;
        request.view = static_cast<PlotView>(view);
        request.clockHz = Clock;
        request.size = size;
        request.pixelRatio = ratio;
        request.showMarkers = true;
        request.samples = request.view == PlotView::Constellation ? cloud : chirp.samples;
        request.markers = chirp.markers;
        const QString name = "display-" + plotViewNames().at(view) + suffix + ".png";
        good = renderPlot(request).save(folder.filePath(name)) && good;
    }
    return good;
}

bool saveWidgets(const QDir &folder)
{
    const Chirp chirp(20000);
    bool good = true;
    const auto save = [&](CWidgetBase &widget, const char *name) {
        good = widget.savePicture(folder.filePath(QString("display-%1.png").arg(name))) && good;
    };
    // With what the mouse points at, which no saved picture shows.
    const auto saveAsSeen = [&](CWidgetBase &widget, const char *name) {
        const QString file = folder.filePath(QString("display-%1.png").arg(name));
        good = widget.grab().save(file) && good;
    };
    CWidgetIQTrace trace;
    trace.resize(800, 500);
    trace.setClock(Clock);
    trace.setShowMarkers(true);
    trace.setData(chirp.samples, chirp.markers);
    trace.setCursor(1, 6000);
    trace.setCursor(2, 13000);
    QMouseEvent press(QEvent::MouseButtonPress, QPointF(500, 60), trace.mapToGlobal(QPointF()),
                      Qt::LeftButton, Qt::LeftButton, Qt::NoModifier);
    QApplication::sendEvent(&trace, &press);
    save(trace, "iq-cursors");
    trace.setShowMarkers(false);
    trace.clear();
    trace.setData(toneSamples(100, 0.05));
    save(trace, "iq-sparse");

    CWidgetSpectrum spectrum;
    spectrum.resize(800, 500);
    spectrum.setClock(Clock);
    spectrum.setData(chirp.samples);
    for (int index = 0; index < ColorModeCount; ++index) {
        spectrum.setColorMode(static_cast<int>(colorModeOrder().at(static_cast<size_t>(index))));
        save(spectrum, qPrintable("waterfall-" + colorModeKeys().at(index)));
    }
    spectrum.setView(0);
    moveMouse(spectrum, {480, 200});
    saveAsSeen(spectrum, "spectrum-readout");
    spectrum.setData(toneSamples(400, 0.1));
    save(spectrum, "spectrum-short");

    CWidgetConstellation constellation;
    constellation.resize(500, 400);
    constellation.setData(symbols(20000));
    moveMouse(constellation, {330, 130});
    saveAsSeen(constellation, "constellation-readout");
    constellation.setData(toneSamples(300, 0.05));
    save(constellation, "constellation-dots");

    CWidgetTimeline timeline;
    timeline.resize(800, timeline.sizeHint().height());
    timeline.setWaveform(1'000'000, Clock);
    timeline.setRange(300'000, 100'000);
    timeline.setCursor(1, 350'000);
    timeline.setCursor(2, 620'000);
    return timeline.grab().save(folder.filePath("display-timeline.png")) && good;
}

} // namespace

int main(int argc, char **argv)
{
    if (argc != 2) {
        std::fputs("usage: display_pictures FOLDER\n", stderr);
        return 2;
    }
    const QApplication application(argc, argv);
    const QDir folder(QString::fromLocal8Bit(argv[1]));
    const bool good = folder.mkpath(".") && savePlots(folder, {800, 500}, 1, "") &&
                      savePlots(folder, {400, 300}, 1.5, "-small") && saveWidgets(folder);
    if (!good) {
        std::fputs("a picture could not be written\n", stderr);
    }
    return good ? 0 : 1;
}
