// SPDX-License-Identifier: Apache-2.0
#include "processorcores.h"

#include "log/Tracer.h"

#include <QFile>
#include <QString>

#include <algorithm>
#include <sched.h>
#include <set>
#include <unistd.h>
#include <utility>

namespace {

/// A number that the system tells about a processor; nothing is taken as 0.
int topologyNumber(int processor, const char *name)
{
    QFile file(QStringLiteral("/sys/devices/system/cpu/cpu%1/topology/%2")
                   .arg(processor)
                   .arg(QLatin1String(name)));
    return file.open(QIODevice::ReadOnly) ? file.readAll().trimmed().toInt() : -1;
}

} // namespace

int detectCores()
{
    cpu_set_t allowed;
    CPU_ZERO(&allowed);
    if (sched_getaffinity(0, sizeof allowed, &allowed) != 0) {
        return 1;
    }
    std::set<int> packages;
    std::set<std::pair<int, int>> cores;
    int logical = 0;
    for (int processor = 0; processor < CPU_SETSIZE; ++processor) {
        if (!CPU_ISSET(static_cast<std::size_t>(processor), &allowed)) {
            continue;
        }
        ++logical;
        const int package = topologyNumber(processor, "physical_package_id");
        const int core = topologyNumber(processor, "core_id");
        // Where the system doesn't tell, each processor is a core.
        packages.insert(package);
        cores.insert({package, core < 0 ? -1 - processor : core});
    }
    const auto inform = [](const QString &text) { Tracer::Trace(Tracer::Information, text); };
    if (logical < sysconf(_SC_NPROCESSORS_ONLN)) {
        inform(QStringLiteral("Not all logical processors are enabled."));
    }
    const int count = std::max(static_cast<int>(cores.size()), 1);
    const int packageCount = std::max(static_cast<int>(packages.size()), 1);
    const int perPackage = count / packageCount;
    inform(logical > count ? QStringLiteral("Hyper-Threading Technology: Enabled")
                           : QStringLiteral("Hyper-Threading Technology: Disabled"));
    inform(perPackage > 1 ? QStringLiteral("Multi-core: Yes (%1)").arg(perPackage)
                          : QStringLiteral("Multi-core: No"));
    inform(packageCount > 1 ? QStringLiteral("Multi-processor: yes (%1)").arg(packageCount)
                            : QStringLiteral("Multi-processor: No "));
    return count;
}
