// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <QLineEdit>
#include <QString>

struct NumberFormat;

/// The number field of all tools: holds a number with a unit, shows it with an engineering prefix,
/// takes typed text with prefixes, clamps it to a range and steps by the Up and Down keys and the
/// wheel.
///
/// The dynamic property "edit_mode" is true while the text was changed and not yet taken, so that a
/// style sheet can show such a field differently; the text is bold meanwhile. Enter or leaving the
/// field takes the text; text that is no number brings the last value back.
///
/// Range, step and value are in the unit without prefix. Minimum, maximum and value start at 0, so
/// a range must be set before a value can be held.
class QtNumericEdit : public QLineEdit
{
    Q_OBJECT
    Q_PROPERTY(QString unit READ unit WRITE setUnit)
    Q_PROPERTY(bool lowerPrefix READ lowerPrefix WRITE setLowerPrefix)
    Q_PROPERTY(bool scaled READ scaled WRITE setScaled)
    Q_PROPERTY(int precision READ precision WRITE setPrecision)
    Q_PROPERTY(double min READ min WRITE setMin)
    Q_PROPERTY(double max READ max WRITE setMax)
    Q_PROPERTY(double step READ step WRITE setStep)
    Q_PROPERTY(double value READ getVal WRITE setVal)

public:
    explicit QtNumericEdit(QWidget *parent = nullptr);

    [[nodiscard]] double getVal() const { return m_value; }
    /// The value rounded to the nearest integer, for counts and positions.
    [[nodiscard]] qlonglong getValInt() const;

    [[nodiscard]] QString unit() const { return m_unit; }
    [[nodiscard]] bool lowerPrefix() const { return m_lowerPrefix; }
    [[nodiscard]] bool scaled() const { return m_scaled; }
    [[nodiscard]] int precision() const { return m_precision; }
    [[nodiscard]] QString name() const { return m_name; }
    [[nodiscard]] double min() const { return m_min; }
    [[nodiscard]] double max() const { return m_max; }
    [[nodiscard]] double step() const { return m_step; } ///< 0 while none was set

    void setUnit(const QString &unit);
    /// Allows prefixes below 1 (m, u, n, p, f). Without it every "M" that is typed means mega.
    void setLowerPrefix(bool allowed);
    /// Shows the value with an engineering prefix.
    void setScaled(bool scaled);
    /// Digits behind the point before trailing zeros go; 0 or less means 6.
    void setPrecision(int digits);
    /// The description of the field, the first line of its tool tip.
    void setName(const QString &name);
    /// A new bound moves a value that it leaves outside, without a signal.
    void setMin(double min);
    void setMax(double max);
    /// Switches stepping on; a step that isn't above 0 is ignored.
    void setStep(double step);
    /// A field for an angle in degrees.
    void setupAngle(double min, double max, double step);

public slots:
    /// Shows a value, clamped to the range. Sends nothing.
    void setVal(double value);
    void setVal(long value);
    void setVal(int value);
    void setVal(qlonglong value);

    /// The same as setName: the tool tip itself is made by the field.
    void setToolTip(const QString &text);

    /// Takes the typed text, or restores the last one. Hides the signal of the base class, which
    /// leads here.
    void editingFinished();
    void setEditMode(const QString &text);
    void cursorPositionChanged(int oldPosition, int newPosition);

    void cm_clrwidget();
    void cm_setmin();
    void cm_setmax();
    void cm_setstep();

signals:
    /// The user changed the value by typing, stepping or the context menu.
    void valueUpdated(double value);

protected:
    void keyPressEvent(QKeyEvent *event) override;
    void wheelEvent(QWheelEvent *event) override;
    void contextMenuEvent(QContextMenuEvent *event) override;
    void focusInEvent(QFocusEvent *event) override;
    void focusOutEvent(QFocusEvent *event) override;

private:
    [[nodiscard]] NumberFormat format() const;
    [[nodiscard]] double clamped(double value) const;
    [[nodiscard]] bool isEditing() const;
    [[nodiscard]] bool stepBy(int direction);
    void store(double value);
    void accept(double value);
    void showText(const QString &text);
    void tell(const QString &text);
    void showFormattedValue();
    void formatChanged();
    void markEdited(bool edited);
    void updateCursorStep();
    void clearCursorStep();
    void refreshToolTip();

    QString m_unit;
    bool m_lowerPrefix = false;
    bool m_scaled = false;
    int m_precision = 0;
    QString m_name;
    bool m_hasStep = false;
    int m_wheelAngle = 0; ///< turned since the last step, eighths of a degree
    double m_cursorStep = 0;
    bool m_hasCursorStep = false;
    double m_step = 0;
    double m_min = 0;
    double m_max = 0;
    double m_value = 0;
    QString m_lastText; ///< text of the last accepted value
};
