// SPDX-License-Identifier: Apache-2.0
#include "support/files.h"
#include "support/modals.h"
#include "support/rows.h"

#include <QInputDialog>
#include <QMessageBox>
#include <QTest>

/// What other tests trust in.
class TestSupport : public QObject
{
    Q_OBJECT

private slots:
    void rows();
    void files();
    void modals();
};

void TestSupport::rows()
{
    int sum = 0;
    forRows({{"one", 1, "a"}, {"two", 2, "ab"}}, [&](int value, const QByteArray &text) {
        QCOMPARE(text.size(), value);
        sum += value;
    });
    struct Row
    {
        const char *name;
        int value;
    };
    forRows<Row>({{"one", 1}, {"two", 2}}, [&](const Row &row) { sum += row.value; });
    QCOMPARE(sum, 6);
}

void TestSupport::files()
{
    const TestFolder folder;
    QVERIFY(folder.load("none").isNull());
    QVERIFY(folder.store("empty", {}) && !folder.load("empty").isNull());
    QVERIFY(folder.store(".full", "abc"));
    QCOMPARE(folder.load(".full"), QByteArray("abc"));
    QCOMPARE(folder.entries(), QStringList({".full", "empty"}));
}

void TestSupport::modals()
{
    Seen question;
    Seen request;
    QString name;
    const auto ask = [&] {
        if (QMessageBox::question(nullptr, "Title", "Go on?") == QMessageBox::Yes) {
            name = QInputDialog::getText(nullptr, "Name", "New name", QLineEdit::Normal, "old");
        }
    };
    QVERIFY(withModals(ask, {answer("Yes", question), typeName("new", request)}));
    QCOMPARE(question.title + '|' + question.text, "Title|Go on?");
    QCOMPARE(request.title + '|' + request.text, "Name|New name");
    QCOMPARE(name, "new");
    QTest::ignoreMessage(QtWarningMsg, "unexpected window: Go on?");
    QVERIFY(!withModals(ask, {}));
    whenModal(press("No"));
    ask();
}

QTEST_MAIN(TestSupport)
#include "tst_support.moc"
