// SPDX-License-Identifier: Apache-2.0
// What the user does with the list, by mouse and keyboard.
#include "InstrListTest.h"

#include "instrument/FakeInstrument.h"
#include "instrument/VisaDevice.h"
#include "support/modals.h"

#include <QApplication>
#include <QLineEdit>
#include <QPushButton>
#include <QSettings>
#include <QStyle>
#include <QTest>

namespace {

/// Waits until keys go to a window.
bool hasFocus(const QWidget &window)
{
    return QTest::qWaitFor([&] {
        const QWidget *focus = QApplication::focusWidget();
        return focus != nullptr && focus->window() == &window;
    });
}

} // namespace

class TestInstrListEditing : public InstrListTest
{
    Q_OBJECT

private slots:
    void checks();
    void comments();
    void deletes();
    void settings();
    void withoutVisa();
    void keys();
    void showsEverything();
};

void TestInstrListEditing::checks()
{
    fill({entry("TGX-870", "100001", generator), entry("TGX-810", "200002", otherGenerator)});
    const QRect row = tree()->visualItemRect(item(1));
    const int size = tree()->style()->pixelMetric(QStyle::PM_IndicatorWidth);
    QTest::mouseClick(tree()->viewport(), Qt::LeftButton, {},
                      {row.left() + size / 2 + 2, row.center().y()});
    QCOMPARE(item(1)->checkState(0), Qt::Unchecked);
    QCOMPARE(m_changes->size(), 1);
    QVERIFY(m_dialog->instruments().at(0).enabled);
    QVERIFY(!m_dialog->instruments().at(1).enabled);
    // From whichever column is current.
    QTest::mouseClick(tree()->viewport(), Qt::LeftButton, {}, row.center());
    QCOMPARE(tree()->currentColumn(), 2);
    QTest::keyClick(tree(), Qt::Key_Space);
    QCOMPARE(m_changes->size(), 2);
    QVERIFY(m_dialog->instruments().at(1).enabled);
}

void TestInstrListEditing::comments()
{
    fill({entry("TGX-870", "100001", generator)});
    item(0)->setExpanded(true);
    const auto doubleClick = [this](QTreeWidgetItem *target, int column) {
        return [this, target, column] {
            const QPoint place = tree()->visualRect(tree()->indexFromItem(target, column)).center();
            QTest::mouseClick(tree()->viewport(), Qt::LeftButton, {}, place);
            QTest::mouseDClick(tree()->viewport(), Qt::LeftButton, {}, place);
        };
    };
    Seen seen;
    QVERIFY(withModal(doubleClick(item(0), 1), typeName("left bench", seen)));
    QCOMPARE(seen.title + '|' + seen.text, "Enter Comment|Enter optional comment");
    QCOMPARE(item(0)->text(2), "left bench");
    QCOMPARE(m_dialog->instruments().at(0).comment, "left bench");
    QCOMPARE(m_changes->size(), 1);
    QVERIFY(item(0)->isExpanded());
    // Given up.
    QVERIFY(withModal(doubleClick(item(0), 2), typeName("other", seen, Qt::Key_Escape)));
    QCOMPARE(m_dialog->instruments().at(0).comment, "left bench");
    QCOMPARE(m_changes->size(), 1);
    // By a key, from a row below; emptied.
    tree()->setFocus();
    m_dialog->activateWindow();
    QVERIFY(hasFocus(*m_dialog));
    tree()->setCurrentItem(item(0)->child(0));
    QVERIFY(withModal([this] { QTest::keyClick(tree(), Qt::Key_F2); }, typeName(" ", seen)));
    QCOMPARE(m_dialog->instruments().at(0).comment, " ");
    // The rows below have no comment.
    doubleClick(item(0)->child(0), 1)();
    QVERIFY(!QApplication::activeModalWidget());
}

void TestInstrListEditing::deletes()
{
    const FakeInstrument fake;
    fake.failCall("viOpen", -1);
    const QList<InstrConfigEntry> all{entry("TGX-870", "100001", generator),
                                      entry("TGX-810", "200002", otherGenerator)};
    fill(all);
    QVERIFY(!m_dialog->findChild<QPushButton *>("pb_delete")->isEnabled());
    // From a row below, by the key; the next one is current then.
    tree()->setFocus();
    item(0)->setExpanded(true);
    tree()->setCurrentItem(item(0)->child(0));
    QTest::keyClick(tree(), Qt::Key_Delete);
    QCOMPARE(m_dialog->instruments(), all.mid(1));
    QCOMPARE(tree()->currentItem()->text(0), "TGX-810, 200002");
    click("pb_delete");
    QVERIFY(m_dialog->instruments().isEmpty());
    QVERIFY(hintIsVisible());
    QCOMPARE(m_changes->size(), 2);
    QVERIFY(!m_dialog->findChild<QPushButton *>("pb_clear")->isEnabled());
    fill(all);
    Seen seen;
    QVERIFY(withModal([this] { click("pb_clear"); }, answer("No", seen)));
    QVERIFY2(seen.text.contains("all"), qPrintable(seen.text));
    QVERIFY(!m_dialog->instruments().isEmpty());
    QVERIFY(withModal([this] { click("pb_clear"); }, press("Yes")));
    QVERIFY(m_dialog->instruments().isEmpty());
    QCOMPARE(m_changes->size(), 1);
}

void TestInstrListEditing::settings()
{
    fill({entry("TGX-870", "100001", generator), entry("TGX-840", "300003", silent)});
    m_dialog->setDefaultFolder("TGX-840", "300003", "/var/user/waves/");
    m_dialog->move(120, 90);
    m_dialog->resize(610, 470);
    QLineEdit *line = inputLine();
    line->setText("bench.example");
    {
        QSettings settings(iniFile(), QSettings::IniFormat);
        m_dialog->writeSettings(settings);
    }
    QSettings settings(iniFile(), QSettings::IniFormat);
    DlgInstrConfig other;
    QVERIFY(!other.isModal());
    QSettings none(m_folder.path("none.ini"), QSettings::IniFormat);
    other.readSettings(none);
    QCOMPARE(other.size(), QSize(520, 580));
    QCOMPARE(other.pos(), QPoint(200, 200));
    const QSignalSpy changes(&other, &DlgInstrConfig::updateInstruments);
    other.readSettings(settings);
    QCOMPARE(changes.size(), 1);
    QVERIFY(settings.group().isEmpty());
    QCOMPARE(other.instruments(), m_dialog->instruments());
    QCOMPARE(other.size(), QSize(610, 470));
    QCOMPARE(other.pos(), QPoint(120, 90));
    QCOMPARE(other.findChild<QLineEdit *>("le_manual")->text(), "bench.example");
}

void TestInstrListEditing::withoutVisa()
{
    const FakeInstrument fake;
    VisaDevice first(true); // as the main window's, before the list is read
    m_dialog = std::make_unique<DlgInstrConfig>(true);
    m_changes = std::make_unique<QSignalSpy>(m_dialog.get(), &DlgInstrConfig::updateInstruments);
    m_dialog->show();
    fill({entry("TGX-870", "100001", "TCPIP::127.0.0.2::INSTR"),
          entry("TGX-810", "200002", otherGenerator)});
    QCOMPARE(rows(),
             (QStringList{"offline|TGX-870, 100001|TCPIP|", "offline|TGX-810, 200002|GPIB0|"}));
    click("pb_scan_gpib");
    type("GPIB0::1::INSTR");
    QCOMPARE(m_dialog->instruments().size(), 2);
    QCOMPARE(fake.takeCalls(), QStringList{});
}

void TestInstrListEditing::keys()
{
    fill({entry("TGX-870", "100001", generator)});
    QLineEdit *line = inputLine();
    line->setText(otherGenerator);
    // Keys of the tree are no keys of the input line, and the other way about.
    line->setFocus();
    QTest::keyClick(line, Qt::Key_Home);
    QTest::keyClick(line, Qt::Key_Delete);
    QCOMPARE(line->text(), otherGenerator.mid(1));
    line->setText(otherGenerator);
    tree()->setFocus();
    tree()->setCurrentItem(item(0));
    QVERIFY(withModal([this] { QTest::keyClick(tree(), Qt::Key_Return); },
                      [](QWidget &box) { QTest::keyClick(&box, Qt::Key_Escape); }));
    QCOMPARE(m_dialog->instruments().size(), 1);
    // A label or a button of its own for each letter.
    m_dialog->activateWindow();
    QVERIFY(hasFocus(*m_dialog));
    QTest::keyClick(m_dialog.get(), Qt::Key_H, Qt::AltModifier);
    QTRY_COMPARE(QApplication::focusWidget(), line);
    QVERIFY(withModal([line] { QTest::keyClick(line, Qt::Key_L, Qt::AltModifier); }, press("Yes")));
    QTRY_VERIFY(m_dialog->instruments().isEmpty());
    m_dialog->activateWindow();
    QVERIFY(hasFocus(*m_dialog));
    QTest::keyClick(line, Qt::Key_A, Qt::AltModifier);
    QTRY_COMPARE(m_dialog->instruments().size(), 1);
    QTest::keyClick(line, Qt::Key_Escape);
    QTRY_VERIFY(!m_dialog->isVisible());
}

void TestInstrListEditing::showsEverything()
{
    InstrConfigEntry third = entry("TGX-840", "300003", "TCPIP::127.0.0.99::INSTR");
    third.comment = "lent out";
    fill(
        {entry("TGX-870", "100001", generator), entry("TGX-810", "200002", otherGenerator), third});
    // In the size that a new user gets, each text has its room.
    m_dialog->resize(520, 580);
    for (int row = 0; row < 3; ++row) {
        item(row)->setExpanded(true);
    }
    QCOMPARE(tree()->headerItem()->text(0) + '|' + tree()->headerItem()->text(1) + '|' +
                 tree()->headerItem()->text(2),
             "Device|Interface|Comment");
    const QFontMetrics metrics(tree()->font());
    for (int row = 0; row < 3; ++row) {
        for (const QString &texts : childRows(row)) {
            const QString value = texts.section('|', 1);
            QVERIFY2(metrics.horizontalAdvance(value) < tree()->columnWidth(1), qPrintable(value));
        }
    }
    QVERIFY(tree()->columnWidth(0) + tree()->columnWidth(1) < tree()->viewport()->width() - 60);
}

QTEST_MAIN(TestInstrListEditing)
#include "tst_instrlistediting.moc"
