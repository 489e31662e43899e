// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <QString>

class QWidget;
class VisaDevice;
struct CopyRequest;

// What the panes do with an instrument behind a modal progress dialog over `parent`.

struct CopyOutcome
{
    qsizetype files = 0; ///< that were copied
    bool isComplete = true;
    QString words; ///< a sentence for the user
};

/// Copies what the request says, with the questions of CopyJob as boxes. What fails is logged.
[[nodiscard]] CopyOutcome copyEntry(QWidget *parent, const CopyRequest &request);

/// Whether "Run!" applies: a waveform file on an instrument; null stands for the local disk.
[[nodiscard]] bool isRunnable(const QString &path, const VisaDevice *device);

/// Selects a waveform on its instrument, waits until it is loaded, and switches it on. What fails
/// is logged. Gives a sentence on the outcome.
[[nodiscard]] QString runWaveform(QWidget *parent, VisaDevice &device, const QString &path);
