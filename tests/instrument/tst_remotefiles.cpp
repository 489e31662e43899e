// SPDX-License-Identifier: Apache-2.0
#include "FakeInstrument.h"
#include "LogRecorder.h"

#include "instrument/VisaDevice.h"
#include "support/rows.h"
#include "visa/visa.h"

#include <QSignalSpy>
#include <QTest>

#include <functional>
#include <map>

class TestRemoteFiles : public QObject
{
    Q_OBJECT
private slots:
    void init();
    void cleanup();
    void listDirectoryFails();
    void listTree();
    void endlessTree();
    void commands();
    void deleteFile();
    void removeTree();
    void removeTreeFails();

private:
    void answerCatalogues(const std::map<std::string, std::string> &catalogues);

    std::unique_ptr<FakeInstrument> m_fake;
    std::unique_ptr<VisaDevice> m_device;
};

void TestRemoteFiles::cleanup()
{
    m_fake.reset();
    m_device.reset();
}

void TestRemoteFiles::init()
{
    m_fake = std::make_unique<FakeInstrument>();
    (*m_fake)->identity = "Halvorn,TGX-810,x/1/2,1.0"; // paths with the backslash
    m_device = std::make_unique<VisaDevice>();
    QVERIFY(m_device->openResource("GPIB0::28::INSTR"));
    (void)m_fake->takeMessages();
    (void)takeLog();
}

/// Answers by path; a path that isn't there gives an error as real instruments do.
void TestRemoteFiles::answerCatalogues(const std::map<std::string, std::string> &catalogues)
{
    FakeVisa *fake = m_fake->operator->();
    fake->answer = [fake, catalogues](const std::string &message) -> std::string {
        const std::string command = ":MMEM:CAT? '";
        if (message.rfind(command, 0) != 0) {
            return {};
        }
        const std::string path =
            message.substr(command.size(), message.size() - command.size() - 1);
        const auto found = catalogues.find(path);
        if (found == catalogues.end()) {
            fake->errors = {"-256,\"File name not found\""};
            return "\n";
        }
        return "10,20" + found->second + "\n";
    };
}

void TestRemoteFiles::listDirectoryFails()
{
    FakeInstrument &fake = *m_fake;
    QList<RemoteFileEntry> entries{{}};
    // A number that ends so stands for an empty folder.
    fake->answer = [&, first = true](const std::string &message) mutable -> std::string {
        if (message.rfind(":MMEM", 0) == 0 && std::exchange(first, false)) {
            fake->errors = {"-150469,\"Directory empty\""};
        }
        return message.rfind(":MMEM", 0) == 0 ? "1,2,\"a,BIN,1\"\n" : "";
    };
    QVERIFY(m_device->listDirectory(entries, "D:\\w"));
    QVERIFY(entries.isEmpty());
    QCOMPARE(m_device->takeLastError(), QString());
    QVERIFY(takeLog().isEmpty());
    // One from long ago doesn't make a failure of today an empty folder.
    fake->errors = {"-150469,\"Directory empty\""};
    QVERIFY(!m_device->checkErrorQueue());
    fake.failCall("viWrite", VI_ERROR_CONN_LOST);
    QVERIFY(!m_device->listDirectory(entries, "D:\\w"));
    QCOMPARE(takeLog().last(), "4 Cannot read files list from instrument.");
    fake->status = nullptr;
    answerCatalogues({});
    (void)m_device->takeLastError();
    QVERIFY(!m_device->listDirectory(entries, "D:\\w"));
    // The caller can show what the instrument said.
    QCOMPARE(m_device->takeLastError(), "-256,\"File name not found\"\n");
}

void TestRemoteFiles::listTree()
{
    answerCatalogues({{"D:\\w", ",\".,DIR,0\",\"..,DIR,0\",\"a,BIN,5\",\"s,DIR,0\",\"b,BIN,7\""},
                      {"D:\\w/s", ",\"c,BIN,3000000000\",\"t,DIR,0\""},
                      {"D:\\w/s/t", ",\"d,ASC,1\""}});
    QStringList files{"old"};
    qint64 size = 1;
    QVERIFY(m_device->listTree(files, size, "D:\\w"));
    QCOMPARE(files, (QStringList{"D:\\w/a", "D:\\w/s/c", "D:\\w/s/t/d", "D:\\w/b"}));
    QCOMPARE(size, 3000000013);
    QList<RemoteFileEntry> entries;
    QVERIFY(m_device->listTreeEntries(entries, "D:\\w/s"));
    QCOMPARE(entries.size(), 3);
    QCOMPARE(entries.last().name, "t/d");
    answerCatalogues({{"D:\\w", ",\"a,BIN,5\",\"s,DIR,0\""}});
    QVERIFY(!m_device->listTree(files, size, "D:\\w"));
}

void TestRemoteFiles::endlessTree()
{
    FakeInstrument &fake = *m_fake;
    fake->answer = [](const std::string &message) {
        return message.rfind(":MMEM:CAT?", 0) == 0 ? "1,2,\"s,DIR,0\"\n" : "";
    };
    QStringList files;
    qint64 size = 0;
    QVERIFY(!m_device->listTree(files, size, "D:"));
    QVERIFY(!m_device->removeEmptyTree("D:", "s"));
    for (const QString &line : takeLog()) {
        QVERIFY2(line.contains("nested deeper"), qPrintable(line));
    }
    QVERIFY(fake.takeMessages().filter("RDIR").isEmpty());
}

void TestRemoteFiles::commands()
{
    using Device = VisaDevice;
    struct Row
    {
        const char *name;
        std::function<bool(Device &)> run;
        QString message; ///< or the words of the failure
    };
    const QString noPath = "4 Directory path cannot be empty.";
    forRows<Row>(
        {{"make", [](Device &d) { return d.makeDirectory("D:/w/", "/a"); },
          ":MMEM:MDIR 'D:\\w\\a'; *OPC?"},
         {"make nothing", [](Device &d) { return d.makeDirectory("", ""); }, noPath},
         {"remove", [](Device &d) { return d.removeDirectory("D:", "it's"); },
          ":MMEM:RDIR 'D:\\it''s'; *OPC?"},
         // Without a name this would be the folder above.
         {"remove no name", [](Device &d) { return d.removeDirectory("D:\\w", ""); }, noPath},
         {"remove tree", [](Device &d) { return d.removeTree("D:\\w", "\\"); }, noPath},
         {"rename", [](Device &d) { return d.renameEntry("D:\\w", "a.wv", "b.wv"); },
          ":MMEM:MOVE 'D:\\w\\a.wv','D:\\w\\b.wv'; *OPC?"},
         {"rename to nothing", [](Device &d) { return d.renameEntry("", "a.wv", ""); },
          "4 Entry name cannot be empty."}},
        [this](const Row &row) {
            const bool fails = row.message.startsWith("4 ");
            QCOMPARE(row.run(*m_device), !fails);
            QCOMPARE(m_fake->takeMessages(), fails ? QStringList() : QStringList{row.message});
            QCOMPARE(takeLog(), fails ? QStringList{row.message} : QStringList());
        });
}

void TestRemoteFiles::deleteFile()
{
    FakeInstrument &fake = *m_fake;
    const QString command = "MMEM:DEL 'D:\\w\\a,b.wv'; *OPC?";
    answerCatalogues({{"D:\\w\\*.wv", ",\"x.wv,BIN,1\",\"a,b.wv,BIN,5\""},
                      {"D:\\w\\*.WV", ",\"a,b.wv,BIN,5\""},
                      {"D:\\w\\*.*", ",\"plain,BIN,1\""}});
    QVERIFY(m_device->deleteRemoteFile("D:\\w\\a,b.wv", false));
    QCOMPARE(fake.takeMessages(), (QStringList{":MMEM:CAT? 'D:\\w\\*.wv'", command}));
    QVERIFY(m_device->deleteRemoteFile("D:\\w\\plain", false));
    QCOMPARE(fake.takeMessages().last(), "MMEM:DEL 'D:\\w\\plain'; *OPC?");
    // A drive takes no notice of the case, and "*.*" may not show a name without a point.
    QVERIFY(m_device->deleteRemoteFile("D:\\w\\A,B.WV", false));
    QCOMPARE(fake.takeMessages().last(), "MMEM:DEL 'D:\\w\\A,B.WV'; *OPC?");
    answerCatalogues({{"D:\\w\\*.wv", ",\"x.wv,BIN,1\""},
                      {"D:\\w\\*.*", ""},
                      {"D:\\w\\", ",\"two  blanks,BIN,1\""}});
    QVERIFY(m_device->deleteRemoteFile("D:\\w\\two  blanks", false));
    QCOMPARE(fake.takeMessages().last(), "MMEM:DEL 'D:\\w\\two  blanks'; *OPC?");
    QVERIFY(m_device->deleteRemoteFile("D:\\w\\gone.wv", false));
    QCOMPARE(fake.takeMessages().size(), 1);
    QCOMPARE(takeLog(), QStringList{"2 *** File does not exist on instrument."});
    // Without anybody to ask the file stays.
    QVERIFY(m_device->deleteRemoteFile("D:\\w\\x.wv", true));
    QCOMPARE(fake.takeMessages().size(), 1);
    QStringList question;
    bool yes = false;
    m_device->setQuestion([&](const QString &title, const QString &text) {
        question = {title, text};
        return yes;
    });
    QVERIFY(m_device->deleteRemoteFile("D:\\w\\x.wv", true));
    QCOMPARE(question, (QStringList{"WARNING", "File exists on instrument. Delete ?"}));
    QCOMPARE(fake.takeMessages().size(), 1);
    yes = true;
    QVERIFY(m_device->deleteRemoteFile("D:\\w\\x.wv", true));
    QCOMPARE(fake.takeMessages().size(), 2);
}

void TestRemoteFiles::removeTree()
{
    FakeInstrument &fake = *m_fake;
    answerCatalogues(
        {{"D:\\w", ",\"a,BIN,5\",\"s,DIR,0\""}, {"D:\\w/s", ",\"b,BIN,5\""}, {"D:\\w\\s", ""}});
    fake->errors = {"-1,\"Old\""};
    QSignalSpy progress(m_device.get(), &VisaDevice::ProgressUpdate);
    // A cancel from before is none of this removal.
    m_device->cancel();
    QVERIFY(m_device->removeTree("D:", "w"));
    QCOMPARE(
        fake.takeMessages(),
        (QStringList{":MMEM:CAT? 'D:\\w'", ":MMEM:CAT? 'D:\\w/s'", ":MMEM:DEL 'D:\\w/a'; *OPC?",
                     ":MMEM:DEL 'D:\\w/s/b'; *OPC?", ":MMEM:CAT? 'D:\\w'", ":MMEM:CAT? 'D:\\w\\s'",
                     ":MMEM:RDIR 'D:\\w\\s'; *OPC?", ":MMEM:RDIR 'D:\\w'; *OPC?"}));
    QCOMPARE(progress.size(), 3);
    QCOMPARE(progress.at(1).first().toInt(), 50);
    // A folder that the instrument keeps, for a file that no list shows, is no folder that is gone.
    fake->answer = [&](const std::string &message) -> std::string {
        if (message.rfind(":MMEM:RDIR", 0) == 0) {
            fake->errors = {"-250,\"Mass storage error\""};
        }
        return message.rfind(":MMEM:CAT?", 0) == 0 ? "1,2\n" : "";
    };
    QVERIFY(!m_device->removeTree("D:", "w"));
    QCOMPARE(m_device->takeLastError().count("-250"), 1);
}

void TestRemoteFiles::removeTreeFails()
{
    for (const QString failure : {"command", "queue", "cancel"}) {
        cleanup();
        init();
        FakeInstrument &fake = *m_fake;
        fake->answer = [&](const std::string &message) -> std::string {
            const bool isDelete = message.rfind(":MMEM:DEL", 0) == 0;
            if (isDelete && failure == "queue") {
                fake->errors = {"-257,\"File name error\""};
            }
            if (isDelete && failure == "command") {
                return "0\n";
            }
            return message.rfind(":MMEM:CAT?", 0) == 0 ? "1,2,\"a,BIN,5\",\"b,BIN,5\"\n" : "";
        };
        if (failure == "cancel") {
            connect(m_device.get(), &VisaDevice::ProgressUpdate, m_device.get(),
                    &VisaDevice::cancel);
        }
        QVERIFY(!m_device->removeTree("D:", "w"));
        const QStringList messages = fake.takeMessages();
        // The cancel comes before the first file is touched.
        QCOMPARE(messages.filter("DEL").size(), failure == "cancel" ? 0 : 1);
        QVERIFY(messages.filter("RDIR").isEmpty());
    }
}

QTEST_GUILESS_MAIN(TestRemoteFiles)
#include "tst_remotefiles.moc"
