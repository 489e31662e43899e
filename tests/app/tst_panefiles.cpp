// SPDX-License-Identifier: Apache-2.0
#include "app/FileIcons.h"
#include "app/LocalFileModel.h"
#include "app/LocalTreeRemover.h"
#include "app/PaneFiles.h"
#include "guitesting.h"
#include "instrument/remotepaths.h"
#include "log/Tracer.h"
#include "support/rows.h"

#include <QDir>
#include <QFile>
#include <QFileInfo>
#include <QSignalSpy>
#include <QTest>

class TestPaneFiles : public QObject
{
    Q_OBJECT

private slots:
    void init();
    void cleanup();
    void pathsEndInASlashForFolders();
    void splitsPaths();
    void linksAreRemovedAsLinks();
    void renameNeverOverwrites_data();
    void renameNeverOverwrites();
    void failuresHaveTheirWords_data();
    void failuresHaveTheirWords();
    void treeRemovalStopsAtTheFirstFailure();
    void treeRemovalCanBeCancelled();
    void linksAreNotShown();
    void shortSizes();

private:
    [[nodiscard]] QString path(const QString &name) const { return m_folder->filePath(name); }

    FileIcons m_icons;
    std::unique_ptr<QTemporaryDir> m_folder;
    std::unique_ptr<LocalFileModel> m_model;
    std::unique_ptr<PaneFiles> m_files;
};

void TestPaneFiles::init()
{
    m_folder = std::make_unique<QTemporaryDir>();
    m_model = std::make_unique<LocalFileModel>(&m_icons);
    m_files = PaneFiles::create(m_model.get());
    QVERIFY(m_files);
    QVERIFY(QDir().mkpath(path("folder/inner")));
    QVERIFY(writeText(path("folder/inner/file"), "x"));
    QVERIFY(writeText(path("file"), "y"));
    (void)Tracer::takeEntries();
}

void TestPaneFiles::cleanup()
{
    m_files.reset();
    m_model.reset();
    m_folder.reset();
}

void TestPaneFiles::pathsEndInASlashForFolders()
{
    QCOMPARE(m_files->pathOf(m_files->indexOf(path("folder"))), path("folder") + '/');
    QCOMPARE(m_files->pathOf(m_files->indexOf(path("folder") + '/')), path("folder") + '/');
    QCOMPARE(m_files->pathOf(m_files->indexOf(path("file"))), path("file"));
    QCOMPARE(m_files->pathOf(m_files->indexOf("/")), "/");
    QVERIFY(!m_files->indexOf(path("nothing")).isValid());
    QVERIFY(!m_files->indexOf({}).isValid());
    QVERIFY(m_files->isRoot("/"));
    QVERIFY(!m_files->isRoot(path("folder") + '/'));
}

void TestPaneFiles::splitsPaths()
{
    struct Row
    {
        const char *name; ///< the path
        QString entry;
        QString parent;
        QString folder;
    };
    forRows<Row>({{"/a/b.wv", "b.wv", "/a/", "/a/"},
                  {"/a/b/", "b", "/a/", "/a/b/"},
                  {"/b/", "b", "/", "/b/"},
                  {"/", "", "/", "/"}},
                 [](const Row &row) {
                     QCOMPARE(entryName(row.name), row.entry);
                     QCOMPARE(parentFolder(row.name), row.parent);
                     QCOMPARE(folderOf(row.name), row.folder);
                 });
}

void TestPaneFiles::linksAreRemovedAsLinks()
{
    QTemporaryDir outside;
    QVERIFY(writeText(outside.filePath("precious"), "x"));
    QVERIFY(QFile::link(outside.path(), path("folder/link")));
    QVERIFY(QFile::link(path("gone"), path("folder/dangling")));
    QVERIFY(QFile::link(outside.path(), path("link")));

    QVERIFY(!m_files->isRealFolder(path("link") + '/'));
    QVERIFY(m_files->removeFile(path("link") + '/'));
    QVERIFY(!QFileInfo(path("link")).isSymLink());

    QVERIFY(m_files->removeTree(path("folder") + '/', nullptr));
    QVERIFY(!QFileInfo::exists(path("folder")));
    QVERIFY(QFileInfo::exists(outside.filePath("precious")));
}

void TestPaneFiles::renameNeverOverwrites_data()
{
    QTest::addColumn<QString>("target");
    QTest::newRow("file") << "taken";
    QTest::newRow("folder") << "folder";
    QTest::newRow("link to nowhere") << "dangling";
}

void TestPaneFiles::renameNeverOverwrites()
{
    QFETCH(QString, target);
    QVERIFY(writeText(path("taken"), "precious"));
    QVERIFY(QFile::link(path("nowhere"), path("dangling")));
    QVERIFY(m_files->exists(path(target)));
    QVERIFY(!m_files->rename(path("file"), target));
    QVERIFY(Tracer::takeEntries().last().first.endsWith("Renaming file failed."));
    QVERIFY(QFileInfo::exists(path("file")));
    QCOMPARE(QFileInfo(path("taken")).size(), 8);
    QVERIFY(QFileInfo(path("dangling")).isSymLink());
    QVERIFY(!QFileInfo::exists(path("nowhere")));
}

void TestPaneFiles::failuresHaveTheirWords_data()
{
    using Operation = std::function<bool(PaneFiles &, const QString &)>;
    QTest::addColumn<Operation>("operation");
    QTest::addColumn<QString>("words");
    const QString tooLong(300, 'x'); // file systems hold 255 bytes a name
    QTest::newRow("create") << Operation([=](PaneFiles &files, const QString &folder) {
        return files.createFolder(folder, tooLong);
    }) << "Creation of the new folder failed.";
    QTest::newRow("rename file") << Operation([=](PaneFiles &files, const QString &folder) {
        return files.rename(folder + "file", tooLong);
    }) << "Renaming file failed.";
    QTest::newRow("delete tree") << Operation([](PaneFiles &files, const QString & /*folder*/) {
        return files.removeTree("/proc/self/fdinfo/", nullptr);
    }) << "Deleting folder structure failed.";
}

void TestPaneFiles::failuresHaveTheirWords()
{
    using Operation = std::function<bool(PaneFiles &, const QString &)>;
    QFETCH(Operation, operation);
    QFETCH(QString, words);
    QSignalSpy failed(m_files.get(), &PaneFiles::failed);
    QVERIFY(!operation(*m_files, m_folder->path() + '/'));
    const Tracer::Entry line = Tracer::takeEntries().last();
    QVERIFY(line.first.endsWith("  " + words));
    QCOMPARE(line.second, int(Tracer::Error));
    const QString text = failed.first().first().toString();
    QVERIFY(text.startsWith(words + ' '));
    QVERIFY2(!text.endsWith(':') && !text.endsWith("Success"), "the reason is missing");
}

void TestPaneFiles::treeRemovalStopsAtTheFirstFailure()
{
    LocalTreeRemover remover("/proc/self/fdinfo");
    QCOMPARE(remover.run(), JobOutcome::Failed);
    QVERIFY(remover.failedPath().startsWith("/proc/self/fdinfo/"));
    QVERIFY(!remover.reason().isEmpty());
}

void TestPaneFiles::treeRemovalCanBeCancelled()
{
    LocalTreeRemover remover(path("folder"));
    remover.cancel();
    QCOMPARE(remover.run(), JobOutcome::Cancelled);
    QCOMPARE(remover.reason(), "Cancelled.");
    QVERIFY(QFileInfo::exists(path("folder/inner/file")));
}

void TestPaneFiles::linksAreNotShown()
{
    QVERIFY(QFile::link(path("file"), path("folder/link")));
    QVERIFY(writeText(path("folder/.hidden"), "x"));
    const QModelIndex folder = m_files->indexOf(path("folder"));
    QSignalSpy loaded(m_files.get(), &PaneFiles::folderLoaded);
    m_model->fetchMore(folder);
    QTRY_VERIFY(loaded.contains({path("folder")}));
    QCOMPARE(m_model->rowCount(folder), 1);
    QCOMPARE(m_model->index(0, 0, folder).data().toString(), "inner");
    QVERIFY(!m_files->isEmptyFolder(path("folder") + '/'));
}

void TestPaneFiles::shortSizes()
{
    QCOMPARE(shortSize(999), "999 B");
    QCOMPARE(shortSize(1234), "1.21 K");  // 1.205
    QCOMPARE(shortSize(10239), "10.0 K"); // 9.999
    QCOMPARE(shortSize(std::numeric_limits<qint64>::max()), "8.00 E");
}

QTEST_MAIN(TestPaneFiles)
#include "tst_panefiles.moc"
