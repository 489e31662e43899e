// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "jobs/CreateRequest.h"

#include <map>

class QCheckBox;
class QComboBox;
class QFormLayout;
class QSettings;
class QString;
class QtNumericEdit;
class QWidget;

namespace Ui {
class DlgWvCreate;
}

/// The settings of signal creation as fields of a form: fills the pages of the wizard, one for each
/// kind of signal, and knows the values on them. The widgets belong to the form.
class CreateTypePages
{
public:
    explicit CreateTypePages(Ui::DlgWvCreate &form);

    [[nodiscard]] double value(const SignalField &field) const;

    /// The choices for a kind that are no numbers, but for its variant.
    [[nodiscard]] CreateChoices choices(CreateKind kind) const;

    /// The check box that switches the oversampling ratio on.
    [[nodiscard]] QCheckBox &oversamplingBox() const { return *m_oversampling; }

    void setEnabled(const SignalField &field, bool enabled) const;

    void writeSettings(QSettings &settings) const;
    void readSettings(const QSettings &settings) const;

private:
    void setUp(QtNumericEdit &edit, const SignalField &field);
    void add(QFormLayout *layout, const QString &label, const SignalField &field, const char *name);
    static QFormLayout *layoutOf(QWidget *page, const QString &title);
    static QComboBox *addRamp(QFormLayout *layout, const char *name);
    void fillPulsePages(const Ui::DlgWvCreate &form);
    void fillFunctionPage(const Ui::DlgWvCreate &form);
    void fillModulationPages(const Ui::DlgWvCreate &form);
    void fillOtherPages(const Ui::DlgWvCreate &form);

    std::map<const SignalField *, QtNumericEdit *> m_fields;
    QCheckBox *m_oversampling = nullptr;
    QCheckBox *m_randomPhase = nullptr;
    QComboBox *m_pulseRamp = nullptr;
    QComboBox *m_chirpRamp = nullptr;
};

/// Chooses the entry whose index is stored, the first one if there is none of that number.
void readChoice(const QSettings &settings, const QString &key, QComboBox &box);
