// SPDX-License-Identifier: Apache-2.0
//
// A disk that fills up: a small file system in memory, mounted where this process alone sees it.
#include "streams/BufferedIO.h"
#include "streams/TempStream.h"
#include "support/files.h"
#include "support/logreader.h"
#include "support/rows.h"
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
        if (!store("/proc/self/setgroups", "deny") ||
            !store("/proc/self/uid_map", "0 " + QByteArray::number(user) + " 1") ||
            !store("/proc/self/gid_map", "0 " + QByteArray::number(group) + " 1")) {
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

    void writingAFile();
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

void TestDiskFull::writingAFile()
{
    forRows({{"some samples fit", mebibyte, {}}, {"over a file", mebibyte, "what stood there"}},
            [&](qint64 freeBytes, const QByteArray &before) {
                const QString path = m_disk + "/out.wv";
                QVERIFY(before.isEmpty() || store(path, before));
                const qint64 taken = m_freeAtStart - this->freeBytes();
                const QString filler = m_disk + "/filler";
                QVERIFY(store(filler, QByteArray(m_freeAtStart - taken - freeBytes, '\0')));
                WvWriteJob job;
                job.clock = 1;
                job.samples = 1000 * 1000;
                job.iSamples = job.qSamples = QList<float>(job.samples, 0.5F);
                job.markers = QList<int>(job.samples, 1);
                CapturedLog log;
                QVERIFY(!HvFileIO().writeWaveform(job, path, nullptr, nullptr, nullptr));
                QCOMPARE(log.take(Tracer::Error),
                         QStringList("4|Error writing output file: No space left on device"));
                QVERIFY(before.isEmpty() ? !QFile::exists(path)
                                         : load(path) == before && QFile::remove(path));
                QVERIFY2(QFile::remove(filler), "and nothing else");
            });
}

void TestDiskFull::readingIntoStreams()
{
    forRows({{"samples", {}, qint64(4 * mebibyte), {"4|Cannot write to temporary file!"}},
             {"markers up to the control length",
              "{CONTROL LENGTH:40000000}",
              qint64(50 * mebibyte),
              {"4|Writing marker stream failed at position 33554432"}},
             {"unknown tags",
              "{FREE:" + QByteArray(40 * mebibyte, 'x') + '}',
              1,
              {"4|Cannot save unknown tag."}}},
            [&](const QByteArray &head, qint64 samples, const QStringList &words) {
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
                // Each stream says so, some when they go.
                const QString reason = "4|Cannot write to the temporary folder '" + m_disk +
                                       "': No space left on device";
                QStringList errors = log.take(Tracer::Error);
                QCOMPARE(errors.value(0), reason);
                errors.removeAll(reason);
                QCOMPARE(errors, words);
                QCOMPARE(freeBytes(), m_freeAtStart);
                QVERIFY(source.remove());
            });
}

int main(int argc, char **argv)
{
    const QByteArray missing = enterOwnMountTable();
    const QCoreApplication app(argc, argv);
    TestDiskFull test(missing);
    return QTest::qExec(&test, argc, argv);
}

#include "tst_diskfull.moc"
