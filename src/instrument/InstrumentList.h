// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "InstrConfigEntry.h"

#include <QList>

class QSettings;
struct InstrumentSummary;

/// The instruments that the user has configured, in the order in which they came in. Places count
/// from 0; those out of range are ignored.
///
/// An instrument is known by its model, serial number and interface. A resource stands in the list
/// once: another instrument at the same address takes over the entry.
class InstrumentList
{
public:
    [[nodiscard]] const QList<InstrConfigEntry> &entries() const { return m_entries; }

    /// Place of the entry with this VISA resource, whose case doesn't matter; -1 if there is none.
    [[nodiscard]] qsizetype indexOf(const QString &resource) const;

    /// Takes in an instrument and returns its place. -1, with a line in the log, if it was there or
    /// has no resource.
    qsizetype add(const InstrConfigEntry &instrument);

    /// Notes which instrument has answered at the resource of an entry. False if it is the one that
    /// the entry names; otherwise the log tells of the new one.
    bool identify(qsizetype index, const InstrConfigEntry &found);

    /// False if nothing changes.
    bool setEnabled(qsizetype index, bool enabled);
    bool setComment(qsizetype index, const QString &comment);

    void setFolder(const QString &model, const QString &serial, const QString &folder);
    void remove(qsizetype index);
    void clear() { m_entries.clear(); }

    /// Both work on the current group of the settings.
    void read(const QSettings &settings);
    void write(QSettings &settings) const;

private:
    [[nodiscard]] bool holds(qsizetype index) const;

    QList<InstrConfigEntry> m_entries;
};

/// A new entry for an instrument that has answered; `origin` tells on which way it was found.
[[nodiscard]] InstrConfigEntry entryOf(const InstrumentSummary &summary, const QString &origin);

/// "TGX-870, 100001": how an instrument is called in lists and in the log.
[[nodiscard]] QString instrumentName(const QString &model, const QString &serial);

/// Whether an entry tells enough to be shown while its instrument is silent.
[[nodiscard]] bool isComplete(const InstrConfigEntry &entry);

/// Logs that an instrument is in the list already.
void reportKnownInstrument(const InstrConfigEntry &entry);
