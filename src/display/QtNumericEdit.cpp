// SPDX-License-Identifier: Apache-2.0
#include "QtNumericEdit.h"

#include "base/EngineeringNumber.h"
#include "log/Tracer.h"

#include <QContextMenuEvent>
#include <QFocusEvent>
#include <QKeyEvent>
#include <QMenu>
#include <QStyle>
#include <QToolTip>
#include <QWheelEvent>

#include <cmath>
#include <limits>

namespace {

constexpr char EditModeProperty[] = "edit_mode";

/// Sums of decimal steps miss the round numbers by rounding errors; what lies this close to a
/// bound or to zero, as a share of the step, is meant to be it.
constexpr double StepTolerance = 1e-9;

} // namespace

QtNumericEdit::QtNumericEdit(QWidget *parent)
    : QLineEdit(parent)
{
    setProperty(EditModeProperty, false);
    connect(this, &QLineEdit::textChanged, this, &QtNumericEdit::setEditMode);
    connect(this, &QLineEdit::editingFinished, this, &QtNumericEdit::editingFinished);
    connect(this, &QLineEdit::cursorPositionChanged, this, &QtNumericEdit::cursorPositionChanged);
    setVal(0.0);
}

qlonglong QtNumericEdit::getValInt() const
{
    constexpr double Limit = 9.2e18; // stays inside 64 bits, where the conversion is defined
    if (std::isnan(m_value)) {
        return 0;
    }
    return std::llround(std::fmin(std::fmax(m_value, -Limit), Limit));
}

void QtNumericEdit::setUnit(const QString &unit)
{
    m_unit = unit;
    formatChanged();
}

void QtNumericEdit::setLowerPrefix(bool allowed)
{
    m_lowerPrefix = allowed;
    formatChanged();
}

void QtNumericEdit::setScaled(bool scaled)
{
    m_scaled = scaled;
    formatChanged();
}

void QtNumericEdit::setPrecision(int digits)
{
    m_precision = digits;
    formatChanged();
}

void QtNumericEdit::setName(const QString &name)
{
    m_name = name;
    setAccessibleName(name);
    refreshToolTip();
}

void QtNumericEdit::setToolTip(const QString &text)
{
    setName(text);
}

void QtNumericEdit::setMin(double min)
{
    if (min == m_min || std::isnan(min)) {
        return;
    }
    m_min = min;
    if (m_value < m_min) {
        store(m_min);
    }
    refreshToolTip();
}

void QtNumericEdit::setMax(double max)
{
    if (max == m_max || std::isnan(max)) {
        return;
    }
    m_max = max;
    if (m_value > m_max) {
        store(m_max);
    }
    refreshToolTip();
}

void QtNumericEdit::setStep(double step)
{
    if (!(step > 0) || step == m_step) {
        return;
    }
    m_step = step;
    m_hasStep = true;
    refreshToolTip();
}

void QtNumericEdit::setupAngle(double min, double max, double step)
{
    setUnit("deg");
    setLowerPrefix(true);
    setMin(min);
    setMax(max);
    setStep(step);
}

void QtNumericEdit::setVal(double value)
{
    store(clamped(value));
}

void QtNumericEdit::store(double value)
{
    m_value = value;
    showFormattedValue();
    markEdited(false);
    refreshToolTip();
}

void QtNumericEdit::setVal(long value)
{
    setVal(static_cast<double>(value));
}

void QtNumericEdit::setVal(int value)
{
    setVal(static_cast<double>(value));
}

void QtNumericEdit::setVal(qlonglong value)
{
    setVal(static_cast<double>(value));
}

void QtNumericEdit::editingFinished()
{
    // Leaving an untouched field must not read the rounded text back into the value.
    if (!isEditing()) {
        return;
    }
    const auto parsed = parseNumber(text(), m_unit, m_lowerPrefix);
    if (!parsed) {
        showText(m_lastText);
        markEdited(false);
        Tracer::Trace(Tracer::Warning, "  Invalid input. Restoring previous value.");
        tell("That is no number; the value before is back.");
        return;
    }
    accept(parsed->value);
    if (clamped(parsed->value) != parsed->value) {
        tell(QString("Permitted: %1 to %2")
                 .arg(formatNumber(m_min, format()), formatNumber(m_max, format())));
    }
}

/// Beside the field, since what was typed stands there no more.
void QtNumericEdit::tell(const QString &text)
{
    if (isVisible()) {
        QToolTip::showText(mapToGlobal(QPoint(0, height())), text, this);
    }
}

void QtNumericEdit::setEditMode(const QString &)
{
    markEdited(true);
}

void QtNumericEdit::cursorPositionChanged(int, int)
{
    updateCursorStep();
}

void QtNumericEdit::cm_clrwidget()
{
    clear();
    markEdited(true);
}

void QtNumericEdit::cm_setmin()
{
    accept(m_min);
}

void QtNumericEdit::cm_setmax()
{
    accept(m_max);
}

void QtNumericEdit::cm_setstep()
{
    setStep(m_cursorStep);
}

void QtNumericEdit::keyPressEvent(QKeyEvent *event)
{
    const bool up = event->key() == Qt::Key_Up;
    const bool down = event->key() == Qt::Key_Down;
    if (m_hasStep && !isReadOnly() && (up || down)) {
        (void)stepBy(up ? 1 : -1);
        event->accept();
        return;
    }
    QLineEdit::keyPressEvent(event);
}

void QtNumericEdit::wheelEvent(QWheelEvent *event)
{
    const int delta = event->angleDelta().y();
    // What the field doesn't take goes to the parent, so that a page under it scrolls on.
    const bool takes = m_hasStep && !isReadOnly() && hasFocus() && delta != 0;
    event->setAccepted(takes);
    if (!takes) {
        return;
    }
    // Touch pads turn one notch into many small events.
    m_wheelAngle = (m_wheelAngle > 0) == (delta > 0) ? m_wheelAngle + delta : delta;
    const int notches = m_wheelAngle / QWheelEvent::DefaultDeltasPerStep;
    m_wheelAngle %= QWheelEvent::DefaultDeltasPerStep;
    if (notches != 0) {
        event->setAccepted(stepBy(notches));
    }
}

void QtNumericEdit::contextMenuEvent(QContextMenuEvent *event)
{
    if (isReadOnly()) {
        event->ignore();
        return;
    }
    auto *menu = new QMenu(this);
    menu->setAttribute(Qt::WA_DeleteOnClose);
    menu->addAction(tr("Clear All"), this, &QtNumericEdit::cm_clrwidget);
    menu->addAction(tr("Set to Min"), this, &QtNumericEdit::cm_setmin);
    menu->addAction(tr("Set to Max"), this, &QtNumericEdit::cm_setmax);
    QAction *setStepAction =
        menu->addAction(tr("Set Step from Csr"), this, &QtNumericEdit::cm_setstep);
    setStepAction->setEnabled(m_hasCursorStep);
    menu->popup(event->globalPos());
    event->accept();
}

void QtNumericEdit::focusInEvent(QFocusEvent *event)
{
    QLineEdit::focusInEvent(event);
    updateCursorStep();
}

void QtNumericEdit::focusOutEvent(QFocusEvent *event)
{
    QLineEdit::focusOutEvent(event);
    // The context menu takes the focus too, but its last entry is about this very step.
    if (event->reason() != Qt::PopupFocusReason) {
        clearCursorStep();
    }
}

NumberFormat QtNumericEdit::format() const
{
    return {
        .unit = m_unit, .scaled = m_scaled, .lowerPrefix = m_lowerPrefix, .precision = m_precision};
}

double QtNumericEdit::clamped(double value) const
{
    if (std::isnan(value)) {
        return m_value;
    }
    // A range that is being built may be upside down for a moment, which std::clamp forbids.
    if (value < m_min) {
        return m_min;
    }
    return value > m_max ? m_max : value;
}

bool QtNumericEdit::isEditing() const
{
    return property(EditModeProperty).toBool();
}

bool QtNumericEdit::stepBy(int direction)
{
    double target = m_value + direction * m_step;
    const double tolerance = m_step * StepTolerance;
    if (std::fabs(target) < tolerance) {
        target = 0;
    }
    if (target > m_max + tolerance || target < m_min - tolerance) {
        return false;
    }
    setVal(target);
    emit valueUpdated(m_value);
    return true;
}

void QtNumericEdit::accept(double value)
{
    setVal(value);
    const QString number = QString::number(m_value, 'g', std::numeric_limits<double>::digits10);
    Tracer::Trace(
        Tracer::Information,
        m_unit.isEmpty()
            ? QString("  '%1' >> %2 , value update!").arg(objectName(), number)
            : QString("  '%1' >> %2 %3 , value update!").arg(objectName(), number, m_unit));
    emit valueUpdated(m_value);
}

void QtNumericEdit::showText(const QString &text)
{
    disconnect(this, &QLineEdit::textChanged, this, &QtNumericEdit::setEditMode);
    setText(text);
    connect(this, &QLineEdit::textChanged, this, &QtNumericEdit::setEditMode);
}

void QtNumericEdit::showFormattedValue()
{
    const FormattedNumber shown = formatNumber(m_value, format(), m_hasStep ? m_step : 0);
    m_lastText = shown.text;
    showText(shown.text);
    // The start of a long number tells more than its end; a step's own digit tells most.
    setCursorPosition(qMax(0, shown.stepPosition));
}

void QtNumericEdit::formatChanged()
{
    if (!isEditing()) {
        showFormattedValue();
    }
    refreshToolTip();
}

void QtNumericEdit::markEdited(bool edited)
{
    if (isEditing() == edited) {
        return;
    }
    setProperty(EditModeProperty, edited);
    style()->unpolish(this);
    style()->polish(this);
    QFont changed = font();
    changed.setBold(edited);
    setFont(changed);
}

void QtNumericEdit::updateCursorStep()
{
    if (!hasFocus()) {
        clearCursorStep();
        return;
    }
    QString weights = text();
    qsizetype last = -1;
    for (qsizetype i = 0; i < weights.size(); ++i) {
        if (weights.at(i).isDigit()) {
            weights[i] = '0';
            last = i;
        }
    }
    if (last < 0) {
        clearCursorStep();
        return;
    }
    qsizetype position = qMin<qsizetype>(cursorPosition(), last);
    if (!weights.at(position).isDigit()) {
        --position;
    }
    if (position < 0 || !weights.at(position).isDigit()) {
        clearCursorStep();
        return;
    }
    weights[position] = '1';
    const auto parsed = parseNumber(weights, m_unit, m_lowerPrefix);
    if (!parsed) {
        clearCursorStep();
        return;
    }
    m_cursorStep = std::fabs(parsed->value);
    m_hasCursorStep = true;
    refreshToolTip();
}

void QtNumericEdit::clearCursorStep()
{
    if (!m_hasCursorStep) {
        return;
    }
    m_hasCursorStep = false;
    refreshToolTip();
}

void QtNumericEdit::refreshToolTip()
{
    const NumberFormat numbers = format();
    QString tip = m_name.isEmpty() ? QString() : m_name + '\n';
    tip += " Min = " + formatNumber(m_min, numbers) + " Max = " + formatNumber(m_max, numbers);
    if (m_hasStep) {
        tip += "\n Step = " + formatNumber(m_step, numbers);
    }
    if (m_hasCursorStep && !(m_hasStep && m_cursorStep == m_step)) {
        tip += "\n Step = " + formatNumber(m_cursorStep, numbers) + tr(" (at the cursor)");
    }
    QLineEdit::setToolTip(tip);
}
