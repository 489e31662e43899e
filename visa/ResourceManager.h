// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "Configuration.h"
#include "ObjectTable.h"
#include "Transport.h"

#include <memory>
#include <string>
#include <vector>

namespace visa {

/// Opens and finds resources by one reading of the configuration file. Any thread.
class ResourceManager : public Object
{
public:
    explicit ResourceManager(Configuration configuration);

    /// Connects to the instrument of this name. `timeoutMs` 0 takes the configured one.
    [[nodiscard]] ViStatus open(const ResourceName &name, ViUInt32 timeoutMs,
                                std::unique_ptr<Transport> &transport) const;

    /// The resource strings that match an expression of viFindRsrc, of what is configured (GPIB,
    /// then TCPIP) and of what the kernel found (USB). VI_ERROR_INV_EXPR or VI_ERROR_RSRC_NFOUND if
    /// there is none.
    [[nodiscard]] ViStatus find(const std::string &expression,
                                std::vector<std::string> &resources) const;

private:
    const Configuration m_configuration;
};

/// The resources of a viFindRsrc that viFindNext has still to hand out.
class FindList : public Object
{
public:
    explicit FindList(std::vector<std::string> resources);

    /// Any thread. VI_ERROR_RSRC_NFOUND behind the last.
    [[nodiscard]] ViStatus next(std::string &resource);

private:
    std::mutex m_mutex;
    std::vector<std::string> m_resources;
    std::size_t m_next = 0;
};

} // namespace visa
