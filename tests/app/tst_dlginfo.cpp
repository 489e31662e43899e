// SPDX-License-Identifier: Apache-2.0
#include "app/DlgInfo.h"
#include "guitesting.h"
#include "log/Tracer.h"

#include <QPushButton>
#include <QTest>
#include <QTextDocument>
#include <QTextEdit>
#include <QTextTable>

namespace {

/// The tables of the report, one string "label|value" for each row.
QStringList rows(const DlgInfo &dialog)
{
    QStringList list;
    const QList<QTextFrame *> frames =
        dialog.findChild<QTextEdit *>("te_Info")->document()->rootFrame()->childFrames();
    for (QTextFrame *frame : frames) {
        auto *table = qobject_cast<QTextTable *>(frame);
        for (int row = 0; table && row < table->rows(); ++row) {
            const auto text = [&](int column) {
                return table->cellAt(row, column).firstCursorPosition().block().text().trimmed();
            };
            list.append(text(0) + '|' + text(1));
        }
    }
    return list;
}

} // namespace

class TestDlgInfo : public QObject
{
    Q_OBJECT

private slots:
    void init() { QVERIFY(m_folder.isValid()); }
    void reportsOnAPlainWaveform();
    void reportsOnSegments();
    void stripesTheTable();
    void refusesOtherFiles_data();
    void refusesOtherFiles();
    void closeHidesAndForgets();

private:
    QTemporaryDir m_folder;
};

void TestDlgInfo::reportsOnAPlainWaveform()
{
    const QString path = m_folder.filePath("tone.wv");
    QVERIFY(writeTone(path, "a < b & c"));
    DlgInfo dialog;
    QCOMPARE(dialog.windowTitle(), "Waveform Information");
    QVERIFY(dialog.startModule(path));
    const QStringList list = rows(dialog);
    QCOMPARE(list.size(), 13);
    QVERIFY(list.contains("Type|TGX Waveform File"));
    QVERIFY(list.contains("Comment|'a < b & c'"));
    QVERIFY(list.contains("Samples|1 k"));
    QVERIFY(list.contains("Clock|1 MHz"));
    QVERIFY(list.contains("Play Time|1 ms"));
    QVERIFY(list.contains("Markers|No"));
    const QString text = dialog.findChild<QTextEdit *>("te_Info")->toPlainText();
    QVERIFY(text.startsWith(m_folder.path()));
    QVERIFY(text.contains("tone.wv"));
}

void TestDlgInfo::reportsOnSegments()
{
    const QString path = m_folder.filePath("multi.wv");
    QVERIFY(writeText(path, "{TYPE:TGX-MWV,17}{CLOCK:1e7}{SAMPLES:30}{LEVEL OFFS:3,0}"
                            "{MWV_SEGMENT_COUNT:2}{MWV_SEGMENT_FILES:\"a.wv\",\"b.wv\"}"
                            "{MWV_SEGMENT_CLOCK:1e7,2e7}{MWV_SEGMENT_START:0,10}"
                            "{MWV_SEGMENT_LENGTH:10,20}{MWV_SEGMENT_LEVEL_OFFS:3,1,4,1.5}"));
    DlgInfo dialog;
    QVERIFY(dialog.startModule(path));
    const QStringList list = rows(dialog);
    QCOMPARE(list.size(), 13 + 4 + 2 * 6);
    QVERIFY(list.contains("Checksum|Yes"));
    QVERIFY(list.contains("Segments|2"));
    QVERIFY(list.contains("Segment 2|b.wv"));
    QVERIFY(list.contains("Clock|20 MHz"));
    QVERIFY(list.contains("Start Sample, Samples|10, 20"));
    QVERIFY(list.contains("Peak/RMS|2.5 dB"));
}

void TestDlgInfo::stripesTheTable()
{
    const QString path = m_folder.filePath("stripes.wv");
    QVERIFY(writeTone(path));
    DlgInfo dialog;
    QVERIFY(dialog.startModule(path));
    auto *table = qobject_cast<QTextTable *>(
        dialog.findChild<QTextEdit *>("te_Info")->document()->rootFrame()->childFrames().first());
    QVERIFY(table);
    const auto color = [&](int row) { return table->cellAt(row, 0).format().background().color(); };
    QCOMPARE(color(0), color(2));
    QVERIFY(color(0) != color(1));
}

void TestDlgInfo::refusesOtherFiles_data()
{
    QTest::addColumn<QString>("name");
    QTest::addColumn<QByteArray>("content");
    QTest::addColumn<QString>("words");
    QTest::newRow("missing") << "none.wv" << QByteArray() << "File does not exist.";
    QTest::newRow("unknown kind") << "kind.wv" << QByteArray("{TYPE:XYZ,0}")
                                  << "Invalid file format in TYPE tag.";
    QTest::newRow("bad clock") << "clock.wv" << QByteArray("{TYPE:TGX-WV,0}{CLOCK:fast}")
                               << "Invalid clock rate in CLOCK tag.";
}

void TestDlgInfo::refusesOtherFiles()
{
    QFETCH(QString, name);
    QFETCH(QByteArray, content);
    QFETCH(QString, words);
    const QString path = m_folder.filePath(name);
    QVERIFY(content.isEmpty() || writeText(path, content));
    (void)Tracer::takeEntries();
    DlgInfo dialog;
    QVERIFY(!dialog.startModule(path));
    QVERIFY(dialog.findChild<QTextEdit *>("te_Info")->toPlainText().isEmpty());
    QVERIFY(Tracer::takeEntries().last().first.endsWith("  " + words));
}

void TestDlgInfo::closeHidesAndForgets()
{
    const QString path = m_folder.filePath("close.wv");
    QVERIFY(writeTone(path));
    DlgInfo dialog;
    QVERIFY(dialog.startModule(path));
    dialog.show();
    QVERIFY(QTest::qWaitForWindowExposed(&dialog));
    QTest::mouseClick(dialog.findChild<QPushButton *>("cb_close"), Qt::LeftButton);
    QVERIFY(!dialog.isVisible());
    QVERIFY(dialog.findChild<QTextEdit *>("te_Info")->toPlainText().isEmpty());
}

QTEST_MAIN(TestDlgInfo)
#include "tst_dlginfo.moc"
