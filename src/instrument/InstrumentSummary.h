// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "instrumentmodels.h"

#include <QList>
#include <QPair>
#include <QString>
#include <QStringList>

#include <array>
#include <optional>

class VisaDevice;

/// What there is to tell of an instrument, for the list of instruments and the command line.
struct InstrumentSummary
{
    QString vendor;
    QString model;
    QString serial;
    QString firmware;
    QString options;
    QString interfaceName;
    QString resource;
    bool analyzer = false;
    QStringList roots;
    std::array<std::optional<FrequencyRange>, 2> rf;
    std::array<std::optional<BasebandLimits>, 2> baseband;
};

/// Of a device that was opened at least once. An instrument without options has no capabilities.
[[nodiscard]] InstrumentSummary summaryOf(const VisaDevice &device);

/// Label and value of each row below the instrument in the list; what it hasn't is left out.
[[nodiscard]] QList<QPair<QString, QString>> summaryRows(const InstrumentSummary &summary);
