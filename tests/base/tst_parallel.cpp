// SPDX-License-Identifier: Apache-2.0
#include "base/ProgressClock.h"
#include "base/SideWorker.h"
#include "base/parallel.h"
#include "support/rows.h"

#include <QCoreApplication>
#include <QDeadlineTimer>
#include <QTest>
#include <QTimer>

#include <algorithm>
#include <atomic>
#include <thread>
#include <vector>

class TestParallel : public QObject
{
    Q_OBJECT

private slots:
    void cleanup() { setThreadLimit(0); }

    void everyIndexOnce();
    void sideWorkerKeepsTheOrder();
    void clockTicksAndStops();
};

void TestParallel::everyIndexOnce()
{
    for (const unsigned limit : {0U, 1U, 2U, 7U}) {
        setThreadLimit(limit);
        QVERIFY(limit == 0 || threadCount() == limit);
        for (const size_t count : {0U, 1U, 2U, 1000U}) {
            std::vector<std::atomic<int>> calls(count);
            parallelFor(count, [&](size_t index) { ++calls.at(index); });
            QVERIFY(std::all_of(calls.begin(), calls.end(),
                                [](const auto &call) { return call == 1; }));
        }
    }
}

void TestParallel::sideWorkerKeepsTheOrder()
{
    forRows({{"beside the caller", 2U}, {"no second thread allowed", 1U}}, [&](unsigned limit) {
        setThreadLimit(limit);
        constexpr int rounds = 2000;
        std::vector<int> done; // touched by one thread at a time, or the sanitizer finds it
        const auto caller = std::this_thread::get_id();
        bool sawOther = false;
        SideWorker worker;
        for (int i = 0; i < rounds; ++i) {
            worker.start([&, i] {
                done.push_back(i);
                sawOther = std::this_thread::get_id() != caller;
            });
        }
        worker.wait();
        worker.wait(); // nothing to wait for
        QCOMPARE(done.size(), size_t(rounds));
        for (int i = 0; i < rounds; ++i) {
            QCOMPARE(done.at(static_cast<size_t>(i)), i);
        }
        QCOMPARE(sawOther, limit > 1);
        {
            SideWorker ended;
            ended.start([&] { done.clear(); });
        }
        QVERIFY(done.empty());
    });
}

void TestParallel::clockTicksAndStops()
{
    std::atomic<bool> cancelled{false};
    QList<int> reports;
    ProgressClock clock([&](int percent) { reports << percent; }, cancelled);
    QVERIFY2(!clock.shouldStop(1, 2), "a tick at once");
    QVERIFY(reports.isEmpty());
    // The cancel comes through the event loop that the clock lets run.
    QTimer::singleShot(0, this, [&] { cancelled = true; });
    const QDeadlineTimer limit(10'000);
    while (!clock.shouldStop(1, 4, 50, 100) && !limit.hasExpired()) {
    }
    QVERIFY(cancelled);
    QCOMPARE(reports.value(0), 62); // 50 + trunc(50 / 4)
    QVERIFY2(!clock.shouldStop(99), "it looks at the flag at its ticks alone");
}

QTEST_GUILESS_MAIN(TestParallel)
#include "tst_parallel.moc"
