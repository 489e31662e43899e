// SPDX-License-Identifier: Apache-2.0
#include "dsp/Resample.h"
#include "log/Tracer.h"
#include "wvfile/TempStream.h"

#include <QTest>

#include <cmath>

class TestResample : public QObject
{
    Q_OBJECT
private slots:
    void rescale();
};

void TestResample::rescale()
{
    TempStream stream;
    QVERIFY(stream.open());
    QVERIFY(stream->writeHeader("IQF"));
    for (int i = 0; i < 100000; ++i) {
        const float iq[2] = {static_cast<float>(i) * 1e-5F, -0.5F};
        QVERIFY(stream->writeBytes(8, iq));
    }
    Resample resample;
    QVERIFY(resample.rescale(100000, 0.5, stream.stream()));
    double peak = 0;
    double rms = 0;
    QVERIFY(resample.statistics(100000, stream.stream(), &peak, &rms));
    QVERIFY(std::abs(peak - 0.5 * std::hypot(0.99999, 0.5)) < 1e-6);
    QVERIFY(std::abs(rms - 0.5 * std::sqrt(1.0 / 3 + 0.25)) < 1e-5);
    (void)Tracer::takeEntries();
    QVERIFY(!resample.rescale(100001, 0.5, stream.stream()));
    const QList<Tracer::Entry> log = Tracer::takeEntries();
    QCOMPARE(log.size(), 1);
    QVERIFY(log.first().first.endsWith("*** Reading failed for sample 100000."));
}

QTEST_GUILESS_MAIN(TestResample)
#include "tst_resample.moc"
