// SPDX-License-Identifier: Apache-2.0
#include "streams/TempStream.h"
#include "support/logreader.h"
#include "support/seed.h"
#include "view/PlayInterval.h"
#include "view/ViewWindow.h"

#include <QTest>

#include <algorithm>
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

} // namespace

class TestViewWindow : public QObject
{
    Q_OBJECT

private slots:
    void init() { (void)Tracer::takeEntries(); }
    void anyOrderOfMoves();
    void failures();
    void readsAnewAfterAWrite();
    void playbackReachesTheEnd();
    void playInterval();
};

/// Any order of moves shows what stands there; the waveform is longer than the piece that the
/// window keeps of the streams.
void TestViewWindow::anyOrderOfMoves()
{
    std::mt19937 random = randomGenerator();
    for (const qint64 count : {1, 3, 50, 511, 4999, 5000, 30'000, 1'500'000}) {
        Waveform waveform(count);
        QVERIFY(waveform.isGood());
        ViewWindow window;
        window.setSource(waveform.data.stream(), waveform.markers.stream(), waveform.count);
        // A plain model: the steps of the zoom end at the count.
        QList<qint64> ladder;
        for (const int step : ViewWindow::ZoomLadder) {
            if (ladder.isEmpty() || ladder.last() < count) {
                ladder << std::min<qint64>(step, count);
            }
        }
        qsizetype level = ladder.indexOf(std::min<qint64>(ViewWindow::DefaultPoints, count));
        qint64 first = 0;
        QVERIFY(window.show(0));
        for (int i = 0; i < 60; ++i) {
            const qint64 points = ladder.at(level);
            const qint64 last = count - points;
            const qint64 little = std::max<qint64>(points / 20, 1);
            const auto bound = [&](qint64 at) { return std::clamp<qint64>(at, 0, last); };
            QCOMPARE(qint64(window.points()), points);
            QCOMPARE(window.end(), last);
            QCOMPARE(window.reverse(), bound(first - points));
            QCOMPARE(window.reverseLittle(), bound(first - little));
            QCOMPARE(window.centredOn(first), bound(first - points / 2));
            switch (random() % 6) {
            case 0:
                first = window.reverse();
                QVERIFY(window.show(first));
                break;
            case 1:
            case 2: {
                // Beyond the end the view is not shifted, and nothing is logged.
                const qint64 target = first + (i % 2 == 0 ? points : little);
                QCOMPARE(i % 2 == 0 ? window.forward() : window.forwardLittle(), target);
                if (target < count) {
                    QCOMPARE(window.show(target), target <= last);
                    first = target <= last ? target : first;
                }
                break;
            }
            case 3:
                first = static_cast<qint64>(random()) % (last + 1);
                QVERIFY(window.show(first));
                break;
            default: {
                const bool in = random() % 2 == 0;
                QVERIFY(in ? window.zoomIn() : window.zoomOut());
                level = std::clamp<qsizetype>(level + (in ? -1 : 1), 0, ladder.size() - 1);
                const qint64 now = ladder.at(level);
                first = std::clamp<qint64>(first + points / 2 - now / 2, 0, count - now);
            }
            }
            QCOMPARE(window.first(), first);
            const QString fault = contentFault(window);
            QVERIFY2(fault.isEmpty(), qPrintable(fault));
        }
        QVERIFY(takeMessages(Tracer::DebugMask).isEmpty());
    }
}

void TestViewWindow::failures()
{
    ViewWindow window;
    QVERIFY(!window.show(0));
    Waveform waveform(6000);
    // A count that the streams don't hold.
    window.setSource(waveform.data.stream(), waveform.markers.stream(), 20000);
    (void)takeMessages();
    QVERIFY(!window.show(5000));
    QCOMPARE(takeMessages(), QStringList("Cannot read I/Q data from temporary file."));
    QVERIFY(window.samples().isEmpty());
    QVERIFY(window.show(0) && contentFault(window).isEmpty());
    Waveform other(100);
    window.setSource(waveform.data.stream(), other.markers.stream(), 6000);
    QVERIFY(!window.show(0));
    QCOMPARE(takeMessages(), QStringList("Cannot read marker data from temporary file."));
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
    QCOMPARE(takeMessages(Tracer::DebugMask), QStringList("Play interval adjusted."));
    QCOMPARE(interval.milliseconds(), 150);
    QVERIFY(interval.fit(5'000'000'000));
    QCOMPARE(interval.milliseconds(), PlayInterval::LongestMs);
    (void)takeMessages();
    QVERIFY(!interval.fit(2000)); // no line for every tick from then on
    QVERIFY(takeMessages(Tracer::DebugMask).isEmpty());
    interval.reset();
    QCOMPARE(interval.milliseconds(), PlayInterval::StartMs);
}

QTEST_APPLESS_MAIN(TestViewWindow)
#include "tst_viewwindow.moc"
