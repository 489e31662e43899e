// SPDX-License-Identifier: Apache-2.0
#include "FakeInstrument.h"
#include "LogRecorder.h"

#include "instrument/RemoteDirModel.h"
#include "instrument/VisaDevice.h"
#include "support/rows.h"
#include "visa/visa.h"

#include <QAbstractItemModelTester>
#include <QSignalSpy>
#include <QTest>

#include <algorithm>
#include <map>

class TestRemoteDirModel : public QObject
{
    Q_OBJECT
private slots:
    void init();
    void cleanup();
    void withoutDevice();
    void readsWhenLookedInto();
    void contents();
    void filters();
    void readFails();
    void emptyFolder();
    void emptyFolderLookedInto();
    void refreshFolder();
    void sorts();
    void sortsWhatIsReadLater();
    void expandedPaths();
    void losesDevice();

private:
    [[nodiscard]] QStringList names(const QModelIndex &parent, int column = 0) const;
    [[nodiscard]] QModelIndex root(int row = 0) const { return m_model->index(row, 0); }

    std::unique_ptr<FakeInstrument> m_fake;
    std::unique_ptr<VisaDevice> m_device;
    std::unique_ptr<RemoteDirModel> m_model;
    std::unique_ptr<QAbstractItemModelTester> m_tester;
    std::map<QString, QString> m_catalogues; ///< by path; a missing one is an error
};

void TestRemoteDirModel::init()
{
    m_fake = std::make_unique<FakeInstrument>();
    (*m_fake)->options = "TGX870-P7,TGX870-P13,TGX870-K1";
    m_device = std::make_unique<VisaDevice>();
    QVERIFY(m_device->openResource("GPIB0::28::INSTR"));
    m_catalogues = {
        {"/var/user/", ",\"b.wv,BIN,1536\",\"sub,DIR,0\",\"A.txt,ASC,1023\",\"Deep,DIR,0\""},
        {"/var/user/sub/", ",\"in.wv,BIN,1\""},
        {"/var/user/Deep/", ",\"er,DIR,0\""},
        {"/var/user/Deep/er/", ",\"x.set,SET,3\""},
        {"/hdd/", ""},
    };
    FakeVisa *fake = m_fake->operator->();
    fake->answer = [this, fake](const std::string &text) -> std::string {
        const QString message = QString::fromStdString(text);
        if (!message.startsWith(":MMEM:CAT? '")) {
            return {};
        }
        const auto found = m_catalogues.find(message.mid(12).chopped(1));
        if (found == m_catalogues.end()) {
            fake->errors = {"-256,\"File name not found\""};
            return "\n";
        }
        return "1,2" + found->second.toStdString() + '\n';
    };
    m_model = std::make_unique<RemoteDirModel>();
    m_model->setDevice(m_device.get());
    m_model->refresh();
    (void)m_fake->takeMessages();
    (void)takeLog();
}

void TestRemoteDirModel::cleanup()
{
    // What was put off until the event loop must be right as well.
    QCoreApplication::processEvents();
    m_tester.reset();
    m_model.reset();
    m_device.reset();
}

QStringList TestRemoteDirModel::names(const QModelIndex &parent, int column) const
{
    QStringList texts;
    for (int row = 0; row < m_model->rowCount(parent); ++row) {
        texts.append(m_model->index(row, column, parent).data().toString());
    }
    return texts;
}

void TestRemoteDirModel::withoutDevice()
{
    RemoteDirModel model;
    const QAbstractItemModelTester tester(&model,
                                          QAbstractItemModelTester::FailureReportingMode::QtTest);
    const auto text = [&] { return model.index(0, 0).data().toString(); };
    QCOMPARE(text(), "no data for ...");
    QCOMPARE(model.rowCount(), 1);
    QCOMPARE(model.columnCount(), 1);
    QCOMPARE(model.headerData(0, Qt::Horizontal).toString(), QString());
    QCOMPARE(model.flags(model.index(0, 0)), Qt::ItemIsEnabled);
    model.setDevice(m_device.get());
    QSignalSpy resets(&model, &QAbstractItemModel::modelReset);
    model.refresh();
    QCOMPARE(resets.size(), 1);
    QCOMPARE(text(), "/var/user/");
    QCOMPARE(model.headerData(2, Qt::Horizontal).toString(), "Type");
    m_device->closeResource();
    model.refresh();
    QCOMPARE(text(), "no data for ...");
    // An instrument without a file system.
    (*m_fake)->identity = "Halvorn,TQX-110,a/b,1";
    QVERIFY(m_device->openResource("GPIB0::28::INSTR"));
    model.refresh();
    QCOMPARE(text(), "failed reading ");
}

void TestRemoteDirModel::readsWhenLookedInto()
{
    QCOMPARE(m_model->rowCount(), 2);
    QCOMPARE(m_model->rowCount(root()), 1);
    QVERIFY(m_model->hasChildren(root()));
    QVERIFY(m_fake->takeMessages().isEmpty());
    // Folders first, each kind in the order of the catalogue.
    QCOMPARE(m_model->index(0, 0, root()).data().toString(), "sub");
    QCOMPARE(names(root()), (QStringList{"sub", "Deep", "b.wv", "A.txt"}));
    QCOMPARE(m_fake->takeMessages(), QStringList{":MMEM:CAT? '/var/user/'"});
    QVERIFY(!m_model->index(4, 0, root()).isValid());
    QVERIFY(m_fake->takeMessages().isEmpty());
    // The tester walks the whole tree.
    m_tester = std::make_unique<QAbstractItemModelTester>(
        m_model.get(), QAbstractItemModelTester::FailureReportingMode::QtTest);
    QCOMPARE(m_fake->takeMessages().size(), 4);
}

void TestRemoteDirModel::contents()
{
    struct Row
    {
        const char *name; ///< the line of the catalogue
        QString size;
        QString type;
        QString icon;
    };
    m_model->setIconProvider([](const QString &name) { return name + "!"; });
    forRows<Row>({{"sub,DIR,0", "", "File Folder", "folder"},
                  {"a.WV,BIN,1023", "1023 bytes", "Binary File", "file_waveform"},
                  {"a.txt,ASC,1536", "1.5 KB", "Text File", "file_ascii"},
                  // 1999 / 1024 = 1.952148: cut, not rounded
                  {"a.set,SET,1999", "1.952 KB", "Settings File", "file_settings"},
                  {"a.wv,LIC,1048575", "1024 KB", "LIC", "file_binary"},
                  // 123456789 / 1048576 = 117.73757: six digits, then cut behind the third decimal
                  {"a,BIN,123456789", "117.738 MB", "Binary File", "file_binary"}},
                 [this](const Row &row) {
                     const QString line = row.name;
                     m_catalogues["/var/user/"] = ",\"" + line + '"';
                     m_model->refresh();
                     const auto at = [&](int column) { return m_model->index(0, column, root()); };
                     const QString name = line.section(',', 0, 0);
                     QCOMPARE(at(0).data().toString(), name);
                     QCOMPARE(at(1).data().toString(), row.size);
                     QCOMPARE(at(2).data().toString(), row.type);
                     QCOMPARE(at(0).data(Qt::DecorationRole).toString(), row.icon + "!");
                     QCOMPARE(at(0).data(Qt::ToolTipRole).toString(),
                              "/var/user/" + name + (line.contains("DIR") ? "/" : ""));
                 });
    QCOMPARE(m_model->index(0, 2).data().toString(), "Drive");
    // Only the first column has children.
    QCOMPARE(m_model->rowCount(m_model->index(0, 1)), 0);
}

void TestRemoteDirModel::filters()
{
    QCOMPARE(m_model->nameFilters(), QStringList{"*.*"});
    m_model->setNameFilters({"*.WV", "a.?xt"});
    QCOMPARE(m_model->index(0, 0, root()).data().toString(), "sub");
    QCOMPARE(names(root()), (QStringList{"sub", "Deep", "b.wv", "A.txt"}));
    m_model->setNameFilters({});
    m_model->refresh(root());
    QCOMPARE(names(root()).size(), 4);
}

void TestRemoteDirModel::readFails()
{
    m_tester = std::make_unique<QAbstractItemModelTester>(
        m_model.get(), QAbstractItemModelTester::FailureReportingMode::QtTest);
    m_catalogues.erase("/var/user/sub/");
    const QModelIndex sub = m_model->indexOfPath("/var/user/sub/");
    m_model->refresh(sub);
    QCOMPARE(sub.siblingAtColumn(1).data().toString(), "Read Error");
    m_catalogues["/var/user/"] = ",\"new,DIR,0\"";
    m_catalogues.erase("/var/user/new/");
    m_model->refresh(root());
    const QModelIndex fresh = m_model->indexOfPath("/var/user/new");
    QVERIFY(fresh.isValid());
    const QModelIndex placeholder = m_model->index(0, 0, fresh);
    QCOMPARE(placeholder.data().toString(), "Read Error");
    QCOMPARE(m_model->flags(placeholder), Qt::ItemIsEnabled);
    QVERIFY(!placeholder.siblingAtColumn(1).data().isValid());
    QCOMPARE(placeholder.parent(), fresh);
    // A dead instrument is not asked again at each look.
    (void)m_fake->takeMessages();
    QCOMPARE(m_model->index(0, 0, fresh), placeholder);
    QVERIFY(m_fake->takeMessages().isEmpty());
    m_catalogues["/var/user/new/"] = ",\"x.y,BIN,1\"";
    m_model->refresh(fresh);
    QCOMPARE(names(fresh), QStringList{"x.y"});
    QVERIFY(!fresh.siblingAtColumn(1).data().isValid());
}

void TestRemoteDirModel::emptyFolder()
{
    m_tester = std::make_unique<QAbstractItemModelTester>(
        m_model.get(), QAbstractItemModelTester::FailureReportingMode::QtTest);
    QTRY_COMPARE(m_model->rowCount(root(1)), 0);
    QVERIFY(!m_model->hasChildren(root(1)));
    // An error that stands for an empty folder is no read error.
    m_catalogues.erase("/var/user/sub/");
    FakeVisa *fake = m_fake->operator->();
    fake->answer = [fake](const std::string &message) -> std::string {
        if (message.rfind(":MMEM", 0) == 0) {
            fake->errors = {"-150469,\"Directory empty\""};
        }
        return message.rfind(":MMEM", 0) == 0 ? "\n" : "";
    };
    const QModelIndex sub = m_model->indexOfPath("/var/user/sub/");
    m_model->refresh(sub);
    QCOMPARE(m_model->rowCount(sub), 0);
    QVERIFY(!sub.siblingAtColumn(1).data().isValid());
}

void TestRemoteDirModel::emptyFolderLookedInto()
{
    m_catalogues["/var/user/"] = "";
    // The tester looks into the first folder before it has let it be read.
    m_tester = std::make_unique<QAbstractItemModelTester>(
        m_model.get(), QAbstractItemModelTester::FailureReportingMode::QtTest);
    QTRY_COMPARE(m_model->rowCount(root()), 0);
    m_model->refresh();
    // Counted as one, so it must be there; it goes when the event loop comes round.
    QCOMPARE(m_model->rowCount(root()), 1);
    QVERIFY(m_model->index(0, 0, root()).isValid());
    QTRY_COMPARE(m_model->rowCount(root()), 0);
    m_model->refresh();
    (void)m_model->index(0, 0, root());
    // Gone before its turn comes.
    m_model->refresh();
}

void TestRemoteDirModel::refreshFolder()
{
    m_tester = std::make_unique<QAbstractItemModelTester>(
        m_model.get(), QAbstractItemModelTester::FailureReportingMode::QtTest);
    const QPersistentModelIndex sub = m_model->indexOfPath("/var/user/sub/");
    QSignalSpy inserted(m_model.get(), &QAbstractItemModel::rowsInserted);
    QSignalSpy removed(m_model.get(), &QAbstractItemModel::rowsRemoved);
    m_catalogues["/var/user/sub/"] = ",\"in.wv,BIN,1\",\"new.wv,BIN,2\"";
    m_model->refresh(sub);
    QCOMPARE(names(sub), (QStringList{"in.wv", "new.wv"}));
    QCOMPARE(inserted.size(), 1);
    QCOMPARE(removed.size(), 1);
    m_catalogues["/var/user/sub/"] = "";
    m_model->refresh(sub);
    QCOMPARE(m_model->rowCount(sub), 0);
    // A file has nothing to read.
    (void)m_fake->takeMessages();
    m_model->refresh(m_model->indexOfPath("/var/user/b.wv"));
    QVERIFY(m_fake->takeMessages().isEmpty());
}

void TestRemoteDirModel::sorts()
{
    struct Row
    {
        const char *name;
        int column;
        Qt::SortOrder direction;
        QStringList order;
    };
    m_catalogues["/var/user/"] =
        ",\"c.wv,BIN,1536\",\"sub,DIR,0\",\"b.wv,BIN,1536\",\"A.txt,ASC,1023\",\"Deep,DIR,0\"";
    m_catalogues["/var/user/sub/"] = ",\"in.wv,BIN,1\",\"an.wv,BIN,2\"";
    m_tester = std::make_unique<QAbstractItemModelTester>(
        m_model.get(), QAbstractItemModelTester::FailureReportingMode::QtTest);
    const QPersistentModelIndex inside = m_model->indexOfPath("/var/user/sub/in.wv");
    QVERIFY(inside.isValid());
    // Deep has one child, sub has two; within a type by name in both orders.
    forRows<Row>({{"name down", 0, Qt::DescendingOrder, {"sub", "Deep", "c.wv", "b.wv", "A.txt"}},
                  {"size", 1, Qt::AscendingOrder, {"Deep", "sub", "A.txt", "b.wv", "c.wv"}},
                  {"type down", 2, Qt::DescendingOrder, {"Deep", "sub", "b.wv", "c.wv", "A.txt"}}},
                 [&](const Row &row) {
                     m_model->sort(row.column, row.direction);
                     QStringList order = names(root());
                     if (row.column == 1) {
                         std::sort(order.end() - 2, order.end()); // equal sizes
                     }
                     QCOMPARE(order, row.order);
                     // What the view holds on to is still the same entry.
                     QCOMPARE(inside.data().toString(), "in.wv");
                     QCOMPARE(inside.parent().data().toString(), "sub");
                 });
    // The top folders keep their order.
    QCOMPARE(names({}), (QStringList{"/var/user/", "/hdd/"}));
}

void TestRemoteDirModel::sortsWhatIsReadLater()
{
    m_model->sort(0, Qt::DescendingOrder);
    (void)m_model->index(0, 0, root());
    QCOMPARE(names(root()), (QStringList{"sub", "Deep", "b.wv", "A.txt"}));
    m_model->sort(0, Qt::AscendingOrder);
    m_model->refresh(root());
    QCOMPARE(names(root()), (QStringList{"Deep", "sub", "A.txt", "b.wv"}));
}

void TestRemoteDirModel::expandedPaths()
{
    QVERIFY(!m_model->indexOfPath("/var/user/Deep/er/x.set").isValid());
    QVERIFY(m_model->expandPath("/var/user/Deep/er/"));
    m_model->slotExpanded(m_model->indexOfPath("/hdd/"));
    const QStringList paths{"/var/user/", "/var/user/Deep/", "/var/user/Deep/er/", "/hdd/"};
    QCOMPARE(m_model->expandedPaths(), paths);
    QCOMPARE(m_model->indexOfPath("/var/user/Deep/er/x.set").data().toString(), "x.set");
    m_model->slotCollapsed(m_model->indexOfPath("/hdd/"));
    QCOMPARE(m_model->expandedPaths().size(), 3);
    m_model->refresh();
    QVERIFY(m_model->expandedPaths().isEmpty());
    QVERIFY(m_model->expandPaths(paths));
    QCOMPARE(m_model->expandedPaths(), paths);
    m_catalogues["/var/user/"] = "";
    m_model->refresh();
    QVERIFY(!m_model->expandPaths(paths));
    QVERIFY(!m_model->expandPath("/elsewhere/"));
}

void TestRemoteDirModel::losesDevice()
{
    m_tester = std::make_unique<QAbstractItemModelTester>(
        m_model.get(), QAbstractItemModelTester::FailureReportingMode::QtTest);
    const QModelIndex sub = m_model->indexOfPath("/var/user/sub/");
    m_device->closeResource();
    m_model->refresh(sub);
    QCOMPARE(sub.siblingAtColumn(1).data().toString(), "Read Error");
    // What was read stays to be seen.
    QCOMPARE(names(sub), QStringList{"in.wv"});
    m_device.reset();
    QCOMPARE(m_model->device(), nullptr);
    m_model->refresh(root());
    QCOMPARE(root().siblingAtColumn(1).data().toString(), "Read Error");
    m_model->refresh();
    QCOMPARE(m_model->rowCount(), 1);
    QCOMPARE(m_model->index(0, 0).data().toString(), "no data for ...");
}

QTEST_GUILESS_MAIN(TestRemoteDirModel)
#include "tst_remotedirmodel.moc"
