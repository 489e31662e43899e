// SPDX-License-Identifier: Apache-2.0
#include "log/Tracer.h"
#include "streams/TempStream.h"
#include "view/PlayInterval.h"
#include "view/ViewWindow.h"

#include <QTest>

#include <vector>

namespace {

/// A waveform whose samples tell their own position: I counts, Q counts down, markers cycle.
struct Waveform
{
    TempStream data;
    TempStream markers;
    qint64 count;

    explicit Waveform(qint64 samples)
        : count(samples)
    {
        std::vector<float> iq;
        std::vector<quint8> bytes;
        for (qint64 k = 0; k < samples; ++k) {
            iq.push_back(static_cast<float>(k));
            iq.push_back(static_cast<float>(-k));
            bytes.push_back(markerOf(k));
        }
        const int length = static_cast<int>(samples);
        m_good = data.open() && markers.open() && data->writeHeader("IQF") &&
                 (samples == 0 || (data->writeBytes(8 * length, iq.data()) &&
                                   markers->writeBytes(length, bytes.data())));
    }

    static quint8 markerOf(qint64 k) { return static_cast<quint8>(k % 13); }
    bool isGood() const { return m_good; }

private:
    bool m_good = false;
};

QString contentFault(const ViewWindow &window)
{
    if (window.samples().size() != window.points() || window.markers().size() != window.points()) {
        return "wrong length";
    }
    for (int k = 0; k < window.points(); ++k) {
        const auto position = static_cast<double>(window.first() + k);
        if (window.samples().at(k).i != position || window.samples().at(k).q != -position ||
            window.markers().at(k) != Waveform::markerOf(window.first() + k)) {
            return QString("sample %1 at %2").arg(window.samples().at(k).i).arg(position);
        }
    }
    return {};
}

QString takeLog()
{
    QStringList lines;
    for (const Tracer::Entry &entry : Tracer::takeEntries()) {
        lines += entry.first.section("  ", 1);
    }
    return lines.join('\n');
}

} // namespace

class TestViewWindow : public QObject
{
    Q_OBJECT

private slots:
    void init() { (void)Tracer::takeEntries(); }
    void movesShowTheRightSamples();
    void zoomLadder();
    void zoomKeepsTheMiddle();
    void shortFiles_data();
    void shortFiles();
    void failuresHaveTheirWords();
    void readsAnewAfterAWrite();
    void playStep_data();
    void playStep();
    void playbackReachesTheEnd();
    void playInterval();
};

void TestViewWindow::movesShowTheRightSamples()
{
    // Longer than the piece that the window keeps of the streams, so that moves cross its ends.
    Waveform waveform(1'500'000);
    QVERIFY(waveform.isGood());
    ViewWindow window;
    window.setSource(waveform.data.stream(), waveform.markers.stream(), waveform.count);
    QCOMPARE(window.points(), 5000);
    const auto check = [&window](qint64 first) {
        QVERIFY2(window.show(first), qPrintable(QString::number(first)));
        QCOMPARE(window.first(), first);
        const QString fault = contentFault(window);
        QVERIFY2(fault.isEmpty(), qPrintable(fault));
    };
    check(0);
    check(window.forward());
    QCOMPARE(window.first(), 5000);
    check(window.forwardLittle());
    QCOMPARE(window.first(), 5250);
    check(window.reverse());
    check(window.reverse());
    QCOMPARE(window.first(), 0);
    check(window.reverseLittle());
    QCOMPARE(window.first(), 0);
    check(window.end());
    QCOMPARE(window.first(), 1'495'000);
    for (const qint64 first : {900'000, 897'003, 899'999, 300'000, 600'001, 260'000}) {
        check(first);
    }
    // Beyond the end the view is not shifted, and nothing is logged.
    check(window.end() - 100);
    QVERIFY(!window.show(window.forward()));
    QCOMPARE(window.first(), 1'494'900);
    QVERIFY(contentFault(window).isEmpty());
    QVERIFY(takeLog().isEmpty());
}

void TestViewWindow::zoomLadder()
{
    Waveform waveform(30000);
    ViewWindow window;
    window.setSource(waveform.data.stream(), waveform.markers.stream(), waveform.count);
    QVERIFY(window.show(0));
    QList<int> steps;
    for (int k = 0; k < 8; ++k) {
        QVERIFY(window.zoomIn());
        steps += window.points();
    }
    QCOMPARE(steps, QList<int>({2000, 1000, 500, 200, 100, 50, 50, 50}));
    steps.clear();
    for (int k = 0; k < 11; ++k) {
        QVERIFY(window.zoomOut());
        steps += window.points();
        QVERIFY(contentFault(window).isEmpty());
    }
    QCOMPARE(steps,
             QList<int>({100, 200, 500, 1000, 2000, 5000, 10000, 20000, 30000, 30000, 30000}));
    QCOMPARE(window.first(), 0);
    QVERIFY(window.zoomIn());
    QCOMPARE(window.points(), 20000);
}

void TestViewWindow::zoomKeepsTheMiddle()
{
    Waveform waveform(30000);
    ViewWindow window;
    window.setSource(waveform.data.stream(), waveform.markers.stream(), waveform.count);
    QVERIFY(window.show(10000));
    QVERIFY(window.zoomIn());
    QCOMPARE(window.first(), 11500); // 12500 - 1000
    QVERIFY(window.zoomOut());
    QCOMPARE(window.first(), 10000);
    QVERIFY(window.show(25000));
    QVERIFY(window.zoomOut()); // about 27500, but not beyond the end
    QCOMPARE(window.first(), 20000);
    QCOMPARE(window.centredOn(10), 0);
    QCOMPARE(window.centredOn(15000), 10000);
}

void TestViewWindow::shortFiles_data()
{
    QTest::addColumn<int>("samples");
    for (const int samples : {1, 3, 50, 511, 4999, 5000}) {
        QTest::addRow("%d", samples) << samples;
    }
}

void TestViewWindow::shortFiles()
{
    QFETCH(int, samples);
    Waveform waveform(samples);
    ViewWindow window;
    window.setSource(waveform.data.stream(), waveform.markers.stream(), waveform.count);
    QCOMPARE(window.points(), samples);
    QVERIFY(window.show(0));
    QVERIFY(contentFault(window).isEmpty());
    QVERIFY(window.zoomOut());
    QCOMPARE(window.points(), samples);
    QVERIFY(window.zoomIn());
    QVERIFY(contentFault(window).isEmpty());
    QCOMPARE(window.end(), samples - window.points());
}

void TestViewWindow::failuresHaveTheirWords()
{
    ViewWindow window;
    QVERIFY(!window.show(0));
    QCOMPARE(takeLog(), "Internal errors: Buffers not available.");

    Waveform empty(0);
    window.setSource(empty.data.stream(), empty.markers.stream(), 0);
    QVERIFY(!window.show(0));
    QCOMPARE(takeLog(), "No number of display points.");

    Waveform waveform(6000);
    window.setSource(waveform.data.stream(), waveform.markers.stream(), 6000);
    QVERIFY(!window.show(6000));
    QVERIFY(!window.show(-1));
    QCOMPARE(takeLog(), "Invalid start sample.\nInvalid start sample.");

    // A count that the streams don't hold.
    window.setSource(waveform.data.stream(), waveform.markers.stream(), 20000);
    QVERIFY(!window.show(5000));
    QCOMPARE(takeLog(), "Cannot read I/Q data from temporary file.");
    QVERIFY(window.samples().isEmpty());
    QVERIFY(window.show(0));
    QVERIFY(contentFault(window).isEmpty());

    Waveform other(100);
    window.setSource(waveform.data.stream(), other.markers.stream(), 6000);
    QVERIFY(!window.show(0));
    QCOMPARE(takeLog(), "Cannot read marker data from temporary file.");

    (void)waveform.data->releaseBuf();
    window.setSource(waveform.data.stream(), waveform.markers.stream(), 6000);
    QVERIFY(!window.show(0));
    QVERIFY(takeLog().endsWith("Cannot read I/Q data from temporary file."));

    window.release();
    QVERIFY(!window.show(0));
    QCOMPARE(takeLog(), "Internal errors: Buffers not available.");
}

void TestViewWindow::readsAnewAfterAWrite()
{
    Waveform waveform(100);
    ViewWindow window;
    window.setSource(waveform.data.stream(), waveform.markers.stream(), 100);
    QVERIFY(window.show(0));
    const QByteArray high(100, '\x0f');
    QVERIFY(waveform.markers->restartAtBegining());
    QVERIFY(waveform.markers->writeBytes(100, high.constData()));
    window.invalidate();
    QVERIFY(window.show(0));
    QCOMPARE(window.markers(), QList<quint8>(100, 15));
}

void TestViewWindow::playStep_data()
{
    QTest::addColumn<int>("samples");
    QTest::addColumn<int>("step");
    QTest::newRow("a few") << 10 << 1;
    QTest::newRow("short view") << 2000 << 100;
    QTest::newRow("default view") << 5000 << 250;
}

void TestViewWindow::playStep()
{
    QFETCH(int, samples);
    Waveform waveform(samples);
    ViewWindow window;
    window.setSource(waveform.data.stream(), waveform.markers.stream(), samples);
    QTEST(static_cast<int>(window.playStep()), "step");
}

void TestViewWindow::playbackReachesTheEnd()
{
    Waveform waveform(5600);
    ViewWindow window;
    window.setSource(waveform.data.stream(), waveform.markers.stream(), 5600);
    QVERIFY(window.show(0));
    QList<qint64> starts;
    while (window.playTarget() != window.first()) {
        QVERIFY(window.show(window.playTarget()));
        starts += window.first();
    }
    QCOMPARE(starts, QList<qint64>({250, 500, 600}));
    // Long steps are whole spectrum frames: 20 000 / 20 = 1000 = 3 * 256 + 232.
    Waveform longer(30000);
    window.setSource(longer.data.stream(), longer.markers.stream(), 30000);
    QVERIFY(window.zoomOut() && window.zoomOut());
    QCOMPARE(window.points(), 20000);
    QCOMPARE(window.playStep(), 768);
}

void TestViewWindow::playInterval()
{
    PlayInterval interval;
    QVERIFY(!interval.fit(39));
    QCOMPARE(interval.milliseconds(), PlayInterval::StartMs);
    QVERIFY(interval.fit(100));
    QCOMPARE(takeLog(), "Play interval adjusted.");
    QCOMPARE(interval.milliseconds(), 150);
    QVERIFY(!interval.fit(149));
    QVERIFY(interval.fit(5'000'000'000));
    QCOMPARE(interval.milliseconds(), PlayInterval::LongestMs);
    (void)takeLog();
    QVERIFY(!interval.fit(2000)); // no line for every tick from then on
    QVERIFY(takeLog().isEmpty());
    interval.reset();
    QCOMPARE(interval.milliseconds(), PlayInterval::StartMs);
}

QTEST_APPLESS_MAIN(TestViewWindow)
#include "tst_ViewWindow.moc"
