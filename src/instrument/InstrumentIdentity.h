// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "instrumentmodels.h"

#include <QString>
#include <QStringList>

#include <optional>

/// Which instrument it is and what it can do, as it has told itself. A value: it holds after the
/// session has ended.
struct InstrumentIdentity
{
    QString resource; ///< VISA resource string
    QString idn;      ///< answer to "*IDN?"
    QString options;  ///< answer to "*OPT?"
    QString vendor;
    QString model;
    QString serial;
    QString firmware;
    int modelIndex = NoModel; ///< row of the table of models

    /// Fills the fields after `options` from the answers. False, with the reason logged, for an
    /// instrument of another maker or an unknown model.
    [[nodiscard]] bool identify();

    /// "TCPIP", "GPIB0" and so on.
    [[nodiscard]] QString interfaceName() const;
    [[nodiscard]] bool isUnixFileSystem() const;
    [[nodiscard]] QChar pathSeparator() const { return isUnixFileSystem() ? '/' : '\\'; }
    [[nodiscard]] bool hasBasebandCoder() const;
    [[nodiscard]] bool isAnalyzer() const;
    [[nodiscard]] QStringList rootDirectories() const { return rootsOf(modelIndex, options); }

    /// Of RF path or baseband 1 or 2. Nothing if there is none; logged if there are no options.
    [[nodiscard]] std::optional<FrequencyRange> rfRange(int path) const;
    [[nodiscard]] std::optional<BasebandLimits> baseband(int index) const;
};
