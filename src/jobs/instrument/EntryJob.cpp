// SPDX-License-Identifier: Apache-2.0
#include "EntryJob.h"

#include "instrument/VisaDevice.h"
#include "instrument/remotepaths.h"

#include <utility>

namespace {

QString labelOf(EntryJob::Operation operation)
{
    switch (operation) {
    case EntryJob::Operation::MakeFolder:
        return "Creating folder...";
    case EntryJob::Operation::Rename:
        return "Renaming...";
    case EntryJob::Operation::RemoveFile:
        return "Deleting...";
    case EntryJob::Operation::RemoveFolder:
        break;
    }
    return "Deleting folder...";
}

RemotePath partsOn(const VisaDevice &device, const QString &path)
{
    return splitPath(nativePath(withoutEndSlash(path), device.pathSeparator()));
}

} // namespace

EntryJob::EntryJob(InstrumentRef instrument, Operation operation, QString path, QString newName,
                   QObject *parent)
    : InstrumentJob(std::move(instrument), labelOf(operation), parent)
    , m_operation(operation)
    , m_path(std::move(path))
    , m_newName(std::move(newName))
{
}

bool EntryJob::talk(VisaDevice &device)
{
    const RemotePath parts = partsOn(device, m_path);
    switch (m_operation) {
    case Operation::MakeFolder:
        return checked(device, device.makeDirectory(parts.directory, parts.fileName));
    case Operation::Rename:
        return checked(device, device.renameEntry(parts.directory, parts.fileName, m_newName));
    case Operation::RemoveFile:
        return checked(device, device.deleteRemoteFile(parts.directory + parts.fileName, false));
    case Operation::RemoveFolder:
        break;
    }
    return checked(device, device.removeDirectory(parts.directory, parts.fileName));
}

RemoveTreeJob::RemoveTreeJob(InstrumentRef instrument, QString path, QObject *parent)
    : InstrumentJob(std::move(instrument), "Deleting Files...", parent)
    , m_path(std::move(path))
{
}

bool RemoveTreeJob::talk(VisaDevice &device)
{
    const RemotePath parts = partsOn(device, m_path);
    return checked(device, device.removeTree(parts.directory, parts.fileName));
}
