// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "composer/Composition.h"

#include <QDialog>

class QLabel;
class QLineEdit;
class QRadioButton;
class QtNumericEdit;

/// The settings of the target. Works on a copy; what it has become is taken when accepted.
class DlgWvSettings : public QDialog
{
    Q_OBJECT

public:
    explicit DlgWvSettings(const Composition &composition, QWidget *parent = nullptr);

    [[nodiscard]] const ComposerTarget &target() const { return m_target; }

public slots:
    void accept() override;
    void slot_change_samples(double samples);
    void slot_change_playtime(double seconds);
    void slot_change_clockrate(double clockHz);

private:
    [[nodiscard]] QWidget *clockGroup();
    [[nodiscard]] QWidget *lengthGroup();
    [[nodiscard]] QWidget *fileGroup();
    void showTarget();
    void updateEnabled();
    void browse();

    ComposerTarget m_target;
    QRadioButton *rb_highest;
    QRadioButton *rb_fixed;
    QtNumericEdit *le_clockrate;
    QRadioButton *rb_longesttrack;
    QRadioButton *rb_longestsegment;
    QRadioButton *rb_user;
    QLabel *l_explanation;
    QRadioButton *rb_samples;
    QRadioButton *rb_playtime;
    QtNumericEdit *le_targetsamples;
    QtNumericEdit *le_playtime;
    QLineEdit *le_file;
};
