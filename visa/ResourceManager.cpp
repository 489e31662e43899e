// SPDX-License-Identifier: Apache-2.0
#include "ResourceManager.h"

#include "FindExpression.h"
#include "HislipTransport.h"
#include "SocketTransport.h"
#include "UsbtmcDevices.h"
#include "UsbtmcTransport.h"
#include "Vxi11Transport.h"

namespace visa {

ResourceManager::ResourceManager(Configuration configuration)
    : m_configuration(std::move(configuration))
{
}

ViStatus ResourceManager::open(const ResourceName &name, ViUInt32 timeoutMs,
                               std::unique_ptr<Transport> &transport) const
{
    const Deadline deadline =
        Deadline::after(timeoutMs == 0 ? m_configuration.openTimeoutMs : timeoutMs);
    switch (name.kind) {
    case ResourceKind::Vxi11: {
        const Vxi11Address address{name.host, m_configuration.fixedPort(name), name.device,
                                   VI_INTF_TCPIP};
        return Vxi11Transport::open(address, deadline, transport);
    }
    case ResourceKind::Hislip:
        return HislipTransport::open({name.host, name.port, name.device}, deadline, transport);
    case ResourceKind::Socket:
        return SocketTransport::open(name.host, name.port, deadline, transport);
    case ResourceKind::Usb: {
        const std::string path = findUsbtmcPath(findUsbtmcDevices(), name);
        if (path.empty()) {
            return VI_ERROR_RSRC_NFOUND;
        }
        return UsbtmcTransport::open(path, std::make_unique<UsbtmcKernel>(), transport);
    }
    case ResourceKind::Gpib: {
        const auto entry = m_configuration.gateways.find(name.board);
        if (entry == m_configuration.gateways.end()) {
            return VI_ERROR_INTF_NUM_NCONFIG;
        }
        const Gateway &gateway = entry->second;
        std::string device = gateway.interface + "," + std::to_string(name.primary);
        if (name.secondary) {
            device.append(",").append(std::to_string(*name.secondary));
        }
        const Vxi11Address address{gateway.host, gateway.port, device, VI_INTF_GPIB};
        return Vxi11Transport::open(address, deadline, transport);
    }
    }
    return VI_ERROR_INV_RSRC_NAME;
}

ViStatus ResourceManager::find(const std::string &expression,
                               std::vector<std::string> &resources) const
{
    resources.clear();
    const auto pattern = FindExpression::parse(expression);
    if (!pattern) {
        return VI_ERROR_INV_EXPR;
    }
    const auto add = [&](const ResourceName &name) {
        std::string text = resourceText(name);
        // Callers hand in buffers of this size.
        if (text.size() < VI_FIND_BUFLEN && pattern->matches(text)) {
            resources.push_back(std::move(text));
        }
    };
    for (const auto &[board, gateway] : m_configuration.gateways) {
        ResourceName name;
        name.kind = ResourceKind::Gpib;
        name.board = board;
        for (const ViUInt16 address : gateway.addresses) {
            name.primary = address;
            add(name);
        }
    }
    for (const NetworkInstrument &instrument : m_configuration.instruments) {
        add(instrument.name);
    }
    for (const UsbtmcDevice &device : findUsbtmcDevices()) {
        add(device.name);
    }
    return resources.empty() ? VI_ERROR_RSRC_NFOUND : VI_SUCCESS;
}

FindList::FindList(std::vector<std::string> resources)
    : m_resources(std::move(resources))
{
}

ViStatus FindList::next(std::string &resource)
{
    const std::lock_guard lock(m_mutex);
    if (m_next == m_resources.size()) {
        return VI_ERROR_RSRC_NFOUND;
    }
    resource = m_resources[m_next++];
    return VI_SUCCESS;
}

} // namespace visa
