// SPDX-License-Identifier: Apache-2.0
// Pulses by hand arithmetic, the kinds that no dialog offers among them.
#include "dsp/signalgenerators.h"

#include <QTest>

#include <cmath>
#include <numbers>

using std::numbers::pi;

namespace {

/// The real part of a single pulse.
std::vector<double> envelopeOf(const PulseSettings &settings)
{
    const std::optional<SignalFit> fit = fitPulse(settings, ClockLimits{});
    if (!fit) {
        return {};
    }
    PulseRecord record;
    record.pulse = settings;
    std::vector<double> inPhase(static_cast<size_t>(fit->samples));
    std::vector<double> quadrature(inPhase.size());
    makePulse(record, *fit)->fill(0, inPhase, quadrature);
    return inPhase;
}

} // namespace

class TestPulses : public QObject
{
    Q_OBJECT

private slots:
    void pulseEdges();
    void doublePulse();
    void codedPulse();
};

void TestPulses::pulseEdges()
{
    const std::vector<double> samples =
        envelopeOf(PulseSettings{1e-5, 1e-4, 2e-5, 1e-4, RampKind::Linear, 1e-7});
    QCOMPARE(samples.size(), size_t{2300});
    QCOMPARE(samples[0], 0.0);
    QCOMPARE(samples[50], 0.5);
    QCOMPARE(samples[100], 1.0);
    QCOMPARE(samples[1100], 1.0);
    QCOMPARE(samples[1200], 0.5);
    QCOMPARE(samples[1300], 0.0);
    const std::vector<double> square =
        envelopeOf(PulseSettings{0, 1e-4, 0, 1e-4, RampKind::Linear, 1e-7});
    QCOMPARE(square[0], 1.0);
    QCOMPARE(square[999], 1.0);
    QCOMPARE(square[1000], 0.0);
}

void TestPulses::doublePulse()
{
    // At 1 MHz: rise 2, on 3, fall 4, pause 5, blank 10. The second pulse ends at 2 x 9 + 5 = 23;
    // its last value, a quarter, stays up to 23 - 4 + 10 = 29.
    PulseRecord record;
    record.kind = PulseKind::Double;
    record.pulse = {2e-6, 3e-6, 4e-6, 10e-6, RampKind::Linear, 1e-6};
    record.pause = 5e-6;
    record.level1 = 0.5;
    record.level2 = 0.8;
    record.phase2 = 60;
    SignalFit fit;
    fit.clock = 1e6;
    fit.samples = 35;
    const auto generator = makePulse(record, fit);
    QVERIFY(generator != nullptr);
    std::vector<double> inPhase(35);
    std::vector<double> quadrature(35);
    generator->fill(0, inPhase, quadrature);
    const std::vector<double> envelope{0, 0.5, 1, 1, 1, 1, 0.75, 0.5, 0.25};
    for (size_t i = 0; i < 35; ++i) {
        const bool isFirst = i < 9;
        const bool isSecond = i >= 14 && i < 29;
        const double second = isSecond ? envelope[std::min<size_t>(i - 14, 8)] * 0.8 : 0.0;
        const double expectedQ = isFirst ? 0.5 * envelope[i] : second * std::sin(pi / 3);
        QVERIFY(std::abs(inPhase[i] - second * 0.5) < 1e-8);
        QVERIFY(std::abs(quadrature[i] - expectedQ) < 1e-8);
    }
}

void TestPulses::codedPulse()
{
    // At 1 MHz: rise 2, on 28, fall 2, transitions of 4: symbols of (28 + 4) / 4 = 8 samples. The
    // transition of a symbol fills its last 4 samples, and the fall cuts off the last one's.
    PulseRecord record;
    record.kind = PulseKind::Coded;
    record.pulse = {2e-6, 28e-6, 2e-6, 4e-6, RampKind::Linear, 1e-6};
    record.pattern = "1101";
    record.transitionTime = 4e-6;
    SignalFit fit;
    fit.clock = 1e6;
    fit.samples = 36;
    auto generator = makePulse(record, fit);
    QVERIFY(generator != nullptr);
    std::vector<double> inPhase(36);
    std::vector<double> q(36);
    // In two pieces, as a stream would be.
    generator->fill(0, std::span(inPhase).first(11), std::span(q).first(11));
    generator->fill(11, std::span(inPhase).subspan(11), std::span(q).subspan(11));
    const std::vector<double> expected{
        0,   0.5,                             // rise
        1,   1,   1,   1,  1,  1,    1, 1,    // equal symbols have no transition between them
        1,   1,   1,   1,  1,  0.5,  0, -0.5, // from +1 to -1 in steps of 2 / 4
        -1,  -1,  -1,  -1, -1, -0.5, 0, 0.5,  1, 1, 1, 1, // the last symbol has no next one
        1,   0.5,                                         // fall
        0.5, 0.5, 0.5, 0.5};                              // the last value stays
    QCOMPARE(q, expected);
    QCOMPARE(inPhase, std::vector<double>(36));

    record.pattern.clear();
    QVERIFY(makePulse(record, fit) == nullptr);
    record.pattern = "1";
    record.pulse.onTime = 0;
    record.transitionTime = 0;
    QVERIFY(makePulse(record, fit) == nullptr);
    record.kind = static_cast<PulseKind>(4);
    QVERIFY(makePulse(record, fit) == nullptr);
}

QTEST_GUILESS_MAIN(TestPulses)
#include "tst_pulses.moc"
