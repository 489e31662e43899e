// SPDX-License-Identifier: Apache-2.0
#include "simulator/ErrorQueue.h"
#include "simulator/MassMemory.h"
#include "support/files.h"
#include "support/rows.h"

#include <QDir>
#include <QFile>
#include <QTemporaryDir>
#include <QTest>

#include <sys/stat.h>

using namespace simulator;

namespace {

void writeFile(const QString &name, const QByteArray &content)
{
    QVERIFY(store(name, content));
}

} // namespace

class TestMassMemory : public QObject
{
    Q_OBJECT

private slots:
    void init();
    void cleanup();
    void escapes();
    void specialFiles();
    void driveNames();
    void catalogOrderAndTypes();
    void filters();
    void movingKeepsTarget();
    void rootsAreProtected();

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
void TestMassMemory::init()
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

void TestMassMemory::cleanup()
{
    QFile secret(m_folder->filePath("outside/secret"));
    QVERIFY(secret.open(QIODevice::ReadOnly));
    QCOMPARE(secret.readAll(), "secret");
    QVERIFY(QFile::exists(m_folder->filePath("secret")));
    QCOMPARE(QDir(m_folder->filePath("outside")).entryList(QDir::Files), QStringList("secret"));
    QCOMPARE(QDir(m_folder->path()).entryList(QDir::Dirs | QDir::NoDotAndDotDot),
             QStringList({"outside", "top"}));
}

// Each operation refuses; that nothing outside was touched is looked at afterwards.
void TestMassMemory::escapes()
{
    std::vector<QByteArray> paths{"..",
                                  "/..",
                                  "../secret",
                                  "/var/user/../../../secret",
                                  "/var/user/..\\..\\..\\secret",
                                  "D:..\\secret",
                                  "D:\\..\\..\\secret",
                                  "D:/x/../../secret",
                                  "folder/secret",
                                  "folder\\secret",
                                  "/var/user/folder/secret",
                                  "D:\\folder\\secret",
                                  "D:/FOLDER/secret",
                                  "file",
                                  "dangling",
                                  "/var/user/./folder/./secret",
                                  "//..//secret",
                                  "/etc/passwd",
                                  "a\x01\nb",
                                  QByteArray(300, 'x')};
    for (const QByteArray &path : paths) {
        const std::string name = path.toStdString();
        for (MassMemory *memory : {m_unix.get(), m_drives.get()}) {
            UniqueFd fd;
            std::uint64_t size = 0;
            std::unique_ptr<FileWriter> writer;
            writeFile(top("D:/own"), "x");
            writeFile(top("var/user/own"), "x");
            for (const int error :
                 {memory->openForReading(name, fd, size), memory->openForWriting(name, writer),
                  memory->makeDirectory(name), memory->changeDirectory(name),
                  memory->removeDirectory(name), memory->copy(name, "copy"),
                  memory->copy("own", name), memory->move("own", name)}) {
                QVERIFY2(error != NoError, path.constData());
            }
            MassMemory::Catalog catalog;
            const int error = memory->catalog(name, catalog);
            QVERIFY2(error != NoError || catalog.entries.empty(), path.constData());
            // A link itself may go, what it shows must not.
            (void)memory->remove(name);
        }
    }
}

// A named pipe would hang whoever opens it; it and links are not even listed.
void TestMassMemory::specialFiles()
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

void TestMassMemory::driveNames()
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

void TestMassMemory::catalogOrderAndTypes()
{
    for (const char *name : {"b.wv", "a.TXT", "c.set", "noSuffix"}) {
        writeFile(top(QString("var/user/") + name), "123");
    }
    QDir(top("var/user")).mkdir("bb");
    MassMemory::Catalog catalog;
    QCOMPARE(m_unix->catalog("/var/user/", catalog), NoError);
    QStringList lines;
    for (const MassMemory::Entry &entry : catalog.entries) {
        lines << QString("%1,%2,%3")
                     .arg(QString::fromStdString(entry.name),
                          QString::fromUtf8(entry.type.data(), static_cast<int>(entry.type.size())))
                     .arg(entry.size);
    }
    QCOMPARE(lines, QStringList({"a.TXT,ASC,3", "b.wv,BIN,3", "bb,DIR,0", "c.set,SET,3",
                                 "noSuffix,BIN,3"}));
    QCOMPARE(catalog.usedBytes, 12U);
    QVERIFY(!catalog.filtered);
}

void TestMassMemory::filters()
{
    const QString many = QString(40, 'a') + 'b';
    for (const QString &name : {QString("a.wv"), QString("[b]x.wv"), QString("none"), many}) {
        writeFile(top("var/user/" + name), "1");
        writeFile(top("D:/" + name), "1");
    }
    forRows({{"pattern", true, "/var/user/*.wv", 0, 2},
             {"pattern in capitals", true, "/var/user/*.WV", 0, 0},
             {"drives take either case", false, "D:\\*.WV", 0, 2},
             {"all", true, "/var/user/*.*", 0, 4},
             {"any letter", true, "/var/user/n?n?", 0, 1},
             {"too short", true, "/var/user/none?", 0, 0},
             {"brackets are letters", true, "/var/user/[b]*", 0, 1},
             {"a hard one", true, "/var/user/*a*a*a*a*a*a*a*a*a*a*a*a*a*a*c", 0, 0},
             {"one file", true, "/var/user/a.wv", 0, 1},
             {"missing", true, "/var/user/b.wv", int{FileNameNotFound}, 0},
             {"missing folder", true, "/var/user/x/*.wv", int{FileNameNotFound}, 0},
             {"file as folder", true, "/var/user/a.wv/*.wv", int{FileNameError}, 0}},
            [this](bool isUnix, std::string path, int error, std::size_t count) {
                MassMemory::Catalog catalog;
                QCOMPARE((isUnix ? m_unix : m_drives)->catalog(path, catalog), error);
                QCOMPARE(catalog.entries.size(), count);
            });
}

void TestMassMemory::movingKeepsTarget()
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

void TestMassMemory::rootsAreProtected()
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

QTEST_APPLESS_MAIN(TestMassMemory)
#include "tst_massmemory.moc"
