// SPDX-License-Identifier: Apache-2.0
#include "ListJob.h"

#include "instrument/VisaDevice.h"
#include "instrument/remotepaths.h"

#include <utility>

ListJob::ListJob(InstrumentRef instrument, QString path, bool recursive, QObject *parent)
    : InstrumentJob(std::move(instrument), "Reading...", parent)
    , m_path(std::move(path))
    , m_recursive(recursive)
{
}

bool ListJob::talk(VisaDevice &device)
{
    const QString path = nativePath(m_path, device.pathSeparator());
    return m_recursive ? device.listTreeEntries(m_entries, withoutEndSlash(path))
                       : device.listDirectory(m_entries, path);
}
