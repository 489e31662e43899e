// SPDX-License-Identifier: Apache-2.0
#include "base/ProgressClock.h"
#include "base/SideWorker.h"
#include "base/parallel.h"

#include <QCoreApplication>
#include <QDeadlineTimer>
#include <QTest>
#include <QTimer>

#include <atomic>
#include <thread>
#include <vector>

class TestParallel : public QObject
{
    Q_OBJECT

private slots:
    void cleanup() { setThreadLimit(0); }

    void everyIndexOnce_data();
    void everyIndexOnce();
    void sideWorkerKeepsTheOrder_data();
    void sideWorkerKeepsTheOrder();
    void sideWorkerEndsWithItsWorkDone();
    void clockTicksAndStops();
};

void TestParallel::everyIndexOnce_data()
{
    QTest::addColumn<unsigned>("limit");
    QTest::addColumn<int>("count");
    for (const unsigned limit : {0U, 1U, 2U, 7U}) {
        for (const int count : {0, 1, 2, 1000}) {
            QTest::addRow("%u threads, %d items", limit, count) << limit << count;
        }
    }
}

void TestParallel::everyIndexOnce()
{
    QFETCH(unsigned, limit);
    QFETCH(int, count);
    setThreadLimit(limit);
    QCOMPARE(threadCount() == limit || limit == 0, true);
    std::vector<std::atomic<int>> calls(static_cast<size_t>(count));
    parallelFor(calls.size(), [&](size_t index) { ++calls.at(index); });
    for (const auto &call : calls) {
        QCOMPARE(call.load(), 1);
    }
}

void TestParallel::sideWorkerKeepsTheOrder_data()
{
    QTest::addColumn<unsigned>("limit");
    QTest::newRow("beside the caller") << 2U;
    QTest::newRow("no second thread allowed") << 1U;
}

void TestParallel::sideWorkerKeepsTheOrder()
{
    QFETCH(unsigned, limit);
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
}

void TestParallel::sideWorkerEndsWithItsWorkDone()
{
    setThreadLimit(2);
    for (int i = 0; i < 200; ++i) {
        bool done = false;
        {
            SideWorker worker;
            worker.start([&] { done = true; });
        }
        QVERIFY(done);
    }
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
