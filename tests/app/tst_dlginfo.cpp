// SPDX-License-Identifier: Apache-2.0
#include "app/DlgInfo.h"
#include "support/files.h"
#include "support/logreader.h"
#include "support/wvbytes.h"

#include <QPushButton>
#include <QTest>
#include <QTextDocument>
#include <QTextEdit>
#include <QTextTable>

class TestDlgInfo : public QObject
{
    Q_OBJECT

private slots:
    void showsAndForgets();
    void refusesOtherFiles();

private:
    TestFolder m_folder;
};

void TestDlgInfo::showsAndForgets()
{
    QVERIFY(m_folder.store("<i>.wv", wvFile("{TYPE:TGX-WV,0}{COMMENT:</table>}{CLOCK:1e6}"
                                            "{SAMPLES:1}{MWV_SEGMENT_COUNT:1}"
                                            "{MWV_SEGMENT_FILES:\"a<b.wv\"}",
                                            words({0, 0}))));
    DlgInfo dialog;
    QVERIFY(dialog.startModule(m_folder.path("<i>.wv")));
    dialog.show();
    QVERIFY(QTest::qWaitForWindowExposed(&dialog));
    const auto *report = dialog.findChild<QTextEdit *>("te_Info");
    // Texts of the file are no markup.
    const QString text = report->toPlainText();
    QVERIFY(text.startsWith(m_folder.path()));
    QVERIFY2(text.contains("<i>.wv") && text.contains("'</table>'") && text.contains("a<b.wv"),
             qPrintable(text));
    QList<QTextTable *> tables;
    for (QTextFrame *frame : report->document()->rootFrame()->childFrames()) {
        tables << qobject_cast<QTextTable *>(frame);
    }
    QCOMPARE(tables.size(), 2);
    const auto color = [&](int row) {
        return tables.first()->cellAt(row, 0).format().background().color();
    };
    QTRY_VERIFY(report->toPlainText().contains("Loop Point"));
    tables = {qobject_cast<QTextTable *>(report->document()->rootFrame()->childFrames().first())};
    QCOMPARE(color(0), color(2));
    QVERIFY2(color(0) != color(1), "rows are striped");

    QTest::mouseClick(dialog.findChild<QPushButton *>("cb_close"), Qt::LeftButton);
    QVERIFY(!dialog.isVisible());
    QVERIFY(report->toPlainText().isEmpty());
}

void TestDlgInfo::refusesOtherFiles()
{
    QVERIFY(m_folder.store("kind.wv", "{TYPE:XYZ,0}"));
    (void)takeLog();
    DlgInfo dialog;
    QVERIFY(!dialog.startModule(m_folder.path("kind.wv")));
    QVERIFY(dialog.findChild<QTextEdit *>("te_Info")->toPlainText().isEmpty());
    QCOMPARE(takeMessages(), QStringList("Invalid file format in TYPE tag."));
}

QTEST_MAIN(TestDlgInfo)
#include "tst_dlginfo.moc"
