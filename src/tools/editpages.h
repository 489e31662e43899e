// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <QWidget>

class QtNumericEdit;

/// The pages and the button row that wizards have alike. Their fields bear the names by which
/// ToolWizard and EditWizard find them.

/// The fields of the waveform that a tool writes: names, units and limits.
void setUpTarget(QtNumericEdit &clock, QtNumericEdit &samples);

class SourcePage : public QWidget
{
    Q_OBJECT

public:
    explicit SourcePage(QWidget *parent = nullptr);
};

class OutputPage : public QWidget
{
    Q_OBJECT

public:
    explicit OutputPage(QWidget *parent = nullptr);

    /// The clock rate of the file to be written, "le_clockrate", 1 kHz to 600 MHz.
    [[nodiscard]] QtNumericEdit &clockRate() const;
};

class StatusPage : public QWidget
{
    Q_OBJECT

public:
    explicit StatusPage(QWidget *parent = nullptr);
};

class WizardButtons : public QWidget
{
    Q_OBJECT

public:
    explicit WizardButtons(QWidget *parent = nullptr);
};
