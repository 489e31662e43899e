// SPDX-License-Identifier: Apache-2.0
#include "InstrumentList.h"

#include "InstrumentSummary.h"

#include "remotepaths.h"

#include "log/Tracer.h"

#include <QSettings>
#include <QStringList>
#include <QVariant>

#include <algorithm>

namespace {

QString key(const char *name, qsizetype index)
{
    return name + QString::number(index);
}

/// A text with commas that was written into the file by hand arrives as a list.
QString text(const QSettings &settings, const char *name, qsizetype index)
{
    return settings.value(key(name, index)).toStringList().join(", ");
}

bool isSameInstrument(const InstrConfigEntry &one, const InstrConfigEntry &other)
{
    return one.model == other.model && one.serial == other.serial &&
           plainResource(one.interface) == plainResource(other.interface);
}

} // namespace

qsizetype InstrumentList::indexOf(const QString &resource) const
{
    const auto found =
        std::find_if(m_entries.begin(), m_entries.end(), [&](const InstrConfigEntry &entry) {
            return plainResource(entry.resource) == plainResource(resource);
        });
    return found == m_entries.end() ? -1 : found - m_entries.begin();
}

qsizetype InstrumentList::add(const InstrConfigEntry &instrument)
{
    const bool isKnown =
        std::any_of(m_entries.begin(), m_entries.end(), [&](const InstrConfigEntry &entry) {
            return isSameInstrument(entry, instrument);
        });
    if (isKnown) {
        reportKnownInstrument(instrument);
        return -1;
    }
    if (instrument.resource.isEmpty()) {
        Tracer::Trace(Tracer::Error,
                      QString("The instrument '%1' has no resource and was not added.")
                          .arg(instrumentName(instrument.model, instrument.serial)));
        return -1;
    }
    const qsizetype present = indexOf(instrument.resource);
    if (present >= 0) {
        identify(present, instrument);
        return present;
    }
    m_entries.append(instrument);
    return m_entries.size() - 1;
}

bool InstrumentList::identify(qsizetype index, const InstrConfigEntry &found)
{
    if (!holds(index) || isSameInstrument(m_entries.at(index), found)) {
        return false;
    }
    InstrConfigEntry &entry = m_entries[index];
    entry.model = found.model;
    entry.serial = found.serial;
    entry.interface = found.interface;
    Tracer::Trace(Tracer::Warning,
                  QString("At '%1' there is now the instrument '%2'.")
                      .arg(entry.resource, instrumentName(entry.model, entry.serial)));
    return true;
}

bool InstrumentList::setEnabled(qsizetype index, bool enabled)
{
    if (!holds(index) || m_entries.at(index).enabled == enabled) {
        return false;
    }
    m_entries[index].enabled = enabled;
    return true;
}

bool InstrumentList::setComment(qsizetype index, const QString &comment)
{
    if (!holds(index) || m_entries.at(index).comment == comment) {
        return false;
    }
    m_entries[index].comment = comment;
    return true;
}

void InstrumentList::setFolder(const QString &model, const QString &serial, const QString &folder)
{
    for (InstrConfigEntry &entry : m_entries) {
        if (entry.model == model && entry.serial == serial) {
            entry.folder = folder;
        }
    }
}

void InstrumentList::remove(qsizetype index)
{
    if (holds(index)) {
        m_entries.removeAt(index);
    }
}

void InstrumentList::read(const QSettings &settings)
{
    m_entries.clear();
    for (qsizetype i = 0;; ++i) {
        const QString resource = text(settings, "instr", i);
        if (resource.isEmpty()) {
            return;
        }
        m_entries.append({.enabled = settings.value(key("en", i), true).toBool(),
                          .model = text(settings, "model", i),
                          .serial = text(settings, "serial", i),
                          .resource = resource,
                          .interface = text(settings, "intf", i),
                          .comment = text(settings, "comment", i),
                          .folder = text(settings, "folder", i)});
    }
}

void InstrumentList::write(QSettings &settings) const
{
    for (qsizetype i = 0; i < m_entries.size(); ++i) {
        const InstrConfigEntry &entry = m_entries.at(i);
        settings.setValue(key("instr", i), entry.resource);
        settings.setValue(key("en", i), entry.enabled);
        settings.setValue(key("model", i), entry.model);
        settings.setValue(key("serial", i), entry.serial);
        settings.setValue(key("intf", i), entry.interface);
        settings.setValue(key("folder", i), entry.folder);
        settings.setValue(key("comment", i), entry.comment);
    }
    // Of a longer list from before nothing stays behind the mark of the end.
    for (qsizetype i = m_entries.size(); settings.contains(key("instr", i)); ++i) {
        for (const char *name : {"instr", "en", "model", "serial", "intf", "folder", "comment"}) {
            settings.remove(key(name, i));
        }
    }
    settings.setValue(key("instr", m_entries.size()), QString());
}

bool InstrumentList::holds(qsizetype index) const
{
    return index >= 0 && index < m_entries.size();
}

InstrConfigEntry entryOf(const InstrumentSummary &summary, const QString &origin)
{
    return {.enabled = true,
            .model = summary.model,
            .serial = summary.serial,
            .resource = summary.resource,
            .interface = summary.interfaceName,
            .comment = {},
            .folder = origin};
}

QString instrumentName(const QString &model, const QString &serial)
{
    return model + ", " + serial;
}

bool isComplete(const InstrConfigEntry &entry)
{
    return !entry.model.isEmpty() && !entry.serial.isEmpty() && !entry.resource.isEmpty() &&
           !entry.interface.isEmpty();
}

void reportKnownInstrument(const InstrConfigEntry &entry)
{
    Tracer::Trace(Tracer::Information, QString("The instrument '%1' was already added.")
                                           .arg(instrumentName(entry.model, entry.serial)));
}
