// SPDX-License-Identifier: Apache-2.0
#include "display/QtNumericEdit.h"
#include "log/Tracer.h"

#include <QApplication>
#include <QContextMenuEvent>
#include <QMenu>
#include <QSignalSpy>
#include <QTest>
#include <QVBoxLayout>
#include <QWheelEvent>

#include <memory>

namespace {

/// A window with the field under test and a second one to move the focus to.
struct Window
{
    QWidget window;
    QtNumericEdit *field = new QtNumericEdit(&window);
    QtNumericEdit *other = new QtNumericEdit(&window);

    Window()
    {
        auto *layout = new QVBoxLayout(&window);
        layout->addWidget(field);
        layout->addWidget(other);
        field->setObjectName("le_freq");
        field->setName("Frequency");
        field->setUnit("Hz");
        field->setScaled(true);
        field->setMin(-1e6);
        field->setMax(1e10);
    }

    void show()
    {
        window.show();
        window.activateWindow();
        QVERIFY(QTest::qWaitForWindowActive(&window));
        field->setFocus();
        QTRY_VERIFY(field->hasFocus());
    }
};

/// Turns the wheel over a widget; tells whether the event was taken.
bool turnWheel(QWidget *widget, int delta)
{
    const QPointF center = widget->rect().center();
    QWheelEvent event(center, widget->mapToGlobal(center), QPoint(), QPoint(0, delta), Qt::NoButton,
                      Qt::NoModifier, Qt::NoScrollPhase, false);
    event.setAccepted(false);
    QApplication::sendEvent(widget, &event);
    return event.isAccepted();
}

void typeText(QWidget *widget, const QString &text)
{
    QTest::keyClick(widget, Qt::Key_A, Qt::ControlModifier);
    QTest::keyClicks(widget, text);
}

/// Opens the field's context menu as the right button does; null if none appears.
QMenu *openMenu(QtNumericEdit *field)
{
    const QPoint center = field->rect().center();
    QContextMenuEvent event(QContextMenuEvent::Mouse, center, field->mapToGlobal(center));
    QApplication::sendEvent(field, &event);
    return qobject_cast<QMenu *>(QApplication::activePopupWidget());
}

QAction *findAction(QMenu *menu, const QString &text)
{
    for (QAction *action : menu->actions()) {
        if (action->text() == text) {
            return action;
        }
    }
    return nullptr;
}

QStringList takeLog()
{
    QStringList lines;
    for (const Tracer::Entry &entry : Tracer::takeEntries()) {
        lines += entry.first;
    }
    return lines;
}

} // namespace

class TestQtNumericEdit : public QObject
{
    Q_OBJECT

private slots:
    void init() { (void)Tracer::takeEntries(); }
    void typing_data();
    void typing();
    void rangeIsAValueOfItsOwn();
    void programmaticValuesAreSilent();
    void untouchedFieldKeepsFullPrecision();
    void invalidTextRestores();
    void stepping_data();
    void stepping();
    void decimalStepsReachTheBound();
    void readOnly();
    void contextMenu();
    void cursorStep_data();
    void cursorStep();
    void toolTip();
};

void TestQtNumericEdit::typing_data()
{
    QTest::addColumn<QString>("unit");
    QTest::addColumn<bool>("lowerPrefix");
    QTest::addColumn<QString>("typed");
    QTest::addColumn<double>("value");
    QTest::addColumn<QString>("shown");

    QTest::newRow("prefix") << "Hz" << false << "1.5 k" << 1500.0 << "1.5 kHz";
    QTest::newRow("comma") << "Hz" << false << "1,5M" << 1.5e6 << "1.5 MHz";
    QTest::newRow("mega by case") << "Hz" << true << "2 MHz" << 2e6 << "2 MHz";
    QTest::newRow("milli by case") << "Hz" << true << "2 mHz" << 2e-3 << "2 mHz";
    QTest::newRow("mega whatever case") << "Hz" << false << "2 mhz" << 2e6 << "2 MHz";
    QTest::newRow("unit without prefix") << "s" << true << "3s" << 3.0 << "3 s";
    QTest::newRow("clamped above") << "Hz" << false << "99G" << 1e10 << "10 GHz";
    QTest::newRow("clamped below") << "Hz" << false << "-2M" << -1e6 << "-1 MHz";
    QTest::newRow("blanks in the number") << "Hz" << false << " 1 000 " << 1000.0 << "1 kHz";
}

void TestQtNumericEdit::typing()
{
    QFETCH(QString, unit);
    QFETCH(bool, lowerPrefix);
    QFETCH(QString, typed);
    QFETCH(double, value);
    QFETCH(QString, shown);

    Window w;
    w.field->setUnit(unit);
    w.field->setLowerPrefix(lowerPrefix);
    w.show();
    QSignalSpy updates(w.field, &QtNumericEdit::valueUpdated);

    typeText(w.field, typed);
    QCOMPARE(w.field->property("edit_mode").toString(), "true");
    QVERIFY(w.field->font().bold());
    QCOMPARE(updates.count(), 0);

    QTest::keyClick(w.field, Qt::Key_Return);
    QCOMPARE(w.field->getVal(), value);
    QCOMPARE(w.field->text(), shown);
    QCOMPARE(w.field->property("edit_mode").toString(), "false");
    QVERIFY(!w.field->font().bold());
    QCOMPARE(updates.count(), 1);
    QCOMPARE(updates.at(0).at(0).toDouble(), value);
    const QString words =
        QString("  'le_freq' >> %1 %2 , value update!").arg(QString::number(value, 'g', 15), unit);
    QVERIFY(takeLog().join('\n').contains(words));

    // Leaving the field afterwards must not send a second time.
    w.other->setFocus();
    QTRY_VERIFY(w.other->hasFocus());
    QCOMPARE(updates.count(), 1);
}

void TestQtNumericEdit::rangeIsAValueOfItsOwn()
{
    QtNumericEdit field;
    QCOMPARE(field.getVal(), 0.0);
    QCOMPARE(field.text(), "0");
    QSignalSpy updates(&field, &QtNumericEdit::valueUpdated);
    field.setMin(5);
    QCOMPARE(field.getVal(), 5.0);
    field.setMax(20);
    field.setVal(15);
    field.setMax(12);
    QCOMPARE(field.getVal(), 12.0);
    QCOMPARE(field.text(), "12");
    field.setMax(qQNaN());
    QCOMPARE(field.max(), 12.0);
    QCOMPARE(updates.count(), 0);
}

void TestQtNumericEdit::programmaticValuesAreSilent()
{
    Window w;
    QSignalSpy updates(w.field, &QtNumericEdit::valueUpdated);
    w.field->setVal(5e10);
    QCOMPARE(w.field->getVal(), 1e10);
    w.field->setVal(qQNaN());
    QCOMPARE(w.field->getVal(), 1e10);
    w.field->setVal(qlonglong(123456789));
    QCOMPARE(w.field->text(), "123.456789 MHz");
    QCOMPARE(w.field->getValInt(), 123456789);
    w.field->setPrecision(1);
    QCOMPARE(w.field->text(), "123.5 MHz");
    w.field->setScaled(false);
    QCOMPARE(w.field->text(), "123456789 Hz");
    QCOMPARE(w.field->property("edit_mode").toBool(), false);
    QCOMPARE(updates.count(), 0);
    QVERIFY(takeLog().isEmpty());
}

void TestQtNumericEdit::untouchedFieldKeepsFullPrecision()
{
    Window w;
    w.field->setVal(1e9 / 3);
    w.show();
    QSignalSpy updates(w.field, &QtNumericEdit::valueUpdated);
    QTest::keyClick(w.field, Qt::Key_Return);
    w.other->setFocus();
    QTRY_VERIFY(w.other->hasFocus());
    QCOMPARE(w.field->getVal(), 1e9 / 3);
    QCOMPARE(updates.count(), 0);
}

void TestQtNumericEdit::invalidTextRestores()
{
    Window w;
    w.field->setVal(1500);
    w.show();
    QSignalSpy updates(w.field, &QtNumericEdit::valueUpdated);
    for (const char *typed : {"abc", "kHz", "", "1.2.3", "1e999"}) {
        typeText(w.field, typed);
        if (*typed == '\0') {
            QTest::keyClick(w.field, Qt::Key_Backspace);
        }
        QCOMPARE(w.field->property("edit_mode").toBool(), true);
        w.other->setFocus();
        QTRY_VERIFY(w.other->hasFocus());
        QCOMPARE(w.field->getVal(), 1500.0);
        QCOMPARE(w.field->text(), "1.5 kHz");
        QCOMPARE(w.field->property("edit_mode").toBool(), false);
        QVERIFY(takeLog().join('\n').endsWith("  Invalid input. Restoring previous value."));
        w.field->setFocus();
    }
    QCOMPARE(updates.count(), 0);
}

void TestQtNumericEdit::stepping_data()
{
    QTest::addColumn<double>("start");
    QTest::addColumn<int>("direction");
    QTest::addColumn<double>("result");

    QTest::newRow("up") << 10.0 << 1 << 12.0;
    QTest::newRow("down") << 10.0 << -1 << 8.0;
    QTest::newRow("up onto the bound") << 18.0 << 1 << 20.0;
    QTest::newRow("no clamp above") << 19.0 << 1 << 19.0;
    QTest::newRow("no clamp below") << 1.0 << -1 << 1.0;
}

void TestQtNumericEdit::stepping()
{
    QFETCH(double, start);
    QFETCH(int, direction);
    QFETCH(double, result);

    Window w;
    w.field->setMin(0);
    w.field->setMax(20);
    w.field->setVal(start);
    w.show();
    QSignalSpy updates(w.field, &QtNumericEdit::valueUpdated);
    const bool taken = result != start;

    // Without a step neither key nor wheel changes anything.
    QTest::keyClick(w.field, direction > 0 ? Qt::Key_Up : Qt::Key_Down);
    QVERIFY(!turnWheel(w.field, 120 * direction));
    QCOMPARE(w.field->getVal(), start);

    w.field->setStep(-2);
    w.field->setStep(2);
    QTest::keyClick(w.field, direction > 0 ? Qt::Key_Up : Qt::Key_Down);
    QCOMPARE(w.field->getVal(), result);
    QCOMPARE(updates.count(), taken ? 1 : 0);

    w.field->setVal(start);
    QCOMPARE(turnWheel(w.field, 120 * direction), taken);
    QCOMPARE(w.field->getVal(), result);
    QCOMPARE(updates.count(), taken ? 2 : 0);
}

void TestQtNumericEdit::decimalStepsReachTheBound()
{
    Window w;
    w.field->setUnit("dB");
    w.field->setLowerPrefix(true);
    w.field->setScaled(false);
    w.field->setMin(-0.3);
    w.field->setMax(0.3);
    w.field->setStep(0.1);
    w.field->setVal(-0.3);
    w.show();
    QStringList shown;
    for (int i = 0; i < 6; ++i) {
        QTest::keyClick(w.field, Qt::Key_Up);
        shown += w.field->text();
    }
    QCOMPARE(shown, QStringList({"-0.2 dB", "-0.1 dB", "0 dB", "0.1 dB", "0.2 dB", "0.3 dB"}));
}

void TestQtNumericEdit::readOnly()
{
    Window w;
    w.field->setStep(1);
    w.field->setVal(7);
    w.field->setReadOnly(true);
    w.show();
    QTest::keyClick(w.field, Qt::Key_Up);
    QVERIFY(!turnWheel(w.field, 120));
    QVERIFY(!openMenu(w.field));
    QCOMPARE(w.field->getVal(), 7.0);
}

void TestQtNumericEdit::contextMenu()
{
    Window w;
    w.field->setVal(1500);
    w.show();
    QSignalSpy updates(w.field, &QtNumericEdit::valueUpdated);
    const auto choose = [&w](const QString &text) {
        QMenu *menu = openMenu(w.field);
        QVERIFY(menu);
        QAction *action = findAction(menu, text);
        QVERIFY2(action, qPrintable(text));
        QVERIFY2(action->isEnabled(), qPrintable(text));
        QTest::mouseClick(menu, Qt::LeftButton, Qt::NoModifier,
                          menu->actionGeometry(action).center());
        QTRY_VERIFY(!QApplication::activePopupWidget());
    };

    // The digit 5 of "1.5 kHz" weighs 100 Hz; the menu must not forget it by taking the focus.
    w.field->setCursorPosition(2);
    choose("Set Step from Csr");
    QCOMPARE(w.field->step(), 100.0);
    QCOMPARE(updates.count(), 0);

    choose("Set to Min");
    QCOMPARE(w.field->getVal(), -1e6);
    choose("Set to Max");
    QCOMPARE(w.field->getVal(), 1e10);
    QCOMPARE(updates.count(), 2);

    choose("Clear All");
    QCOMPARE(w.field->text(), "");
    QCOMPARE(w.field->property("edit_mode").toBool(), true);
    QCOMPARE(w.field->getVal(), 1e10);
    QCOMPARE(updates.count(), 2);
}

void TestQtNumericEdit::cursorStep_data()
{
    QTest::addColumn<QString>("text");
    QTest::addColumn<int>("position");
    QTest::addColumn<QString>("tip");

    QTest::newRow("first digit") << "-1.25 kHz" << 1 << "1 kHz";
    QTest::newRow("point counts left") << "-1.25 kHz" << 2 << "1 kHz";
    QTest::newRow("fraction") << "-1.25 kHz" << 4 << "10 Hz";
    QTest::newRow("behind the digits") << "-1.25 kHz" << 9 << "10 Hz";
    QTest::newRow("sign has no weight") << "-1.25 kHz" << 0 << QString();
    QTest::newRow("no digit") << "kHz" << 0 << QString();
}

void TestQtNumericEdit::cursorStep()
{
    QFETCH(QString, text);
    QFETCH(int, position);
    QFETCH(QString, tip);

    Window w;
    w.show();
    typeText(w.field, text);
    w.field->setCursorPosition(position == 0 ? 1 : 0);
    w.field->setCursorPosition(position);
    const QString line = "\n Step = " + tip + " (at the cursor)";
    QCOMPARE(w.field->toolTip().contains("Step"), !tip.isEmpty());
    QVERIFY2(tip.isEmpty() || w.field->toolTip().endsWith(line), qPrintable(w.field->toolTip()));
    w.other->setFocus();
    QTRY_VERIFY(w.other->hasFocus());
    QVERIFY(!w.field->toolTip().contains("Step"));
}

void TestQtNumericEdit::toolTip()
{
    Window w;
    QCOMPARE(w.field->toolTip(), "Frequency\n Min = -1 MHz Max = 10 GHz");
    w.field->setStep(1000);
    QCOMPARE(w.field->toolTip(), "Frequency\n Min = -1 MHz Max = 10 GHz\n Step = 1 kHz");
    w.field->setToolTip("Carrier");
    QCOMPARE(w.field->toolTip(), "Carrier\n Min = -1 MHz Max = 10 GHz\n Step = 1 kHz");
    QtNumericEdit angle;
    angle.setupAngle(-180, 180, 5);
    QCOMPARE(angle.toolTip(), " Min = -180 deg Max = 180 deg\n Step = 5 deg");
}

QTEST_MAIN(TestQtNumericEdit)
#include "tst_QtNumericEdit.moc"
