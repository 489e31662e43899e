// SPDX-License-Identifier: Apache-2.0
#include "simulator/ErrorQueue.h"
#include "simulator/MassMemory.h"
#include "simulator/wildcard.h"

#include <QDir>
#include <QFile>
#include <QTemporaryDir>
#include <QTest>

#include <sys/stat.h>

using namespace simulator;

namespace {

void writeFile(const QString &name, const QByteArray &content)
{
    QFile file(name);
    QVERIFY(file.open(QIODevice::WriteOnly));
    QCOMPARE(file.write(content), content.size());
}

} // namespace

class tst_MassMemory : public QObject
{
    Q_OBJECT

private slots:
    void init();
    void cleanup();
    void escapes_data();
    void escapes();
    void specialFiles();
    void driveNames();
    void catalogOrderAndTypes();
    void filters_data();
    void filters();
    void movingKeepsTarget();
    void rootsAreProtected();
    void wildcards_data();
    void wildcards();

private:
    std::unique_ptr<QTemporaryDir> m_folder;
    std::unique_ptr<MassMemory> m_unix;
    std::unique_ptr<MassMemory> m_drives;

    [[nodiscard]] QString top(const QString &name) const
    {
        return m_folder->filePath("top/" + name);
    }
};

// The folder around the top holds a secret that no path may reach, and links in the top lead there.
void tst_MassMemory::init()
{
    m_folder = std::make_unique<QTemporaryDir>();
    m_unix = std::make_unique<MassMemory>(true, std::vector<std::string>{"/var/user", "/hdd"});
    m_drives = std::make_unique<MassMemory>(false, std::vector<std::string>{"D:", "E:"});
    std::string error;
    QVERIFY(m_unix->open(m_folder->filePath("top").toStdString(), error));
    QVERIFY(m_drives->open(m_folder->filePath("top").toStdString(), error));
    QVERIFY(QDir(top("hdd")).exists() && QDir(top("E:")).exists());

    writeFile(m_folder->filePath("secret"), "secret");
    QDir(m_folder->path()).mkdir("outside");
    writeFile(m_folder->filePath("outside/secret"), "secret");
    for (const QString place : {"var/user", "D:"}) {
        QVERIFY(QFile::link(m_folder->filePath("outside"), top(place + "/folder")));
        QVERIFY(QFile::link(m_folder->filePath("outside/secret"), top(place + "/file")));
        QVERIFY(QFile::link(m_folder->filePath("outside/new"), top(place + "/dangling")));
    }
}

void tst_MassMemory::cleanup()
{
    QFile secret(m_folder->filePath("outside/secret"));
    QVERIFY(secret.open(QIODevice::ReadOnly));
    QCOMPARE(secret.readAll(), "secret");
    QVERIFY(QFile::exists(m_folder->filePath("secret")));
    QCOMPARE(QDir(m_folder->filePath("outside")).entryList(QDir::Files), QStringList("secret"));
    QCOMPARE(QDir(m_folder->path()).entryList(QDir::Dirs | QDir::NoDotAndDotDot),
             QStringList({"outside", "top"}));
}

void tst_MassMemory::escapes_data()
{
    QTest::addColumn<QString>("path");

    for (const char *path :
         {"..", "/..", "../secret", "/var/user/../../../secret", "/var/user/..\\..\\..\\secret",
          "D:..\\secret", "D:\\..\\..\\secret", "D:/x/../../secret", "folder/secret",
          "folder\\secret", "/var/user/folder/secret", "D:\\folder\\secret", "D:/FOLDER/secret",
          "file", "dangling", "/var/user/./folder/./secret", "//..//secret"})
        QTest::newRow(path) << path;
    QTest::newRow("absolute") << QDir::tempPath() + "/passwd";
    QTest::newRow("control character") << "a\x01\nb";
    QTest::newRow("long") << QString(300, 'x');
}

// Each operation refuses; that nothing outside was touched is looked at after each row.
void tst_MassMemory::escapes()
{
    QFETCH(QString, path);
    const std::string name = path.toStdString();
    for (MassMemory *memory : {m_unix.get(), m_drives.get()}) {
        UniqueFd fd;
        std::uint64_t size = 0;
        QVERIFY(memory->openForReading(name, fd, size) != NoError);
        std::unique_ptr<FileWriter> writer;
        QVERIFY(memory->openForWriting(name, writer) != NoError);
        QVERIFY(memory->makeDirectory(name) != NoError);
        QVERIFY(memory->changeDirectory(name) != NoError);
        QVERIFY(memory->removeDirectory(name) != NoError);
        writeFile(top("D:/own"), "x");
        writeFile(top("var/user/own"), "x");
        QVERIFY(memory->copy(name, "copy") != NoError);
        QVERIFY(memory->copy("own", name) != NoError);
        QVERIFY(memory->move("own", name) != NoError);
        MassMemory::Catalog catalog;
        const int error = memory->catalog(name, catalog);
        QVERIFY(error != NoError || catalog.entries.empty());
        // A link itself may go, what it shows must not.
        (void)memory->remove(name);
    }
}

// A named pipe would hang whoever opens it; it and links are not even listed.
void tst_MassMemory::specialFiles()
{
    QCOMPARE(::mkfifo(top("D:/pipe").toLocal8Bit().constData(), 0600), 0);
    UniqueFd fd;
    std::uint64_t size = 0;
    QVERIFY(m_drives->openForReading("D:\\pipe", fd, size) != NoError);
    std::unique_ptr<FileWriter> writer;
    QVERIFY(m_drives->openForWriting("D:\\pipe", writer) != NoError);
    MassMemory::Catalog catalog;
    QCOMPARE(m_drives->catalog("D:", catalog), NoError);
    QVERIFY(catalog.entries.empty());
}

void tst_MassMemory::driveNames()
{
    QVERIFY(QDir(top("D:")).mkdir("Waves"));
    writeFile(top("D:/Waves/Tone.wv"), "12345");
    for (const char *path : {"D:\\Waves\\Tone.wv", "d:/waves//TONE.WV", "\\waves\\tone.wv",
                             "D:/Waves\\.\\Tone.wv", "Waves\\Tone.wv"}) {
        UniqueFd fd;
        std::uint64_t size = 0;
        QVERIFY2(m_drives->openForReading(path, fd, size) == NoError, path);
        QCOMPARE(size, 5U);
    }
    MassMemory::Catalog catalog;
    QCOMPARE(m_drives->catalog("C:", catalog), MissingMedia);
    QCOMPARE(m_drives->makeDirectory("D:\\a:b"), FileNameError);
    QCOMPARE(m_drives->changeDirectory("e:\\"), NoError);
    QCOMPARE(m_drives->currentDirectory(), "E:\\");
    QCOMPARE(m_drives->catalog("Waves", catalog), FileNameNotFound);

    QCOMPARE(MassMemory(false, {}).catalog("D:", catalog), HardwareMissing);
}

void tst_MassMemory::catalogOrderAndTypes()
{
    for (const char *name : {"b.wv", "a.TXT", "c.set", "noSuffix"})
        writeFile(top(QString("var/user/") + name), "123");
    QDir(top("var/user")).mkdir("bb");
    MassMemory::Catalog catalog;
    QCOMPARE(m_unix->catalog("/var/user/", catalog), NoError);
    QStringList lines;
    for (const MassMemory::Entry &entry : catalog.entries)
        lines << QString("%1,%2,%3")
                     .arg(QString::fromStdString(entry.name),
                          QString::fromUtf8(entry.type.data(), static_cast<int>(entry.type.size())))
                     .arg(entry.size);
    QCOMPARE(lines, QStringList({"a.TXT,ASC,3", "b.wv,BIN,3", "bb,DIR,0", "c.set,SET,3",
                                 "noSuffix,BIN,3"}));
    QCOMPARE(catalog.usedBytes, 12U);
    QVERIFY(!catalog.filtered);
}

void tst_MassMemory::filters_data()
{
    QTest::addColumn<QString>("path");
    QTest::addColumn<int>("error");
    QTest::addColumn<int>("count");

    QTest::newRow("pattern") << "/var/user/*.wv" << 0 << 1;
    QTest::newRow("pattern in capitals") << "/var/user/*.WV" << 0 << 0;
    QTest::newRow("all") << "/var/user/*.*" << 0 << 2;
    QTest::newRow("one file") << "/var/user/a.wv" << 0 << 1;
    QTest::newRow("no fit") << "/var/user/*.mat" << 0 << 0;
    QTest::newRow("missing") << "/var/user/b.wv" << int{FileNameNotFound} << 0;
    QTest::newRow("missing folder") << "/var/user/x/*.wv" << int{FileNameNotFound} << 0;
    QTest::newRow("file as folder") << "/var/user/a.wv/*.wv" << int{FileNameError} << 0;
}

void tst_MassMemory::filters()
{
    QFETCH(QString, path);
    QFETCH(int, error);
    QFETCH(int, count);

    writeFile(top("var/user/a.wv"), "1");
    writeFile(top("var/user/noSuffix"), "1");
    MassMemory::Catalog catalog;
    QCOMPARE(m_unix->catalog(path.toStdString(), catalog), error);
    QCOMPARE(static_cast<int>(catalog.entries.size()), count);
}

void tst_MassMemory::movingKeepsTarget()
{
    writeFile(top("D:/a"), "aaa");
    writeFile(top("D:/b"), "b");
    QCOMPARE(m_drives->move("D:\\a", "D:\\b"), FileNameError);
    QCOMPARE(m_drives->copy("D:\\a", "D:\\b"), FileNameError);
    QCOMPARE(m_drives->move("D:\\missing", "D:\\c"), FileNameNotFound);
    QCOMPARE(m_drives->copy("D:\\a", "D:\\c"), NoError);
    QCOMPARE(m_drives->move("D:\\a", "E:\\d"), NoError);
    QVERIFY(!QFile::exists(top("D:/a")));
    QCOMPARE(QFile(top("D:/b")).size(), 1);
    QCOMPARE(QFile(top("D:/c")).size(), 3);
    QCOMPARE(QFile(top("E:/d")).size(), 3);
}

void tst_MassMemory::rootsAreProtected()
{
    for (const char *path : {"/", "/var", "/var/user/", "/hdd"}) {
        QVERIFY2(m_unix->removeDirectory(path) == MediaProtected, path);
        QVERIFY2(m_unix->move(path, "/hdd/x") == MediaProtected, path);
    }
    QCOMPARE(m_unix->makeDirectory("/var/user"), FileNameError);
    QCOMPARE(m_unix->makeDirectory("/var/user/a"), NoError);
    QCOMPARE(m_unix->makeDirectory("/var/user/a/b"), NoError);
    QCOMPARE(m_unix->makeDirectory("/var/user/x/y"), FileNameNotFound);
    QCOMPARE(m_unix->removeDirectory("/var/user/a"), MassStorageError); // not empty
    QCOMPARE(m_unix->remove("/var/user/a"), FileNameError);             // no file
    QCOMPARE(m_unix->removeDirectory("/var/user/a/b"), NoError);
    QCOMPARE(m_unix->removeDirectory("/var/user/a"), NoError);
}

void tst_MassMemory::wildcards_data()
{
    QTest::addColumn<QString>("name");
    QTest::addColumn<QString>("pattern");
    QTest::addColumn<bool>("caseSensitive");
    QTest::addColumn<bool>("fits");

    const auto row = [](const char *name, const char *pattern, bool sensitive, bool fits) {
        QTest::addRow("%s ~ %s", name, pattern) << name << pattern << sensitive << fits;
    };
    row("a.wv", "*.wv", true, true);
    row("a.WV", "*.wv", true, false);
    row("a.WV", "*.wv", false, true);
    row("a", "*.*", true, true);
    row("aXbXc", "a*b*c", true, true);
    row("aXbX", "a*b*c", true, false);
    row("ab", "a?", true, true);
    row("a", "a?", true, false);
    row("a", "a**", true, true);
    row("", "*", true, true);
    row("aaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaab", "*a*a*a*a*a*a*a*a*c", true, false);
}

void tst_MassMemory::wildcards()
{
    QFETCH(QString, name);
    QFETCH(QString, pattern);
    QFETCH(bool, caseSensitive);
    QFETCH(bool, fits);
    QCOMPARE(matchesWildcard(name.toStdString(), pattern.toStdString(), caseSensitive), fits);
}

QTEST_APPLESS_MAIN(tst_MassMemory)
#include "tst_massmemory.moc"
