// SPDX-License-Identifier: Apache-2.0
#include "composer/ComposerEngine.h"
#include "streams/samplestream.h"
#include "support/files.h"
#include "support/logreader.h"
#include "support/rows.h"
#include "support/seed.h"
#include "support/wvbytes.h"

#include <QTest>

#include <algorithm>
#include <cmath>
#include <functional>
#include <numbers>

using Change = std::function<void(Composition &)>;
using Samples = std::vector<std::complex<float>>;

namespace {

QByteArray markerLists(const std::vector<quint8> &bytes)
{
    QByteArray text = "{CONTROL LENGTH:" + QByteArray::number(qsizetype(bytes.size())) + '}';
    for (int marker = 0; marker < 4; ++marker) {
        text += "{MARKER LIST " + QByteArray::number(marker + 1) + ':';
        for (std::size_t i = 0; i < bytes.size(); ++i) {
            text += (i > 0 ? ";" : "") + QByteArray::number(qsizetype(i)) + ':' +
                    QByteArray::number((bytes[i] >> marker) & 1);
        }
        text += '}';
    }
    return text;
}

struct Waveform
{
    Samples samples;
    std::vector<quint8> markers;
    WvFileInfo info;
};

bool readFile(const QString &name, Waveform &waveform)
{
    TempStream data;
    TempStream markers;
    waveform.info.fileName = name;
    waveform.info.dataStream = data.stream();
    waveform.info.markerStream = markers.stream();
    if (!data.open() || !markers.open() || !HvFileIO().readWaveform(&waveform.info) ||
        !data->checkHeader("IQF")) {
        return false;
    }
    const auto count = static_cast<std::size_t>(waveform.info.samples);
    waveform.samples.resize(count);
    waveform.markers.resize(count);
    return data->readBlock(int(8 * count), waveform.samples.data()) == int(8 * count) &&
           markers->readBlock(int(count), waveform.markers.data()) == int(count);
}

Samples resampled(const Samples &input, std::vector<quint8> &markers, qint64 count)
{
    TempStream in;
    TempStream out;
    TempStream markersIn;
    TempStream markersOut;
    const auto length = static_cast<int>(input.size());
    Resample resample;
    if (!in.open() || !out.open() || !markersIn.open() || !markersOut.open() ||
        !in->writeHeader("IQF") || !in->writeBytes(8 * length, input.data()) ||
        !markersIn->writeBytes(length, markers.data())) {
        return {};
    }
    resample.setInput(in.stream(), length);
    resample.setOutput(out.stream(), count);
    resample.setMarkers(markersIn.stream(), markersOut.stream());
    Samples result(static_cast<std::size_t>(count));
    markers.resize(result.size());
    if (!resample.run() || !out->checkHeader("IQF") || !markersOut->restartAtBegining() ||
        !out->readBytes(int(8 * count), result.data()) ||
        !markersOut->readBytes(int(count), markers.data())) {
        return {};
    }
    return result;
}

/// A source as it goes into the sum: at the target clock and with its offset applied.
struct ReferenceSource
{
    std::vector<std::complex<float>> samples;
    std::vector<quint8> markers;
};

struct Rendered
{
    std::vector<std::complex<float>> samples; ///< scaled to a peak of 1
    std::vector<quint8> markers;
    double rms = 0; ///< after the scaling
};

struct Playing
{
    int segment = -1;
    qint64 first = -1;
    qint64 last = -1;
    qint64 source = 0;
};

double factorOf(const ComposerSegment &segment, const Playing &playing, double clock, qint64 n)
{
    const double pi = 3.1415926535;
    const auto inLength = static_cast<qint32>(clock * segment.dFadeIn + 0.5);
    const auto outLength = static_cast<qint32>(clock * segment.dFadeOut + 0.5);
    const qint64 outStart = playing.last - outLength + 1;
    double g = 1;
    if (playing.first <= n && n < playing.first + inLength) {
        const double x = double(n - playing.first) / inLength;
        const double shapes[] = {x, 1 - (std::cos(pi * x) + 1) * 0.5, std::sqrt(x), 0};
        g = shapes[segment.iFadeIn];
    }
    if (outStart <= n && n < outStart + outLength) {
        const double x = double(n - outStart) / outLength;
        const double shapes[] = {1 - x, (std::cos(pi * x) + 1) * 0.5, 1 - std::sqrt(x), 0};
        g *= shapes[segment.iFadeOut];
    }
    return g * std::pow(10.0, segment.dLOfs / -20);
}

Playing search(const Composition &document, const ComposerTrack &track, qint64 n)
{
    const qint64 N = document.target.lSamples;
    const double clock = document.target.dUsrClk;
    for (std::size_t i = 0; i < track.segments.size(); ++i) {
        const ComposerSegment &segment = track.segments[i];
        const qint64 first = segment.lTarget;
        const qint64 last =
            first + qint64(clock / segment.dSrcClk * double(segment.lUsed) + 0.5) - 1;
        if (first <= n && n <= last) {
            return {int(i), first, last, segment.lStart};
        }
        if (segment.bWrap && first - N <= n && n <= last - N) {
            const qint64 d = N - first;
            const qint64 played = d > 0 ? qint64(double(d) * (segment.dSrcClk / clock)) : 0;
            return {int(i), std::max<qint64>(first - N, 0), last - N, segment.lStart + played};
        }
    }
    return {};
}

/// The render told sample by sample, without a thought for time. `sources` are by track and
/// segment; those of disabled tracks aren't looked at.
Rendered renderLiterally(const Composition &document,
                         const std::vector<std::vector<ReferenceSource>> &sources)
{
    const auto count = static_cast<std::size_t>(document.target.lSamples);
    std::vector<Playing> state(document.tracks().size());
    Rendered result;
    double peak = 0;
    double power = 0;
    for (std::size_t n = 0; n < count; ++n) {
        const auto at = static_cast<qint64>(n);
        float re = 0;
        float im = 0;
        quint8 marker = 0;
        for (std::size_t t = 0; t < state.size(); ++t) {
            const ComposerTrack &track = document.tracks()[t];
            if (!track.bEnable) {
                continue;
            }
            Playing &playing = state[t];
            if (at > playing.last) {
                playing = search(document, track, at);
            }
            if (playing.segment < 0) {
                continue;
            }
            const auto index = static_cast<std::size_t>(playing.segment);
            const ComposerSegment &segment = track.segments[index];
            const ReferenceSource &source = sources[t][index];
            const auto k = static_cast<std::size_t>(playing.source++);
            const double v = factorOf(segment, playing, document.target.dUsrClk, at);
            if (k < source.samples.size()) {
                re = static_cast<float>(double(re) + double(source.samples[k].real()) * v);
                im = static_cast<float>(double(im) + double(source.samples[k].imag()) * v);
                marker |= segment.bMkr ? source.markers[k] : quint8{0};
            }
        }
        const double p = double(re) * double(re) + double(im) * double(im);
        peak = std::max(peak, p);
        power += p;
        result.samples.emplace_back(re, im);
        result.markers.push_back(marker);
    }
    const auto scale = static_cast<float>(1 / std::sqrt(peak));
    for (std::complex<float> &sample : result.samples) {
        sample *= scale;
    }
    result.rms = std::sqrt(power / double(count)) / std::sqrt(peak);
    return result;
}

} // namespace

class tst_composerengine : public QObject
{
    Q_OBJECT

private slots:
    void initTestCase();
    void render();
    void randomDocuments();
    void failures();
    void cancel();
    void reports();

private:
    [[nodiscard]] ComposerSegment place(int file, qint64 target) const;
    [[nodiscard]] Composition twoTracks() const;
    void compare(const Composition &document);

    TestFolder m_folder;
};

/// Files of 300, 500 and 700 samples at 1 MHz, 1 MHz and 2 MHz.
void tst_composerengine::initTestCase()
{
    std::mt19937 generator(7);
    for (int file = 0; file < 3; ++file) {
        QList<int> values;
        std::vector<quint8> markers;
        for (int i = 0; i < 300 + 200 * file; ++i) {
            values << int(generator() % 30000) - 15000 + 1 << int(generator() % 30000) - 15000;
            markers.push_back(generator() % 16);
        }
        const QByteArray clock = file == 2 ? "2000000" : "1000000";
        QVERIFY(m_folder.store(
            QString::number(file) + ".wv",
            wvFile("{TYPE: TGX-WV,0}{CLOCK:" + clock + '}' + markerLists(markers), words(values))));
    }
}

ComposerSegment tst_composerengine::place(int file, qint64 target) const
{
    ComposerSegment segment;
    segment.sName = m_folder.path(QString::number(file) + ".wv");
    segment.lSamples = 300 + 200 * file;
    segment.lUsed = segment.lSamples;
    segment.dSrcClk = file == 2 ? 2e6 : 1e6;
    segment.lTarget = target;
    segment.bMkr = true;
    return segment;
}

Composition tst_composerengine::twoTracks() const
{
    Composition document;
    document.addTrack();
    document.addTrack();
    document.track(0)->segments = {place(0, 20), place(1, 400)};
    document.track(1)->segments = {place(1, 100)};
    document.target.sName = m_folder.path("out.wv");
    document.target.lSamples = 1000;
    return document;
}

void tst_composerengine::compare(const Composition &document)
{
    std::vector<std::vector<ReferenceSource>> sources;
    const double clock = document.target.dUsrClk;
    for (const ComposerTrack &track : document.tracks()) {
        sources.emplace_back();
        for (const ComposerSegment &segment : track.segments) {
            Waveform waveform;
            QVERIFY(readFile(segment.sName, waveform));
            ReferenceSource source{waveform.samples, waveform.markers};
            const auto count =
                static_cast<qint64>(clock / segment.dSrcClk * double(segment.lSamples) + 0.5);
            if (clock != segment.dSrcClk) {
                source.samples = resampled(waveform.samples, source.markers, count);
                QCOMPARE(qint64(source.samples.size()), count);
            }
            const double step = 2 * std::numbers::pi * document.effectiveOffset(segment).hz / clock;
            for (std::size_t i = 0; i < source.samples.size() && step != 0; ++i) {
                source.samples[i] = std::complex<float>(std::complex<double>(source.samples[i]) *
                                                        std::polar(1.0, step * double(i)));
            }
            sources.back().push_back(std::move(source));
        }
    }
    const Rendered expected = renderLiterally(document, sources);
    ComposerEngine engine(document);
    QVERIFY(engine.runComposer());
    Waveform result;
    QVERIFY(readFile(document.target.sName, result));
    QCOMPARE(qint64(result.info.samples), document.target.lSamples);
    QCOMPARE(result.info.clock, clock);
    for (std::size_t i = 0; i < expected.samples.size(); ++i) {
        const std::complex<float> error = result.samples[i] - expected.samples[i];
        const float worst = std::max(std::fabs(error.real()), std::fabs(error.imag()));
        QVERIFY2(worst < 1.0 / 32767, qPrintable(QString("sample %1: %2").arg(i).arg(worst)));
    }
    const QByteArray markers =
        markerBytes(m_folder.load("out.wv"), static_cast<qsizetype>(expected.markers.size()));
    QVERIFY(std::equal(markers.begin(), markers.end(), expected.markers.begin()));
    QVERIFY(std::fabs(result.info.rmsOffsetTag + 20 * std::log10(expected.rms)) < 1e-5);
    QCOMPARE(result.info.peakOffsetTag, 0.0);
}

/// What random documents don't reach.
void tst_composerengine::render()
{
    forRows({{"wrap of the same segment in one block", Change([](Composition &document) {
                  // 300 samples from 10 on in a target of 250: the tail plays to 59, then the start
                  // again.
                  document.target.lSamples = 250;
                  document.track(1)->segments.clear();
                  document.track(0)->segments.resize(1);
                  document.segment(0, 0)->lTarget = 100;
                  document.segment(0, 0)->bWrap = true;
              })},
             {"past the end without a wrap",
              Change([](Composition &document) { document.segment(0, 1)->lTarget = 1200; })},
             {"past the end with a wrap", Change([](Composition &document) {
                  document.segment(0, 1)->lTarget = 1200;
                  document.segment(0, 1)->bWrap = true;
              })},
             {"disabled track",
              Change([](Composition &document) { document.track(1)->bEnable = false; })},
             {"offset", Change([](Composition &document) {
                  document.segment(0, 0)->dFOfs = 12345.6;
                  document.segment(0, 0)->bAdjOfs = false;
              })},
             {"offset adjusted", Change([](Composition &document) {
                  document.segment(0, 0)->dFOfs = -12345.6;
                  document.segment(0, 0)->dAdjLim = 100;
              })},
             {"higher target clock", Change([](Composition &document) {
                  document.target.dUsrClk = 2e6;
                  document.target.lSamples = 2000;
                  document.segment(0, 1)->lTarget = 800;
                  document.segment(0, 0)->dFOfs = 5000;
              })},
             {"down-sampled source read past its end", Change([this](Composition &document) {
                  ComposerSegment segment = place(2, 400);
                  // It stays: 350 samples are left of the stream, of which 50 come.
                  segment.lStart = 300;
                  segment.lUsed = 400;
                  document.track(1)->segments = {segment};
              })},
             {"empty segment", Change([](Composition &document) {
                  ComposerSegment empty = *document.segment(0, 0);
                  empty.lUsed = 0;
                  empty.lTarget = 0;
                  document.track(0)->segments.insert(document.track(0)->segments.begin(), empty);
              })}},
            [this](const Change &change) {
                Composition document = twoTracks();
                change(document);
                compare(document);
            });
}

void tst_composerengine::randomDocuments()
{
    std::mt19937 generator = randomGenerator();
    const auto draw = [&generator](int limit) { return int(generator() % unsigned(limit)); };
    for (int run = 0; run < 20; ++run) {
        Composition document;
        document.target.sName = m_folder.path("out.wv");
        document.target.lSamples = run == 0 ? 100000 : 1 + draw(3000);
        const int tracks = 1 + draw(4);
        for (int t = 0; t < tracks; ++t) {
            document.addTrack();
            qint64 position = draw(500);
            for (int s = draw(5) + (t == 0); s > 0; --s) {
                ComposerSegment segment = place(draw(3), position);
                segment.lStart = draw(100);
                segment.lUsed = 1 + draw(int(segment.lSamples - segment.lStart));
                segment.dLOfs = draw(200) / 10.0;
                segment.dFadeIn = draw(2) * draw(300) * 1e-6;
                segment.dFadeOut = draw(2) * draw(300) * 1e-6;
                segment.iFadeIn = draw(4);
                segment.iFadeOut = draw(4);
                segment.bWrap = draw(2) == 0;
                segment.bMkr = draw(2) == 0;
                position += document.targetSamples(segment) + draw(2) * draw(200);
                document.track(t)->segments.push_back(segment);
            }
        }
        // Something must sound.
        document.track(0)->segments.front() = place(0, 0);
        compare(document);
        if (QTest::currentTestFailed()) {
            return;
        }
    }
}

void tst_composerengine::failures()
{
    const auto check = [this](const QString &reason, const Change &change) {
        QVERIFY(m_folder.store("out.wv", "as it was"));
        Composition document = twoTracks();
        change(document);
        CapturedLog log;
        ComposerEngine engine(document);
        QVERIFY(!engine.runComposer());
        const QString text = log.take(Complaints).join('\n');
        QVERIFY2(text.contains(reason), qPrintable(text));
        QCOMPARE(m_folder.load("out.wv"), "as it was");
    };
    check("of track 2, segment 1 is missing",
          [](Composition &d) { d.segment(1, 0)->sName += "x"; });
    check("Waveform clock rate in file", [](Composition &d) { d.segment(1, 0)->dSrcClk = 1.5e6; });
    check("Sample count in file", [](Composition &d) { d.segment(1, 0)->lSamples = 499; });
    check("sum of the tracks is silent", [](Composition &d) { d.target.lSamples = 10; });
    check("samples; 1 to 2147483647 can be rendered",
          [](Composition &d) { d.target.lSamples = 3000000000; });
    check("no valid place", [](Composition &d) { d.segment(1, 0)->lTarget = -1; });
    check("Cannot initialize data stream", [](Composition &d) { d.segment(1, 0)->lStart = -1; });
    check("Error opening output file", [](Composition &d) { d.target.sName = "/nowhere/out.wv"; });
    check("", // told by a message
          [](Composition &d) { d.track(0)->bEnable = d.track(1)->bEnable = false; });
}

/// A cancel at any stage ends the run, leaves the output as it was and no temporary file behind.
void tst_composerengine::cancel()
{
    for (const char *line : {"reading files", "resampling", "Combining", "Rescaling"}) {
        QVERIFY(m_folder.store("out.wv", "as it was"));
        CapturedLog log;
        ComposerEngine engine(twoTracks());
        QStringList messages;
        connect(&engine, &ComposerEngine::message, this, [&](const QString &text) {
            messages.append(text);
            if (text.startsWith(line)) {
                engine.slot_cancel();
            }
        });
        QVERIFY2(!engine.runComposer(), line);
        QVERIFY(log.take(Complaints).join('\n').contains("aborted by user"));
        QCOMPARE(messages.last(), "Cleaning up 3 Temporary Files");
        QCOMPARE(m_folder.load("out.wv"), "as it was");
    }
}

void tst_composerengine::reports()
{
    Composition document = twoTracks();
    document.segment(1, 0)->dLOfs = -12; // lifts the sum beyond full scale
    document.track(0)->segments.pop_back();
    ComposerEngine engine(document);
    QStringList lines;
    for (const auto signal : {&ComposerEngine::message, &ComposerEngine::headline,
                              &ComposerEngine::warningMessage, &ComposerEngine::errorMessage}) {
        connect(&engine, signal, this, [&lines](const QString &text) { lines.append(text); });
    }
    QVERIFY(engine.runComposer());
    QVERIFY(lines.first().startsWith("Composer Engine started at "));
    const auto clipped = QRegularExpression("^\\d+ of 2000 values clipped, largest \\d\\.\\d\\d dB "
                                            "above full scale");
    QCOMPARE(lines.filter(clipped).size(), 1);
    QCOMPARE(lines.filter("2 Waveforms, 800 Input Samples").size(), 3);
    QCOMPARE(lines.filter("Processing Track").size(), 6);
    QVERIFY(lines.contains("  Will Create 1000 Output Samples"));
    QCOMPARE(lines.mid(lines.size() - 4, 3),
             (QStringList{"Saving Final Waveform to " + document.target.sName,
                          "Loop point: continuous", "Cleaning up 2 Temporary Files"}));
}

QTEST_GUILESS_MAIN(tst_composerengine)
#include "tst_composerengine.moc"
