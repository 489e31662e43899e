// SPDX-License-Identifier: Apache-2.0
#include "portmapper.h"

#include "RpcConnection.h"

#include <netinet/in.h>
#include <rpc/pmap_prot.h>

namespace visa {

ViStatus findRpcPort(const std::vector<HostAddress> &addresses, std::uint32_t program,
                     std::uint32_t version, const Waker &waker, const Deadline &deadline,
                     std::uint16_t &port)
{
    RpcConnection connection(waker);
    ViStatus status = connection.connect(addresses, PMAPPORT, deadline);
    if (status != VI_SUCCESS) {
        return status;
    }
    const RpcProcedure getPort{PMAPPROG, PMAPVERS, PMAPPROC_GETPORT};
    pmap wanted{};
    wanted.pm_prog = program;
    wanted.pm_vers = version;
    wanted.pm_prot = IPPROTO_TCP;
    protocols::XdrValue<unsigned> found(xdr_u_int);
    status = connection.call<pmap, unsigned>(getPort, xdr_pmap, wanted, 0, found, deadline);
    if (status == VI_ERROR_NSUP_OPER) {
        return VI_ERROR_RSRC_NFOUND;
    }
    if (status != VI_SUCCESS) {
        return status;
    }
    if (*found == 0) {
        return VI_ERROR_RSRC_NFOUND;
    }
    if (*found > 0xFFFF) {
        return VI_ERROR_IO;
    }
    port = static_cast<std::uint16_t>(*found);
    return VI_SUCCESS;
}

} // namespace visa
