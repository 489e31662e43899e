// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "jobs/SampleReadJob.h"

class QWidget;

/// Asks for the name of a file for other programs, `initial` being proposed; empty if the user
/// cancels. A name without a suffix gets that of the chosen type.
[[nodiscard]] QString askExportName(QWidget *parent, const QString &initial);

/// Asks for a file and saves a piece of a waveform there, as a waveform or, by the suffix of the
/// name, for other programs; then shows the report.
void saveSelection(QWidget *parent, const SampleRange &piece);
