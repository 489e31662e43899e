// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <QString>

class QLineEdit;
class QtNumericEdit;
class QWidget;

/// What the tools' pages share.

/// Asks for a waveform file to read and puts its name into the field; false if the user cancels.
[[nodiscard]] bool chooseSourceFile(QWidget *parent, QLineEdit &field);

/// The title of these questions unless a tool writes several files.
[[nodiscard]] QString waveformTitle();

/// Asks for a waveform file to write and puts its name into the field. Overwriting is asked about
/// later, when the file is written.
void chooseTargetFile(QWidget *parent, QLineEdit &field, const QString &title = waveformTitle());

/// "/data/noise.wv" with "_resample" becomes "/data/noise_resample.wv".
[[nodiscard]] QString fileNameWithSuffix(const QString &fileName, const QString &suffix);

/// Lets a field for whole numbers round what is typed, so that it shows what is used.
void roundInput(QtNumericEdit &edit);
