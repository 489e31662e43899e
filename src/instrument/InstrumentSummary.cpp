// SPDX-License-Identifier: Apache-2.0
#include "InstrumentSummary.h"

#include "InstrumentIdentity.h"
#include "VisaDevice.h"

InstrumentSummary summaryOf(const VisaDevice &device)
{
    InstrumentSummary summary{.vendor = device.vendor(),
                              .model = device.model(),
                              .serial = device.serial(),
                              .firmware = device.firmware(),
                              .options = device.options(),
                              .interfaceName = device.interfaceName(),
                              .resource = device.resource(),
                              .analyzer = device.isAnalyzer(),
                              .roots = device.rootDirectories(),
                              .rf = {},
                              .baseband = {}};
    if (summary.options.isEmpty()) {
        return summary;
    }
    const InstrumentIdentity &identity = device.identity();
    for (int number = 1; number <= 2; ++number) {
        const auto place = static_cast<size_t>(number - 1);
        summary.rf[place] = identity.rfRange(number);
        summary.baseband[place] = identity.baseband(number);
    }
    return summary;
}

QList<QPair<QString, QString>> summaryRows(const InstrumentSummary &summary)
{
    constexpr int SamplesPerMega = 1024 * 1024;
    QList<QPair<QString, QString>> rows{{"VISA resource", summary.resource},
                                        {"Firmware", summary.firmware},
                                        {"User data", summary.roots.join(", ")}};
    for (size_t i = 0; i < summary.rf.size(); ++i) {
        if (const auto &range = summary.rf[i]) {
            rows.append({QString("RF %1").arg(i + 1),
                         QString::asprintf("%4.1f kHz - %3.1f GHz", range->lower / 1000,
                                           range->upper / 1e9)});
        }
    }
    for (size_t i = 0; i < summary.baseband.size(); ++i) {
        if (const auto &limits = summary.baseband[i]) {
            const QString name = QString("BB%1 ").arg(i + 1);
            rows.append({name + "size", QString("%1 MS").arg(limits->size / SamplesPerMega)});
            rows.append({name + "max. clock", QString("%1 MHz").arg(limits->clock / 1e6)});
            rows.append({name + "bandwidth", QString("%1 MHz").arg(limits->bandwidth / 1e6)});
        }
    }
    return rows;
}
