// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "InstrumentJob.h"

#include "instrument/InstrConfigEntry.h"
#include "instrument/InstrumentSummary.h"

#include <QList>

#include <optional>

/// Looks for all instruments of an interface. A cancel ends it after the present one; what was
/// found by then stays.
class ScanJob final : public ToolJob
{
    Q_OBJECT

public:
    /// `kind` is a VisaDevice::ScanKind.
    explicit ScanJob(int kind, bool noVisa = false, QObject *parent = nullptr);

    [[nodiscard]] const QList<InstrumentSummary> &found() const { return m_found; }

protected:
    [[nodiscard]] bool work() override;

private:
    int m_kind;
    bool m_noVisa;
    QList<InstrumentSummary> m_found;
};

/// Asks one instrument what it is.
class IdentifyJob final : public InstrumentJob
{
    Q_OBJECT

public:
    explicit IdentifyJob(InstrumentRef instrument, QObject *parent = nullptr);

    [[nodiscard]] const InstrumentSummary &summary() const { return m_summary; }

protected:
    [[nodiscard]] bool talk(VisaDevice &device) override;

private:
    InstrumentSummary m_summary;
};

/// Asks the instruments of a list, one after the other, which of them answer. After a cancel those
/// behind it are not asked.
class LookJob final : public ToolJob
{
    Q_OBJECT

public:
    /// What is known of one instrument.
    struct State
    {
        bool isBusy = false;                      ///< another device has it open; not asked
        std::optional<InstrumentSummary> summary; ///< if it has answered
    };

    LookJob(QList<InstrConfigEntry> entries, bool noVisa, QObject *parent = nullptr);

    /// One for each entry.
    [[nodiscard]] const QList<State> &states() const { return m_states; }

protected:
    [[nodiscard]] bool work() override;

private:
    QList<InstrConfigEntry> m_entries;
    bool m_noVisa;
    QList<State> m_states;
};
