// SPDX-License-Identifier: Apache-2.0
#include "base/OutputFile.h"
#include "support/files.h"
#include "support/rows.h"

#include <QDir>
#include <QFile>
#include <QTest>

#include <memory>

/// What stands under a name before, while and after a file of that name is written.
class TestOutputFile : public QObject
{
    Q_OBJECT

private slots:
    void init() { m_folder = std::make_unique<TestFolder>(); }

    void keepsWhatStoodThere();
    void keepsPermissionsAndLinks();
    void keepsWhatAppearsMeanwhile();
    void writesToDevices();

private:
    std::unique_ptr<TestFolder> m_folder;
};

void TestOutputFile::keepsWhatStoodThere()
{
    // What was there, null for no file.
    forRows({{"new", QByteArray()}, {"empty", QByteArray("")}, {"old", QByteArray("old one")}},
            [&](const QByteArray &before) {
                init();
                const bool exists = !before.isNull();
                QVERIFY(!exists || m_folder->store("out", before));
                for (const bool commits : {false, true}) {
                    {
                        OutputFile file(m_folder->path("out"));
                        QVERIFY(!file.isOpen());
                        QVERIFY(file.open() && file.isOpen() && file.write(QByteArrayView("new")));
                        QVERIFY(!commits || file.commit());
                    }
                    QCOMPARE(m_folder->load("out"), commits ? QByteArray("new") : before);
                    // Nothing is left beside it.
                    QVERIFY(m_folder->entries().size() <= 1);
                }
            });
}

void TestOutputFile::keepsPermissionsAndLinks()
{
    QVERIFY(QDir(m_folder->path()).mkdir("sub") && m_folder->store("sub/real", "old"));
    const auto permissions = QFile::ReadOwner | QFile::WriteOwner | QFile::ReadGroup;
    QVERIFY(QFile::setPermissions(m_folder->path("sub/real"), permissions));
    QVERIFY(QFile::link("sub/real", m_folder->path("near")) &&
            QFile::link("near", m_folder->path("far")));
    OutputFile file(m_folder->path("far"));
    QVERIFY(file.open() && file.write(QByteArrayView("new")));
    QCOMPARE(m_folder->load("sub/real"), QByteArray("old"));
    QVERIFY(file.commit());
    QCOMPARE(m_folder->load("sub/real"), QByteArray("new"));
    QVERIFY(QFileInfo(m_folder->path("far")).isSymLink() &&
            QFileInfo(m_folder->path("near")).isSymLink());
    const auto user = QFile::ReadUser | QFile::WriteUser;
    QCOMPARE(QFile::permissions(m_folder->path("sub/real")) & ~user, permissions);
}

void TestOutputFile::keepsWhatAppearsMeanwhile()
{
    const auto kept = OutputFile::Existing::Kept;
    OutputFile file(m_folder->path("out"), kept);
    QVERIFY(file.open() && file.write(QByteArrayView("new")));
    QVERIFY(m_folder->store("out", "another's"));
    QVERIFY(!file.commit() && file.errorString() == "A file of this name exists already");
    QVERIFY(!OutputFile(m_folder->path("out"), kept).open());
    QCOMPARE(m_folder->load("out"), QByteArray("another's"));
    OutputFile other(m_folder->path("other"), kept);
    QVERIFY(other.open() && other.write(QByteArrayView("new")) && other.commit());
    QCOMPARE(m_folder->load("other"), QByteArray("new"));
    QVERIFY(QFile::link("other", m_folder->path("link")));
    QVERIFY(isSameFile(m_folder->path("link"), m_folder->path("other")));
    QVERIFY(!isSameFile(m_folder->path("out"), m_folder->path("other")));
}

void TestOutputFile::writesToDevices()
{
    // Replacing it by a file would break every other program.
    OutputFile file("/dev/null");
    QVERIFY(file.open() && file.write(QByteArrayView("new")) && file.commit());
    QVERIFY(QFileInfo::exists("/dev/null") && !QFileInfo("/dev/null").isFile());
}

QTEST_GUILESS_MAIN(TestOutputFile)
#include "tst_outputfile.moc"
