// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "ResourceName.h"

#include <string>
#include <vector>

namespace visa {

/// An interface that the kernel's usbtmc driver serves.
struct UsbtmcDevice
{
    ResourceName name;      ///< with its interface number only if the device has several
    ViUInt16 interface = 0; ///< bInterfaceNumber
    std::string path;       ///< "/dev/usbtmc0"
};

/// All such interfaces, in the order of their device numbers. `root` stands before "/sys" and
/// "/dev". A device without serial number is left out, because no resource string names it.
[[nodiscard]] std::vector<UsbtmcDevice> findUsbtmcDevices(const std::string &root = "");

/// The path of the device that a resource string names, empty if it is not there.
[[nodiscard]] std::string findUsbtmcPath(const std::vector<UsbtmcDevice> &devices,
                                         const ResourceName &name);

} // namespace visa
