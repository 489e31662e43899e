// SPDX-License-Identifier: Apache-2.0
#include "display/QtNumericEdit.h"
#include "log/Tracer.h"
#include "support/logreader.h"
#include "support/modals.h"
#include "support/rows.h"

#include <QApplication>
#include <QSignalSpy>
#include <QTest>
#include <QVBoxLayout>

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

void typeText(QWidget *widget, const QString &text)
{
    QTest::keyClick(widget, Qt::Key_A, Qt::ControlModifier);
    QTest::keyClicks(widget, text);
}

} // namespace

class TestQtNumericEdit : public QObject
{
    Q_OBJECT

private slots:
    void init() { (void)Tracer::takeEntries(); }
    void typing();
    void rangeIsAValueOfItsOwn();
    void untouchedFieldKeepsFullPrecision();
    void invalidTextRestores();
    void stepping();
    void decimalStepsReachTheBound();
    void contextMenu();
    void cursorStep();
};

void TestQtNumericEdit::typing()
{
    forRows({{"comma", "Hz", false, "1,5M", 1.5e6, "1.5 MHz"},
             {"milli by case", "Hz", true, "2 mHz", 2e-3, "2 mHz"},
             {"clamped above", "Hz", false, "99G", 1e10, "10 GHz"},
             {"clamped below", "Hz", false, "-2M", -1e6, "-1 MHz"}},
            [&](const QString &unit, bool lowerPrefix, const QString &typed, double value,
                const QString &shown) {
                Window w;
                w.field->setUnit(unit);
                w.field->setLowerPrefix(lowerPrefix);
                w.show();
                QSignalSpy updates(w.field, &QtNumericEdit::valueUpdated);

                typeText(w.field, typed);
                QVERIFY(w.field->property("edit_mode").toBool() && w.field->font().bold());
                QCOMPARE(updates.count(), 0);
                QTest::keyClick(w.field, Qt::Key_Return);
                QCOMPARE(w.field->getVal(), value);
                QCOMPARE(w.field->text(), shown);
                QVERIFY(!w.field->property("edit_mode").toBool() && !w.field->font().bold());
                QCOMPARE(updates.count(), 1);
                QCOMPARE(updates.at(0).at(0).toDouble(), value);
                const QString words = QString("  'le_freq' >> %1 %2 , value update!")
                                          .arg(QString::number(value, 'g', 15), unit);
                QVERIFY(takeMessages(Tracer::DebugMask).join('\n').contains(words));

                // Leaving the field afterwards must not send a second time.
                w.other->setFocus();
                QTRY_VERIFY(w.other->hasFocus());
                QCOMPARE(updates.count(), 1);
            });
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
    field.setVal(qQNaN());
    QCOMPARE(field.getVal(), 12.0);
    field.setMax(1e9);
    field.setUnit("Hz");
    field.setScaled(true);
    field.setVal(qlonglong(123456789));
    QCOMPARE(field.text(), "123.456789 MHz");
    QCOMPARE(field.getValInt(), 123456789);
    field.setPrecision(1);
    QCOMPARE(field.text(), "123.5 MHz");
    QCOMPARE(field.property("edit_mode").toBool(), false);
    QCOMPARE(updates.count(), 0);
    QVERIFY(takeMessages(Tracer::DebugMask).isEmpty());
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
        QVERIFY(takeMessages(Tracer::DebugMask)
                    .join('\n')
                    .endsWith("  Invalid input. Restoring previous value."));
        w.field->setFocus();
    }
    QCOMPARE(updates.count(), 0);
}

void TestQtNumericEdit::stepping()
{
    forRows({{"up", 10.0, 1, 12.0},
             {"up onto the bound", 18.0, 1, 20.0},
             {"no clamp below", 1.0, -1, 1.0}},
            [](double start, int direction, double result) {
                Window w;
                w.field->setMin(0);
                w.field->setMax(20);
                w.show();
                QSignalSpy updates(w.field, &QtNumericEdit::valueUpdated);
                const auto key = direction > 0 ? Qt::Key_Up : Qt::Key_Down;
                // Without a step neither key nor wheel changes anything.
                for (const double step : {0.0, 2.0}) {
                    w.field->setStep(step);
                    const double expected = step > 0 ? result : start;
                    w.field->setVal(start);
                    QTest::keyClick(w.field, key);
                    QCOMPARE(w.field->getVal(), expected);
                    w.field->setVal(start);
                    QCOMPARE(turnWheel(*w.field, 120 * direction), expected != start);
                    QCOMPARE(w.field->getVal(), expected);
                }
                QCOMPARE(updates.count(), result != start ? 2 : 0);
            });
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

void TestQtNumericEdit::contextMenu()
{
    Window w;
    w.field->setVal(1500);
    w.show();
    QSignalSpy updates(w.field, &QtNumericEdit::valueUpdated);
    const auto choose = [&w](const char *text) { QVERIFY2(chooseFromMenu(*w.field, text), text); };
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

void TestQtNumericEdit::cursorStep()
{
    Window w;
    w.show();
    typeText(w.field, "-1.25 kHz");
    // The sign has no weight, the point counts to the left.
    for (const auto &[place, step] : {std::pair(0, ""), {2, "1 kHz"}, {4, "10 Hz"}}) {
        w.field->setCursorPosition(place == 0 ? 1 : 0);
        w.field->setCursorPosition(place);
        const QString tip = w.field->toolTip();
        QVERIFY2(*step == '\0' ? !tip.contains("Step")
                               : tip.endsWith(QString("\n Step = %1 (at the cursor)").arg(step)),
                 qPrintable(tip));
    }
    w.other->setFocus();
    QTRY_VERIFY(w.other->hasFocus());
    QVERIFY(!w.field->toolTip().contains("Step"));
}

QTEST_MAIN(TestQtNumericEdit)
#include "tst_QtNumericEdit.moc"
