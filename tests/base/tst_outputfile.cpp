// SPDX-License-Identifier: Apache-2.0
#include "base/OutputFile.h"

#include <QDir>
#include <QFile>
#include <QTemporaryDir>
#include <QTest>

#include <memory>

/// What stands under a name before, while and after a file of that name is written.
class TestOutputFile : public QObject
{
    Q_OBJECT

private slots:
    void init() { m_folder = std::make_unique<QTemporaryDir>(); }

    void keepsWhatStoodThere_data();
    void keepsWhatStoodThere();
    void keepsPermissionsAndLinks();
    void writesToDevices();
    void tellsWhy();

private:
    [[nodiscard]] QString path(const QString &name) const { return m_folder->filePath(name); }

    [[nodiscard]] QByteArray content(const QString &name) const
    {
        QFile file(path(name));
        return file.open(QIODevice::ReadOnly) ? file.readAll() : QByteArray("none");
    }

    [[nodiscard]] bool store(const QString &name, const QByteArray &bytes) const
    {
        QFile file(path(name));
        return file.open(QIODevice::WriteOnly) && file.write(bytes) == bytes.size();
    }

    std::unique_ptr<QTemporaryDir> m_folder;
};

void TestOutputFile::keepsWhatStoodThere_data()
{
    QTest::addColumn<QByteArray>("before"); // "none": no file
    QTest::addColumn<OutputFile::Unfinished>("unfinished");
    QTest::addColumn<QByteArray>("left"); // without a commit
    using enum OutputFile::Unfinished;
    QTest::newRow("new, stays") << QByteArray("none") << Stays << QByteArray("new");
    QTest::newRow("new, vanishes") << QByteArray("none") << Vanishes << QByteArray("none");
    QTest::newRow("empty, stays") << QByteArray("") << Stays << QByteArray("new");
    QTest::newRow("empty, vanishes") << QByteArray("") << Vanishes << QByteArray("");
    QTest::newRow("old, stays") << QByteArray("old one") << Stays << QByteArray("old one");
    QTest::newRow("old, vanishes") << QByteArray("old one") << Vanishes << QByteArray("old one");
}

void TestOutputFile::keepsWhatStoodThere()
{
    QFETCH(QByteArray, before);
    QFETCH(OutputFile::Unfinished, unfinished);
    const bool exists = before != "none";
    QVERIFY(!exists || store("out", before));
    for (const bool commits : {false, true}) {
        {
            OutputFile file(path("out"), unfinished);
            QVERIFY(!file.isOpen());
            QVERIFY(file.open() && file.isOpen() && file.write(QByteArrayView("new")));
            QVERIFY(!commits || file.commit());
        }
        QFETCH(QByteArray, left);
        QCOMPARE(content("out"), commits ? QByteArray("new") : left);
        // Nothing is left beside it.
        QVERIFY(QDir(m_folder->path()).entryList(QDir::Files | QDir::Hidden).size() <= 1);
    }
}

void TestOutputFile::keepsPermissionsAndLinks()
{
    QVERIFY(QDir(m_folder->path()).mkdir("sub") && store("sub/real", "old"));
    const auto permissions = QFile::ReadOwner | QFile::WriteOwner | QFile::ReadGroup;
    QVERIFY(QFile::setPermissions(path("sub/real"), permissions));
    QVERIFY(QFile::link("sub/real", path("near")) && QFile::link("near", path("far")));
    OutputFile file(path("far"), OutputFile::Unfinished::Stays);
    QVERIFY(file.open() && file.write(QByteArrayView("new")));
    QCOMPARE(content("sub/real"), QByteArray("old"));
    QVERIFY(file.commit());
    QCOMPARE(content("sub/real"), QByteArray("new"));
    QVERIFY(QFileInfo(path("far")).isSymLink() && QFileInfo(path("near")).isSymLink());
    const auto user = QFile::ReadUser | QFile::WriteUser;
    QCOMPARE(QFile::permissions(path("sub/real")) & ~user, permissions);
}

void TestOutputFile::writesToDevices()
{
    // Replacing it by a file would break every other program.
    for (const auto unfinished :
         {OutputFile::Unfinished::Stays, OutputFile::Unfinished::Vanishes}) {
        OutputFile file("/dev/null", unfinished);
        QVERIFY(file.open() && file.write(QByteArrayView("new")) && file.commit());
        QVERIFY(QFileInfo::exists("/dev/null") && !QFileInfo("/dev/null").isFile());
    }
}

void TestOutputFile::tellsWhy()
{
    OutputFile nowhere(path("none/out"), OutputFile::Unfinished::Vanishes);
    QVERIFY(!nowhere.open());
    QCOMPARE(nowhere.errorString(), QString("No such file or directory"));
    OutputFile full("/dev/full", OutputFile::Unfinished::Stays);
    QVERIFY(full.open() && !full.write(QByteArrayView("new")));
    QCOMPARE(full.errorString(), QString("No space left on device"));
}

QTEST_GUILESS_MAIN(TestOutputFile)
#include "tst_outputfile.moc"
