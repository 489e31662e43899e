// SPDX-License-Identifier: Apache-2.0
#include "log/Tracer.h"
#include "support/logreader.h"
#include "support/rows.h"

#include <QLocale>
#include <QSignalSpy>
#include <QTest>
#include <QThread>
#include <QTime>

#include <memory>
#include <thread>
#include <vector>

class TestTracer : public QObject
{
    Q_OBJECT

private slots:
    void init() { static_cast<void>(Tracer::takeEntries()); }
    void cleanup() { Tracer::setMask(Tracer::DefaultMask); }

    void levelsAgainstMask();
    void lineIsStampedWithTimeAndTwoBlanks();
    void workerReachesTheListenersThread();
    void slotMayLogAndDestroyListeners();
    void threadsKeepTheirOrder();
    void entriesComeInOrderUpToABound();
};

void TestTracer::levelsAgainstMask()
{
    forRows({{"error", Tracer::DefaultMask, 4, true},
             {"debug without --debug", Tracer::DefaultMask, 16, false},
             {"debug with --debug", Tracer::DebugMask, 16, true},
             {"one common bit is enough", 4U, 12, true},
             {"no common bit", 8U, 7, false}},
            [&](unsigned mask, int level, bool kept) {
                const Tracer listener;
                QSignalSpy told(&listener, &Tracer::TraceDataAvailable);
                Tracer::setMask(mask);
                QCOMPARE(Tracer::isEnabled(level), kept);
                Tracer::Trace(level, QString("text"));
                Tracer::Trace(level, "literal");
                QCOMPARE(told.count(), kept ? 2 : 0);
                const QList<Tracer::Entry> entries = Tracer::takeEntries();
                QCOMPARE(entries.size(), kept ? 2 : 0);
                for (const Tracer::Entry &entry : entries) {
                    QCOMPARE(entry.second, level);
                }
            });
}

void TestTracer::lineIsStampedWithTimeAndTwoBlanks()
{
    const auto now = [] {
        return QLocale::system().toString(QTime::currentTime(), QLocale::ShortFormat);
    };
    // The minute may turn between the two looks at the clock.
    const QString before = now();
    Tracer::Trace(Tracer::Information, "  two blanks more");
    const QString after = now();
    const QString line = Tracer::takeEntries().value(0).first;
    QVERIFY2(line == before + "    two blanks more" || line == after + "    two blanks more",
             qPrintable(line));
}

void TestTracer::workerReachesTheListenersThread()
{
    const Tracer listener;
    QStringList lines;
    const QThread *slotThread = nullptr;
    connect(&listener, &Tracer::TraceDataAvailable, this, [&] {
        slotThread = QThread::currentThread();
        lines << takeMessages();
    });
    std::thread worker([] { Tracer::Trace(4, "from a worker"); });
    worker.join();
    QVERIFY(lines.isEmpty());
    QTRY_COMPARE(lines, QStringList("from a worker"));
    QCOMPARE(slotThread, QThread::currentThread());
}

/// A slot may log, end other listeners, and wait for a worker that logs.
void TestTracer::slotMayLogAndDestroyListeners()
{
    const Tracer first;
    auto second = std::make_unique<Tracer>();
    int told = 0;
    connect(&first, &Tracer::TraceDataAvailable, this, [&] {
        second.reset();
        ++told;
        if (told == 1) {
            Tracer::Trace(1, "again");
            std::thread worker([] { Tracer::Trace(1, "from a worker"); });
            worker.join();
        }
    });
    connect(second.get(), &Tracer::TraceDataAvailable, this, [] { QFAIL("told after its end"); });
    Tracer::Trace(1, "once");
    QTRY_COMPARE(told, 3);
    QCOMPARE(takeMessages(Tracer::Information).size(), 3);
}

void TestTracer::threadsKeepTheirOrder()
{
    constexpr int threads = 4;
    constexpr int lines = 1000;
    std::vector<std::thread> workers;
    workers.reserve(threads);
    for (int i = 0; i < threads; ++i) {
        workers.emplace_back([i] {
            for (int k = 0; k < lines; ++k) {
                const Tracer comesAndGoes;
                Tracer::Trace(1, QString("%1 %2").arg(i).arg(k));
            }
        });
    }
    for (std::thread &worker : workers) {
        worker.join();
    }
    const QStringList entries = takeMessages(Tracer::Information);
    QCOMPARE(entries.size(), threads * lines);
    std::vector<int> next(threads, 0);
    for (const QString &entry : entries) {
        const QStringList text = entry.split(' ');
        QCOMPARE(text.at(1).toInt(), next.at(text.at(0).toUInt())++);
    }
}

void TestTracer::entriesComeInOrderUpToABound()
{
    CapturedLog log;
    Tracer::Trace(1, "a");
    QVERIFY(!Tracer::fail("b"));
    Tracer::Trace(2, "");
    QCOMPARE(log.take(), QStringList({"1|a", "4|b"}));
    constexpr int lines = 250'000;
    for (int i = 0; i < lines; ++i) {
        Tracer::Trace(1, QString::number(i));
    }
    const QStringList kept = log.take();
    QVERIFY(kept.size() <= 100'000);
    QVERIFY(kept.size() >= 90'000);
    QCOMPARE(kept.last(), QString("1|%1").arg(lines - 1));
    QCOMPARE(kept.first(), QString("1|%1").arg(lines - kept.size()));
}

QTEST_GUILESS_MAIN(TestTracer)
#include "tst_tracer.moc"
