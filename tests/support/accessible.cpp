// SPDX-License-Identifier: Apache-2.0
#include "accessible.h"

#include <QAbstractButton>
#include <QAbstractSpinBox>
#include <QComboBox>
#include <QGroupBox>
#include <QLabel>
#include <QMap>
#include <QStackedWidget>
#include <QTabBar>
#include <QTabWidget>
#include <QWidget>

namespace {

bool isPartOfAnother(const QWidget &control)
{
    for (const QWidget *above = control.parentWidget(); above != nullptr;
         above = above->isWindow() ? nullptr : above->parentWidget()) {
        if (qobject_cast<const QComboBox *>(above) ||
            qobject_cast<const QAbstractSpinBox *>(above)) {
            return true;
        }
    }
    return false;
}

/// The page of the window's stack that a control stands on; null for what all pages share.
const QWidget *pageOf(const QWidget &control)
{
    for (const QWidget *one = &control; one->parentWidget() != nullptr; one = one->parentWidget()) {
        if (qobject_cast<const QStackedWidget *>(one->parentWidget())) {
            return one;
        }
    }
    return nullptr;
}

QString textOf(const QWidget &control)
{
    if (const auto *button = qobject_cast<const QAbstractButton *>(&control)) {
        return button->text();
    }
    if (const auto *label = qobject_cast<const QLabel *>(&control)) {
        return label->buddy() != nullptr ? label->text() : QString();
    }
    const auto *group = qobject_cast<const QGroupBox *>(&control);
    return group != nullptr ? group->title() : QString();
}

/// What a screen reader says of a control before it says its value. A box of choices without a name
/// would be read by its value alone, and tabs have their own names.
QString nameOf(const QWidget &control, const QList<QWidget *> &controls)
{
    if (!control.accessibleName().isEmpty()) {
        return control.accessibleName();
    }
    for (const QWidget *one : controls) {
        const auto *label = qobject_cast<const QLabel *>(one);
        if (label != nullptr && label->buddy() == &control) {
            return label->text();
        }
    }
    if (qobject_cast<const QTabBar *>(&control) || qobject_cast<const QTabWidget *>(&control)) {
        return "tabs";
    }
    return textOf(control);
}

/// Whether the window has hidden the control itself, as what comes up for a while only.
bool isHeldBack(const QWidget &control)
{
    return control.isHidden() && control.testAttribute(Qt::WA_WState_ExplicitShowHide);
}

QString describe(const QWidget &control)
{
    return QString("%1 \"%2\"").arg(control.metaObject()->className(), control.objectName());
}

} // namespace

QStringList barriers(const QWidget &window)
{
    QStringList found;
    QMultiMap<QChar, const QWidget *> keys;
    const QList<QWidget *> controls = window.findChildren<QWidget *>();
    for (QWidget *control : controls) {
        if (control->window() != &window || isPartOfAnother(*control)) {
            continue;
        }
        if ((control->focusPolicy() & Qt::TabFocus) != 0 && nameOf(*control, controls).isEmpty()) {
            found += describe(*control) + " has no name";
        }
        const QKeySequence key = QKeySequence::mnemonic(textOf(*control));
        if (!key.isEmpty() && !isHeldBack(*control)) {
            const QChar letter = key.toString().back();
            const QList<const QWidget *> others = keys.values(letter);
            for (const QWidget *other : others) {
                const QWidget *page = pageOf(*control);
                if (page == nullptr || pageOf(*other) == nullptr || page == pageOf(*other)) {
                    found += QString("%1 and %2 share the key %3")
                                 .arg(describe(*control), describe(*other), QString(letter));
                }
            }
            keys.insert(letter, control);
        }
    }
    return found;
}
