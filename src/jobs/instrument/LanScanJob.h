// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "instrument/InstrumentSummary.h"
#include "jobs/ToolJob.h"

#include <QList>
#include <QStringList>

/// An instrument that was found on a network.
struct LanInstrument
{
    InstrumentSummary summary; ///< by the first resource that could be opened
    QStringList found;         ///< how it was found: "vxi11", "mdns"
    QStringList resources;     ///< all under which it was found
};

/// Looks for instruments on all networks of this machine, and asks those that answer what they are.
/// One that answers at several addresses stands once. A cancel ends it; what was found by then
/// stays.
class LanScanJob final : public ToolJob
{
    Q_OBJECT

public:
    static constexpr double MinSeconds = 0.1;
    static constexpr double MaxSeconds = 60;
    static constexpr double DefaultSeconds = 2;

    /// `seconds` is the time to listen.
    explicit LanScanJob(double seconds = DefaultSeconds, bool noVisa = false,
                        QObject *parent = nullptr);

    [[nodiscard]] const QList<LanInstrument> &found() const { return m_found; }

    /// Adds an instrument, or what is new to one of the same model and serial number.
    void add(const LanInstrument &instrument);

protected:
    [[nodiscard]] bool work() override;

private:
    double m_seconds;
    bool m_noVisa;
    QList<LanInstrument> m_found;
};
