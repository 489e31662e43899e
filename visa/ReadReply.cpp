// SPDX-License-Identifier: Apache-2.0
#include "ReadReply.h"

namespace visa {

bool_t decodeReadReply(XDR *stream, ReadReply *reply)
{
    if (stream->x_op == XDR_FREE) {
        return TRUE;
    }
    if (!xdr_int(stream, &reply->error) || !xdr_int(stream, &reply->reason) ||
        !xdr_u_int(stream, &reply->size)) {
        return FALSE;
    }
    return reply->size > reply->target.size() ||
           xdr_opaque(stream, reinterpret_cast<char *>(reply->target.data()), reply->size);
}

} // namespace visa
