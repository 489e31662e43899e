// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "instrument/GeneratorControl.h"

#include <QWidget>

class GeneratorJob;
class QLabel;
class QPushButton;
class QToolButton;
class QtNumericEdit;
class VisaDevice;

/// The line below a pane that shows a generator: what it plays, and frequency, level and switch of
/// its RF output, which are set here. Hidden while the pane shows anything else. The instrument is
/// asked when the line appears, after each change, and when told to.
class GeneratorLine : public QWidget
{
    Q_OBJECT

public:
    explicit GeneratorLine(QWidget *parent = nullptr);

    /// Null, a closed device or an analyzer hides the line. The device isn't owned and must stay
    /// until the next call. It is asked as soon as events are handled.
    void showDevice(VisaDevice *device);

    /// Asks anew, if there is anything to ask and nothing else is going on.
    void refresh();

signals:
    /// A sentence on what came of a change.
    void said(const QString &text);

private:
    void change(const GeneratorChange &change, const QString &done);
    void stop();
    void run(GeneratorJob &job, const QString &done);
    void showState();
    [[nodiscard]] QString waveformText() const;

    VisaDevice *m_device = nullptr;
    GeneratorState m_state;
    bool m_isKnown = false;
    QLabel *m_waveform;
    QPushButton *m_stop;
    QtNumericEdit *m_frequency;
    QtNumericEdit *m_level;
    QPushButton *m_output;
    QToolButton *m_refresh;
};
