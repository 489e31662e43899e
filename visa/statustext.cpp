// SPDX-License-Identifier: Apache-2.0
#include "statustext.h"

namespace visa {

std::string statusText(ViStatus status)
{
    switch (status) {
    case VI_SUCCESS:
        return "The operation was completed.";
    case VI_SUCCESS_TERM_CHAR:
        return "The termination character ended the read.";
    case VI_SUCCESS_MAX_CNT:
        return "The read ended at the requested number of bytes; more may follow.";
    case VI_WARN_UNKNOWN_STATUS:
        return "The status code is unknown.";
    case VI_ERROR_SYSTEM_ERROR:
        return "An unknown system error occurred.";
    case VI_ERROR_INV_OBJECT:
        return "The session is not valid or was closed.";
    case VI_ERROR_RSRC_LOCKED:
        return "Someone else has locked the instrument.";
    case VI_ERROR_INV_EXPR:
        return "The search expression is not valid.";
    case VI_ERROR_RSRC_NFOUND:
        return "The resource is not present in the system or not reachable.";
    case VI_ERROR_INV_RSRC_NAME:
        return "The resource string is not valid.";
    case VI_ERROR_INV_ACC_MODE:
        return "The access mode is not valid.";
    case VI_ERROR_TMO:
        return "The time-out expired before the operation was completed.";
    case VI_ERROR_NSUP_ATTR:
        return "The attribute is not supported by this resource.";
    case VI_ERROR_NSUP_ATTR_STATE:
        return "The attribute does not take this value.";
    case VI_ERROR_ATTR_READONLY:
        return "The attribute can only be read.";
    case VI_ERROR_ABORT:
        return "The operation was aborted.";
    case VI_ERROR_INV_SETUP:
        return "The configuration of the VISA library is not valid.";
    case VI_ERROR_ALLOC:
        return "There is not enough memory or another resource is used up.";
    case VI_ERROR_INV_MASK:
        return "The mask names no buffer.";
    case VI_ERROR_IO:
        return "The transfer failed or the instrument broke the protocol.";
    case VI_ERROR_INV_FMT:
        return "The format holds a conversion that cannot be used here.";
    case VI_ERROR_NSUP_OPER:
        return "The operation is not supported by this resource.";
    case VI_ERROR_USER_BUF:
        return "A buffer or result pointer is null.";
    case VI_ERROR_RSRC_BUSY:
        return "The resource is in use.";
    case VI_ERROR_INV_PARAMETER:
        return "The instrument refused a parameter.";
    case VI_ERROR_INV_MODE:
        return "The mode is not valid.";
    case VI_ERROR_INTF_NUM_NCONFIG:
        return "The configuration names no gateway for this GPIB board.";
    case VI_ERROR_CONN_LOST:
        return "The connection to the instrument was lost.";
    case VI_ERROR_NPERMISSION:
        return "The user may not access the device.";
    default:
        return {};
    }
}

} // namespace visa
