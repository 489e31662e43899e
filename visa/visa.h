/* SPDX-License-Identifier: Apache-2.0 */
#pragma once

/*
 * Types, functions, status codes and attributes of the VISA library interface, as published by the
 * IVI Foundation in VPP-4.3 (The VISA Library) and VPP-4.3.2 (textual languages): the part that
 * libcorvane_visa.so offers. Plain C, so that any language can bind to it.
 *
 * Conventions: a status of 0 is success, a positive one success with a remark, a negative one
 * failure. Times are ms. A session may be used from any thread; calls on one session take turns,
 * calls on different sessions run side by side. Each call ends within the session's time-out (and
 * some tenths of a second for the way over a network).
 */

#include <stdint.h> /* NOLINT(modernize-deprecated-headers): a C header */

typedef uint8_t ViUInt8;
typedef uint16_t ViUInt16;
typedef uint32_t ViUInt32;
typedef uint64_t ViUInt64;
typedef int32_t ViInt32;
typedef char ViChar;
typedef unsigned char ViByte;
typedef uint16_t ViBoolean;

typedef ViUInt32 ViObject;
typedef ViObject ViSession;
typedef ViObject ViFindList;
typedef ViInt32 ViStatus;
typedef ViUInt32 ViAttr;
typedef ViUInt32 ViAccessMode;
/* As wide as a machine word; no attribute offered here needs more than 32 bits of it. */
typedef ViUInt64 ViAttrState;

#define VI_NULL 0
#define VI_TRUE 1
#define VI_FALSE 0
#define VI_NO_LOCK 0u

/* Size of the text buffers that viStatusDesc, viFindRsrc, viFindNext and viGetAttribute fill. */
#define VI_FIND_BUFLEN 256

#define VI_TMO_IMMEDIATE 0u
#define VI_TMO_INFINITE 0xFFFFFFFFu

/* VI_ATTR_INTF_TYPE */
#define VI_INTF_GPIB 1
#define VI_INTF_TCPIP 6
#define VI_INTF_USB 7

/* Masks of viSetBuf. */
#define VI_READ_BUF 1
#define VI_WRITE_BUF 2
#define VI_IO_IN_BUF 16
#define VI_IO_OUT_BUF 32

/* VI_ATTR_RD_BUF_OPER_MODE, VI_ATTR_WR_BUF_OPER_MODE */
#define VI_FLUSH_ON_ACCESS 1
#define VI_FLUSH_WHEN_FULL 2
#define VI_FLUSH_DISABLE 3

/* Modes of viGpibControlREN. */
#define VI_GPIB_REN_DEASSERT 0
#define VI_GPIB_REN_ASSERT 1
#define VI_GPIB_REN_DEASSERT_GTL 2
#define VI_GPIB_REN_ASSERT_ADDRESS 3
#define VI_GPIB_REN_ASSERT_LLO 4
#define VI_GPIB_REN_ASSERT_ADDRESS_LLO 5
#define VI_GPIB_REN_ADDRESS_GTL 6

/* Attributes: type behind each; R read only, RW also settable. */
#define VI_ATTR_RSRC_CLASS 0xBFFF0001u        /* R text: "INSTR" or "SOCKET" */
#define VI_ATTR_RSRC_NAME 0xBFFF0002u         /* R text */
#define VI_ATTR_SEND_END_EN 0x3FFF0016u       /* RW ViBoolean, VI_TRUE at start */
#define VI_ATTR_TERMCHAR 0x3FFF0018u          /* RW ViUInt8, 0x0A at start */
#define VI_ATTR_TMO_VALUE 0x3FFF001Au         /* RW ViUInt32, 2000 ms at start */
#define VI_ATTR_RD_BUF_OPER_MODE 0x3FFF002Au  /* RW ViUInt16, VI_FLUSH_DISABLE at start */
#define VI_ATTR_RD_BUF_SIZE 0x3FFF002Bu       /* R ViUInt32 */
#define VI_ATTR_WR_BUF_OPER_MODE 0x3FFF002Du  /* RW ViUInt16, VI_FLUSH_WHEN_FULL at start */
#define VI_ATTR_WR_BUF_SIZE 0x3FFF002Eu       /* R ViUInt32 */
#define VI_ATTR_SUPPRESS_END_EN 0x3FFF0036u   /* RW ViBoolean, VI_FALSE at start */
#define VI_ATTR_TERMCHAR_EN 0x3FFF0038u       /* RW ViBoolean, VI_FALSE at start */
#define VI_ATTR_INTF_TYPE 0x3FFF0171u         /* R ViUInt16 */
#define VI_ATTR_GPIB_PRIMARY_ADDR 0x3FFF0172u /* R ViUInt16, GPIB only */
#define VI_ATTR_INTF_NUM 0x3FFF0176u          /* R ViUInt16 */
#define VI_ATTR_TCPIP_PORT 0x3FFF0197u        /* R ViUInt16, SOCKET only */

/* Status codes. The casts make the published 32-bit patterns negative numbers. */
#define VI_SUCCESS 0
#define VI_SUCCESS_TERM_CHAR ((ViStatus)0x3FFF0005)
#define VI_SUCCESS_MAX_CNT ((ViStatus)0x3FFF0006)
#define VI_WARN_UNKNOWN_STATUS ((ViStatus)0x3FFF0085)
#define VI_ERROR_SYSTEM_ERROR ((ViStatus)0xBFFF0000u)
#define VI_ERROR_INV_OBJECT ((ViStatus)0xBFFF000Eu)
#define VI_ERROR_RSRC_LOCKED ((ViStatus)0xBFFF000Fu)
#define VI_ERROR_INV_EXPR ((ViStatus)0xBFFF0010u)
#define VI_ERROR_RSRC_NFOUND ((ViStatus)0xBFFF0011u)
#define VI_ERROR_INV_RSRC_NAME ((ViStatus)0xBFFF0012u)
#define VI_ERROR_INV_ACC_MODE ((ViStatus)0xBFFF0013u)
#define VI_ERROR_TMO ((ViStatus)0xBFFF0015u)
#define VI_ERROR_NSUP_ATTR ((ViStatus)0xBFFF001Du)
#define VI_ERROR_NSUP_ATTR_STATE ((ViStatus)0xBFFF001Eu)
#define VI_ERROR_ATTR_READONLY ((ViStatus)0xBFFF001Fu)
#define VI_ERROR_ABORT ((ViStatus)0xBFFF0030u)
#define VI_ERROR_INV_SETUP ((ViStatus)0xBFFF003Au)
#define VI_ERROR_ALLOC ((ViStatus)0xBFFF003Cu)
#define VI_ERROR_INV_MASK ((ViStatus)0xBFFF003Du)
#define VI_ERROR_IO ((ViStatus)0xBFFF003Eu)
#define VI_ERROR_INV_FMT ((ViStatus)0xBFFF003Fu)
#define VI_ERROR_NSUP_OPER ((ViStatus)0xBFFF0067u)
#define VI_ERROR_USER_BUF ((ViStatus)0xBFFF0071u)
#define VI_ERROR_RSRC_BUSY ((ViStatus)0xBFFF0072u)
#define VI_ERROR_INV_PARAMETER ((ViStatus)0xBFFF0078u)
#define VI_ERROR_INV_MODE ((ViStatus)0xBFFF0091u)
#define VI_ERROR_INTF_NUM_NCONFIG ((ViStatus)0xBFFF00A5u)
#define VI_ERROR_CONN_LOST ((ViStatus)0xBFFF00A6u)
#define VI_ERROR_NPERMISSION ((ViStatus)0xBFFF00A8u)

#ifdef __cplusplus
extern "C" {
#endif

#define CORVANE_VISA_EXPORT __attribute__((visibility("default")))

/* Reads the configuration file; VI_ERROR_INV_SETUP says that it has a fault, viStatusDesc which. */
CORVANE_VISA_EXPORT ViStatus viOpenDefaultRM(ViSession *manager);
/* Closes a session, a find list, or a manager with all that was opened through it. */
CORVANE_VISA_EXPORT ViStatus viClose(ViObject object);
CORVANE_VISA_EXPORT ViStatus viStatusDesc(ViObject object, ViStatus status, ViChar description[]);
/* mode: VI_NO_LOCK. openTimeout bounds the attempt to connect; 0 takes the configured one. */
CORVANE_VISA_EXPORT ViStatus viOpen(ViSession manager, const ViChar *name, ViAccessMode mode,
                                    ViUInt32 openTimeout, ViSession *session);
/* findList and count may be null. */
CORVANE_VISA_EXPORT ViStatus viFindRsrc(ViSession manager, const ViChar *expression,
                                        ViFindList *findList, ViUInt32 *count, ViChar first[]);
CORVANE_VISA_EXPORT ViStatus viFindNext(ViFindList findList, ViChar next[]);
CORVANE_VISA_EXPORT ViStatus viSetAttribute(ViObject object, ViAttr attribute, ViAttrState state);
CORVANE_VISA_EXPORT ViStatus viGetAttribute(ViObject object, ViAttr attribute, void *state);
CORVANE_VISA_EXPORT ViStatus viClear(ViSession session);
CORVANE_VISA_EXPORT ViStatus viGpibControlREN(ViSession session, ViUInt16 mode);
CORVANE_VISA_EXPORT ViStatus viSetBuf(ViSession session, ViUInt16 mask, ViUInt32 size);
/* Text with "%%" and escapes only; the arguments are not looked at. Sent at once. */
CORVANE_VISA_EXPORT ViStatus viPrintf(ViSession session, const ViChar *format, ...);
/* The count, which may be null, is also valid after a failure. */
CORVANE_VISA_EXPORT ViStatus viRead(ViSession session, ViByte *buffer, ViUInt32 size,
                                    ViUInt32 *count);
CORVANE_VISA_EXPORT ViStatus viWrite(ViSession session, const ViByte *buffer, ViUInt32 size,
                                     ViUInt32 *count);

#ifdef __cplusplus
}
#endif
