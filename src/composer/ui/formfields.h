// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "display/QtNumericEdit.h"

#include <QAbstractButton>
#include <QComboBox>
#include <QDialogButtonBox>
#include <QFormLayout>
#include <QLineEdit>
#include <QPushButton>

/// What the Composer's forms are put together of.

/// How a numeric field is set up; the step isn't used when it is 0.
struct FieldSettings
{
    const char *objectName;
    const char *name; ///< the description, first line of the tool tip
    const char *unit = "";
    double min = 0;
    double max = 0;
    double step = 1;
    int precision = 6;
    bool scaled = false;
};

[[nodiscard]] inline QtNumericEdit *makeField(const FieldSettings &settings, QWidget *parent)
{
    auto *field = new QtNumericEdit(parent);
    field->setObjectName(QLatin1String(settings.objectName));
    field->setName(QString::fromLatin1(settings.name));
    field->setUnit(QString::fromLatin1(settings.unit));
    field->setScaled(settings.scaled);
    field->setLowerPrefix(settings.scaled);
    field->setPrecision(settings.precision);
    field->setMax(settings.max);
    field->setMin(settings.min);
    field->setStep(settings.step);
    return field;
}

template <typename Widget>
[[nodiscard]] Widget *named(const char *objectName, Widget *widget)
{
    widget->setObjectName(QLatin1String(objectName));
    return widget;
}

/// OK and Cancel, wired. Leaving a field by them takes what was typed.
[[nodiscard]] inline QDialogButtonBox *makeButtons(QDialog *dialog)
{
    auto *buttons = new QDialogButtonBox(QDialogButtonBox::Ok | QDialogButtonBox::Cancel, dialog);
    QObject::connect(buttons, &QDialogButtonBox::accepted, dialog, &QDialog::accept);
    QObject::connect(buttons, &QDialogButtonBox::rejected, dialog, &QDialog::reject);
    return buttons;
}

/// Takes what is being typed in any field of a form, as leaving the field does.
inline void takeTypedValues(const QWidget &form)
{
    const QList<QtNumericEdit *> fields = form.findChildren<QtNumericEdit *>();
    for (QtNumericEdit *field : fields) {
        if (field->property("edit_mode").toBool()) {
            field->editingFinished();
        }
    }
}
