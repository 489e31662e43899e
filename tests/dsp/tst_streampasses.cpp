// SPDX-License-Identifier: Apache-2.0
#include "dsp/Resample.h"
#include "support/rows.h"

#include "stream_helpers.h"

#include <QTest>

#include <numbers>

using std::numbers::pi;

namespace {

enum class Pass { Run, Rescale, Shift, Split, Statistics };

/// Any pass over streams without end, one of which may be on a full disk.
class Passes
{
public:
    Resample resample;

    explicit Passes(int full = -1)
    {
        for (int i = 0; i < 3; ++i) {
            m_devices[i] = std::make_unique<EndlessDevice>(
                i == full ? 1000 : std::numeric_limits<qint64>::max());
            m_good = m_good && m_streams[i].initBuf(m_devices[i].get(), BufferedIO::ReadWrite);
        }
    }

    [[nodiscard]] bool isGood() const { return m_good; }

    bool call(Pass pass, int samples)
    {
        double peak = 0;
        double rms = 0;
        switch (pass) {
        case Pass::Run:
            resample.setInput(&m_streams[0], samples);
            resample.setOutput(&m_streams[1], samples);
            return resample.run();
        case Pass::Rescale:
            return resample.rescale(samples, 1.0, &m_streams[0]);
        case Pass::Shift:
            return resample.frequencyShift(samples, 1.0, 100.0, &m_streams[0]);
        case Pass::Split:
            return resample.polarSplit(samples, &m_streams[0], &m_streams[1], &m_streams[2], 0, 1);
        case Pass::Statistics:
            break;
        }
        return resample.statistics(samples, &m_streams[0], &peak, &rms);
    }

private:
    static constexpr int BufferBytes = 1 << 20;
    std::unique_ptr<EndlessDevice> m_devices[3];
    BufferedIO m_streams[3] = {BufferedIO(BufferBytes), BufferedIO(BufferBytes),
                               BufferedIO(BufferBytes)};
    bool m_good = true;
};

} // namespace

class TestStreamPasses : public QObject
{
    Q_OBJECT

private slots:
    void init() { (void)takeMessages(); }
    void rescaleAndStatistics();
    void frequencyShiftFollowsTheLoop();
    void polarSplitConjugates();
    void cancelAndReuse();
    void fullDisk();
};

void TestStreamPasses::rescaleAndStatistics()
{
    TempStream stream;
    QVERIFY(stream.open());
    const Samples samples = randomSamples(100000);
    QVERIFY(writeStream(*stream.stream(), samples));
    Resample resample;
    QVERIFY(resample.rescale(99999, 0.3, stream.stream()));
    const Samples scaled = readStream(*stream.stream());
    double highest = 0;
    double sum = 0;
    for (size_t i = 0; i < scaled.size(); ++i) {
        const std::complex<float> expected =
            i < 99999 ? std::complex<float>(samples[i].real() * 0.3F, samples[i].imag() * 0.3F)
                      : samples[i];
        QVERIFY(scaled[i] == expected);
        highest = std::max(highest, std::norm(std::complex<double>(expected)));
        sum += std::norm(std::complex<double>(expected));
    }
    double peak = 0;
    double rms = 0;
    QVERIFY(resample.statistics(100000, stream.stream(), &peak, &rms));
    QCOMPARE(peak, std::sqrt(highest));
    QCOMPARE(rms, std::sqrt(sum / 100000));

    QVERIFY(!resample.rescale(100001, 0.5, stream.stream()));
    QVERIFY(!resample.rescale(0, 0.5, stream.stream()));
    QVERIFY(!resample.rescale(1, std::nan(""), stream.stream()));
    QVERIFY(!resample.statistics(100001, stream.stream(), &peak, &rms));
    QVERIFY(stream->writeHeader("XYZ"));
    QVERIFY(!resample.rescale(1, 0.5, stream.stream()));
    QCOMPARE(
        takeMessages(),
        (QStringList{"*** Reading failed for sample 100000.", "*** Invalid input data length.",
                     "*** Invalid scaling factor nan.", "*** Reading failed for sample 100000.",
                     "*** Cannot validate data stream header."}));
}

void TestStreamPasses::frequencyShiftFollowsTheLoop()
{
    TempStream stream;
    QVERIFY(stream.open());
    Samples samples = randomSamples(200000);
    samples[7] = {0.0F, 0.5F}; // the axis with the full circle
    samples[8] = {0.0F, -0.5F};
    samples[9] = {-0.5F, 0.0F};
    samples[10] = {0.0F, 0.0F};
    Resample resample;
    // The last one passes the angles that the vector form reduces itself.
    for (const double frequency : {1000.0, -3.3e6, 4e9}) {
        QVERIFY(writeStream(*stream.stream(), samples));
        QVERIFY(resample.frequencyShift(200000, frequency, 1e7, stream.stream()));
        const Samples shifted = readStream(*stream.stream());
        double angle = 0.0;
        for (size_t i = 0; i < samples.size(); ++i) {
            const double re = samples[i].real();
            const double im = samples[i].imag();
            const double phase = re == 0 ? (im > 0 ? 2 * pi : -2 * pi) : std::atan2(im, re);
            const std::complex<double> expected = std::polar(std::hypot(re, im), phase + angle);
            QVERIFY(std::abs(std::complex<double>(shifted[i]) - expected) < 1e-7);
            angle += frequency * 6.283185307179586 / 1e7;
        }
    }
    QVERIFY(!resample.frequencyShift(10, 1e3, 0, stream.stream()));
    (void)takeMessages();
    QVERIFY(!resample.frequencyShift(10, 1e300, 1e6, stream.stream()));
    QCOMPARE(takeMessages(),
             QStringList{"*** Invalid frequency shift of 1e+300 Hz at a clock of 1e+06 Hz."});
}

void TestStreamPasses::polarSplitConjugates()
{
    TempStream source;
    TempStream phase;
    TempStream amplitude;
    QVERIFY(source.open() && phase.open() && amplitude.open());
    Samples samples = randomSamples(50000);
    samples[0] = 0;
    samples[1] = {0.0F, 0.5F};
    samples[2] = {0.0F, -0.5F};
    samples[3] = {-0.5F, 0.0F};
    samples[4] = {0.5F, 0.0F};
    QVERIFY(writeStream(*source.stream(), samples));
    Resample resample;
    QVERIFY(
        resample.polarSplit(50000, source.stream(), phase.stream(), amplitude.stream(), 0.25, 0.5));
    const Samples unit = readStream(*phase.stream());
    const Samples level = readStream(*amplitude.stream());
    QCOMPARE(unit.size(), samples.size());
    QCOMPARE(level.size(), samples.size());
    for (size_t i = 0; i < samples.size(); ++i) {
        const double re = samples[i].real();
        const double im = samples[i].imag();
        const double angle = re == 0 ? (im > 0 ? 2 * pi : -2 * pi) : std::atan2(im, re);
        QVERIFY(std::abs(unit[i].real() - std::cos(angle)) < 1e-7);
        QVERIFY(std::abs(unit[i].imag() + std::sin(angle)) < 1e-7);
        QVERIFY(std::abs(level[i].real() - ((2 * std::hypot(re, im) - 1) * 0.5 + 0.25)) < 1e-7);
        QCOMPARE(level[i].imag(), 0.0F);
    }
    QVERIFY(!resample.polarSplit(50001, source.stream(), phase.stream(), amplitude.stream(), 0, 1));
    QCOMPARE(takeMessages(), QStringList{"*** Reading failed for sample 50000."});
}

void TestStreamPasses::cancelAndReuse()
{
    forRows({{"run", Pass::Run},
             {"rescale", Pass::Rescale},
             {"shift", Pass::Shift},
             {"split", Pass::Split},
             {"statistics", Pass::Statistics}},
            [this](Pass pass) {
                Passes passes;
                QVERIFY(passes.isGood());
                int ticks = 0;
                connect(&passes.resample, &Resample::ProgressUpdate, this, [&](int percent) {
                    QVERIFY(percent >= 0 && percent <= 100);
                    ++ticks;
                    passes.resample.cancel();
                });
                passes.resample.cancel(); // before the start it means nothing
                // As many samples as can be asked for: no machine is done before the first tick.
                QVERIFY(!passes.call(pass, std::numeric_limits<int>::max()));
                QCOMPARE(ticks, 1);
                QCOMPARE(takeMessages(), QStringList{"*** Action aborted by user."});
                QVERIFY(passes.call(pass, 1000));
            });
}

void TestStreamPasses::fullDisk()
{
    // A buffer of 1 MiB goes to the disk when it is full: with 3 bytes of header that is within
    // sample 131071.
    forRows({{"run", Pass::Run, 1, "*** Cannot write output data."},
             {"rescale", Pass::Rescale, 0, "*** Writing failed for sample 131071."},
             {"shift", Pass::Shift, 0, "*** Writing failed for sample 131071."},
             {"phase", Pass::Split, 1, "*** Writing phase data failed for sample 131071."},
             {"amplitude", Pass::Split, 2, "*** Writing amplitude data failed for sample 131071."}},
            [](Pass pass, int fullOne, const QString &message) {
                Passes passes(fullOne);
                QVERIFY(passes.isGood());
                QVERIFY(!passes.call(pass, 400'000));
                QCOMPARE(takeMessages(), QStringList{message});
            });
}

QTEST_GUILESS_MAIN(TestStreamPasses)
#include "tst_streampasses.moc"
