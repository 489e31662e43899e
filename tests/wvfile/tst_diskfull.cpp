// SPDX-License-Identifier: Apache-2.0
//
// A disk that fills up: a small file system in memory, mounted where this process alone sees it.
#include "log/CapturedLog.h"
#include "streams/BufferedIO.h"
#include "streams/TempStream.h"
#include "wvfile/HvFileIO.h"

#include <QCoreApplication>
#include <QDir>
#include <QFile>
#include <QFileInfo>
#include <QTemporaryDir>
#include <QTest>

#include <cerrno>
#include <cstring>

#include <sched.h>
#include <sys/mount.h>
#include <sys/statvfs.h>
#include <unistd.h>

namespace {

constexpr qint64 mebibyte = 1'048'576;

bool writeText(const char *path, const QByteArray &text)
{
    QFile file(path);
    return file.open(QIODevice::WriteOnly | QIODevice::Unbuffered) &&
           file.write(text) == text.size();
}

/// Gives this process a mount table of its own; without the rights for that, by way of a user table
/// of its own. Must come before any thread. Empty on success, else what is missing.
QByteArray enterOwnMountTable()
{
    const uid_t user = ::geteuid();
    const gid_t group = ::getegid();
    if (user == 0) {
        if (::unshare(CLONE_NEWNS) != 0) {
            return QByteArray("no mount table of our own: ") + std::strerror(errno);
        }
    } else {
        if (::unshare(CLONE_NEWUSER | CLONE_NEWNS) != 0) {
            return QByteArray("neither root nor user namespaces: ") + std::strerror(errno);
        }
        if (!writeText("/proc/self/setgroups", "deny") ||
            !writeText("/proc/self/uid_map", "0 " + QByteArray::number(user) + " 1") ||
            !writeText("/proc/self/gid_map", "0 " + QByteArray::number(group) + " 1")) {
            return "the user table can't be filled";
        }
    }
    if (::mount("none", "/", nullptr, MS_REC | MS_PRIVATE, nullptr) != 0) {
        return QByteArray("mounts can't be made private: ") + std::strerror(errno);
    }
    return {};
}

} // namespace

class TestDiskFull : public QObject
{
    Q_OBJECT

public:
    explicit TestDiskFull(const QByteArray &missing)
        : m_missing(missing)
    {
    }

private slots:
    void initTestCase();
    void cleanupTestCase();
    void init() { QVERIFY(freeBytes() == m_freeAtStart); }

    void writingAFile_data();
    void writingAFile();
    void readingIntoStreams_data();
    void readingIntoStreams();

private:
    [[nodiscard]] qint64 freeBytes() const
    {
        struct statvfs space = {};
        return ::statvfs(m_disk.toLocal8Bit().constData(), &space) == 0
                   ? static_cast<qint64>(space.f_bfree * space.f_bsize)
                   : -1;
    }

    QByteArray m_missing;
    QTemporaryDir m_folder;
    QString m_disk;
    qint64 m_freeAtStart = 0;
};

void TestDiskFull::initTestCase()
{
    if (!m_missing.isEmpty()) {
        QSKIP(("needs a small file system of its own; " + m_missing).constData());
    }
    m_disk = m_folder.filePath("disk");
    QVERIFY(QDir().mkdir(m_disk));
    if (::mount("tmpfs", m_disk.toLocal8Bit().constData(), "tmpfs", 0, "size=20m") != 0) {
        QSKIP("needs the right to mount a small file system");
    }
    m_freeAtStart = freeBytes();
    QVERIFY(m_freeAtStart > 0);
    // Temporary files go to the small disk from here on.
    qputenv("TMPDIR", m_disk.toLocal8Bit());
}

void TestDiskFull::cleanupTestCase()
{
    if (m_freeAtStart > 0) {
        QCOMPARE(freeBytes(), m_freeAtStart);
        QCOMPARE(::umount(m_disk.toLocal8Bit().constData()), 0);
    }
}

void TestDiskFull::writingAFile_data()
{
    QTest::addColumn<qint64>("freeBytes");
    QTest::addColumn<QByteArray>("before");
    QTest::newRow("not a page left") << qint64(0) << QByteArray();
    QTest::newRow("some samples fit") << mebibyte << QByteArray();
    QTest::newRow("over a file") << mebibyte << QByteArray("what stood there");
}

void TestDiskFull::writingAFile()
{
    QFETCH(qint64, freeBytes);
    QFETCH(QByteArray, before);
    const QString path = m_disk + "/out.wv";
    QFile target(path);
    QVERIFY(before.isEmpty() ||
            (target.open(QIODevice::WriteOnly) && target.write(before) == before.size()));
    target.close();
    const qint64 taken = m_freeAtStart - this->freeBytes();
    QFile filler(m_disk + "/filler");
    QVERIFY(filler.open(QIODevice::WriteOnly | QIODevice::Unbuffered));
    const QByteArray zeros(m_freeAtStart - taken - freeBytes, '\0');
    QCOMPARE(filler.write(zeros), qint64(zeros.size()));
    filler.close();
    WvWriteJob job;
    job.clock = 1;
    job.samples = 1000 * 1000;
    job.iSamples = job.qSamples = QList<float>(job.samples, 0.5F);
    job.markers = QList<int>(job.samples, 1);
    CapturedLog log;
    QVERIFY(!HvFileIO().writeWaveform(job, path, nullptr, nullptr, nullptr));
    QCOMPARE(log.take(Tracer::Error),
             QStringList("4|Error writing output file: No space left on device"));
    if (before.isEmpty()) {
        QVERIFY2(QFileInfo(path).size() <= freeBytes, "what fitted stays");
    } else {
        QVERIFY(target.open(QIODevice::ReadOnly));
        QCOMPARE(target.readAll(), before);
    }
    QVERIFY(target.remove());
    QVERIFY2(filler.remove(), "and nothing else");
}

void TestDiskFull::readingIntoStreams_data()
{
    QTest::addColumn<QByteArray>("head");
    QTest::addColumn<qint64>("samples");
    QTest::addColumn<QStringList>("words");
    QTest::newRow("samples") << QByteArray() << qint64(4 * mebibyte)
                             << QStringList("4|Cannot write to temporary file!");
    QTest::newRow("a marker list")
        << QByteArray("{MARKER LIST 1: 0:1;40000000:0}") << qint64(50 * mebibyte)
        << QStringList("4| Cannot write to marker file at position 33554432");
    QTest::newRow("markers up to the control length")
        << QByteArray("{CONTROL LENGTH:40000000}") << qint64(50 * mebibyte)
        << QStringList("4|Writing marker stream failed at position 33554432");
    QTest::newRow("unknown tags") << "{FREE:" + QByteArray(40 * mebibyte, 'x') + '}' << qint64(1)
                                  << QStringList("4|Cannot save unknown tag.");
}

void TestDiskFull::readingIntoStreams()
{
    QFETCH(QByteArray, head);
    QFETCH(qint64, samples);
    QFETCH(QStringList, words);
    // The samples are a hole in a file on the large disk.
    QFile source(m_folder.filePath("in.wv"));
    QVERIFY(source.open(QIODevice::WriteOnly));
    source.write("{TYPE:TGX-WV}{SAMPLES:" + QByteArray::number(samples) + '}' + head +
                 "{WAVEFORM-" + QByteArray::number(4 * samples + 1) + ": #");
    QVERIFY(source.resize(source.pos() + 4 * samples));
    source.close();
    CapturedLog log;
    {
        TempStream data;
        TempStream markers;
        TempStream tags;
        QVERIFY(data.open() && markers.open() && tags.open());
        WvFileInfo info;
        info.fileName = source.fileName();
        info.dataStream = data.stream();
        info.markerStream = markers.stream();
        info.tagsStream = tags.stream();
        QVERIFY(!HvFileIO().readWaveform(&info));
    }
    QCOMPARE(log.take(Tracer::Error), words);
    QCOMPARE(freeBytes(), m_freeAtStart);
    QVERIFY(source.remove());
}

int main(int argc, char **argv)
{
    const QByteArray missing = enterOwnMountTable();
    const QCoreApplication app(argc, argv);
    TestDiskFull test(missing);
    return QTest::qExec(&test, argc, argv);
}

#include "tst_diskfull.moc"
