// SPDX-License-Identifier: Apache-2.0
#include "Simulator.h"

#include <protocols/hislip.h>
#include <vxi11.h>

namespace simulator {
namespace {

constexpr const char *GatewayAddress = "127.0.0.1";

std::string cannotOpen(const std::string &what, const std::string &address, std::uint16_t port,
                       const std::string &reason)
{
    return "cannot open the port of " + what + ", " + address + ":" + std::to_string(port) + ": " +
           reason;
}

} // namespace

Simulator::~Simulator()
{
    stop();
}

bool Simulator::start(const std::vector<InstrumentPlace> &places, std::string &error)
{
    for (const InstrumentPlace &place : places) {
        m_instruments.push_back(std::make_unique<Instrument>(place.instrument));
        Instrument &instrument = *m_instruments.back();
        if (!instrument.start(error)) {
            return false;
        }
        const bool added = place.gateway ? addToGateway(place, instrument, error)
                                         : addHost(place, instrument, error);
        if (!added) {
            return false;
        }
    }
    for (const auto &[port, gateway] : m_gateways) {
        gateway->start("gateway " + std::to_string(gateway->corePort()));
    }
    return true;
}

bool Simulator::addHost(const InstrumentPlace &place, Instrument &instrument, std::string &error)
{
    const std::string &address = place.address;
    Host &host = *m_hosts.emplace_back(std::make_unique<Host>());
    std::string reason;
    if (!instrument.faults().has("no-portmapper")) {
        if (!host.mapper.open(address, reason)) {
            error = cannotOpen("the RPC port mapper", address, PortMapper::Port, reason);
            return false;
        }
    }
    if (!instrument.faults().has("no-raw")) {
        if (!host.raw.open(address, reason)) {
            error = cannotOpen("plain SCPI", address, RawSocketServer::Port, reason);
            return false;
        }
    }
    if (place.hislip && !host.hislip.open(address, reason)) {
        error = cannotOpen("HiSLIP", address, protocols::hislip::Port, reason);
        return false;
    }
    if (place.announce && !openAnnouncer(place, host, error)) {
        return false;
    }
    if (!host.vxi11.open(address, 0, reason)) {
        error = cannotOpen("VXI-11", address, 0, reason);
        return false;
    }
    host.vxi11.addDevice("inst0", instrument);
    host.vxi11.start(address);
    if (!instrument.faults().has("no-portmapper")) {
        host.mapper.start({{DEVICE_CORE, DEVICE_CORE_VERSION, host.vxi11.corePort()},
                           {DEVICE_ASYNC, DEVICE_ASYNC_VERSION, host.vxi11.abortPort()}});
    }
    if (!instrument.faults().has("no-raw")) {
        host.raw.start(instrument, address + ":" + std::to_string(RawSocketServer::Port));
    }
    if (place.hislip) {
        host.hislip.start(instrument, address + ' ' + HislipServer::SubAddress);
    }
    if (place.announce) {
        host.announcer.start();
    }
    m_readyLines.push_back("ready " + address);
    return true;
}

bool Simulator::openAnnouncer(const InstrumentPlace &place, Host &host, std::string &error)
{
    const InstrumentSetup &setup = place.instrument;
    std::string reason;
    if (!setup.faults.has("no-portmapper") && !host.mapper.openForBroadcasts(reason)) {
        error = cannotOpen("VXI-11 broadcasts", "0.0.0.0", PortMapper::Port, reason);
        return false;
    }
    if (!host.announcer.open({.address = place.address,
                              .model = std::string(setup.model->name),
                              .serial = setup.serial,
                              .firmware = setup.firmware,
                              .hislip = place.hislip,
                              .raw = !setup.faults.has("no-raw")},
                             reason)) {
        error = cannotOpen("multicast DNS", place.address, Announcer::Port, reason);
        return false;
    }
    return true;
}

bool Simulator::addToGateway(const InstrumentPlace &place, Instrument &instrument,
                             std::string &error)
{
    std::unique_ptr<Vxi11Server> &gateway = m_gateways[*place.gateway];
    if (!gateway) {
        gateway = std::make_unique<Vxi11Server>();
        std::string reason;
        if (!gateway->open(GatewayAddress, *place.gateway, reason)) {
            error = cannotOpen("the gateway", GatewayAddress, *place.gateway, reason);
            return false;
        }
    }
    const std::string device = "gpib0," + std::to_string(place.gpib);
    gateway->addDevice(device, instrument);
    m_readyLines.push_back("ready " + std::string(GatewayAddress) + ':' +
                           std::to_string(gateway->corePort()) + ' ' + device);
    return true;
}

void Simulator::stop()
{
    for (const auto &instrument : m_instruments) {
        instrument->stop();
    }
    for (const auto &host : m_hosts) {
        host->mapper.stop();
        host->vxi11.stop();
        host->raw.stop();
        host->hislip.stop();
        host->announcer.stop();
    }
    for (const auto &[port, gateway] : m_gateways) {
        gateway->stop();
    }
    m_hosts.clear();
    m_gateways.clear();
    m_instruments.clear();
}

} // namespace simulator
