// SPDX-License-Identifier: Apache-2.0
#include "FakeVisa.h"

#include "visa/visa.h"

#include <algorithm>
#include <cstdio>
#include <cstring>

namespace {

constexpr ViSession Manager = 1;
constexpr ViSession Instrument = 2;

FakeVisa &fake()
{
    return *fakeVisa();
}

std::string hex(ViAttr attribute)
{
    char text[16];
    std::snprintf(text, sizeof text, "%X", static_cast<unsigned>(attribute));
    return text;
}

// Records a call; its forced status, or 0.
ViStatus begin(const std::string &call)
{
    fake().calls.push_back(call);
    return fake().status ? fake().status(call) : VI_SUCCESS;
}

std::string standardAnswer(const std::string &message)
{
    FakeVisa &state = fake();
    if (message == ":SYST:ERR?") {
        if (state.errors.empty()) {
            return "0,\"No error\"\n";
        }
        const std::string error = state.errors.front();
        state.errors.pop_front();
        return error + '\n';
    }
    if (message == "*IDN?") {
        return state.identity + '\n';
    }
    if (message == "*OPT?") {
        return state.options + '\n';
    }
    if (message.rfind(":MMEM:CAT? ", 0) == 0) {
        return "0,0\n";
    }
    return message.find("*OPC?") == std::string::npos ? std::string() : "1\n";
}

void take(const std::string &bytes, bool end)
{
    FakeVisa &state = fake();
    state.input += bytes;
    if (!end) {
        return;
    }
    const std::string message = state.input;
    state.input.clear();
    state.messages.push_back(message);
    const std::string scripted = state.answer ? state.answer(message) : std::string();
    state.output = scripted.empty() ? standardAnswer(message) : scripted;
}

} // namespace

extern "C" __attribute__((visibility("default"))) FakeVisa *fakeVisa()
{
    static FakeVisa theFake;
    return &theFake;
}

ViStatus viOpenDefaultRM(ViSession *manager)
{
    *manager = Manager;
    return begin("viOpenDefaultRM");
}

ViStatus viStatusDesc(ViObject, ViStatus status, ViChar description[])
{
    std::snprintf(description, VI_FIND_BUFLEN, "status %X", static_cast<unsigned>(status));
    return VI_SUCCESS;
}

ViStatus viOpen(ViSession, const ViChar *name, ViAccessMode mode, ViUInt32 timeout,
                ViSession *session)
{
    const ViStatus status = begin(std::string("viOpen ") + name + ' ' + std::to_string(mode) + ' ' +
                                  std::to_string(timeout));
    *session = Instrument;
    if (status == VI_SUCCESS) {
        ++fake().openSessions;
        fake().sendsEnd = true;
    }
    return status;
}

ViStatus viClose(ViObject object)
{
    if (object == Instrument) {
        --fake().openSessions;
    }
    return begin(object == Manager ? "viClose manager" : "viClose");
}

ViStatus viClear(ViSession)
{
    fake().output.clear();
    fake().input.clear();
    return begin("viClear");
}

ViStatus viSetBuf(ViSession, ViUInt16 mask, ViUInt32 size)
{
    return begin("viSetBuf " + std::to_string(mask) + ' ' + std::to_string(size));
}

ViStatus viGpibControlREN(ViSession, ViUInt16 mode)
{
    return begin("viGpibControlREN " + std::to_string(mode));
}

ViStatus viSetAttribute(ViObject, ViAttr attribute, ViAttrState state)
{
    const ViStatus status = begin("viSetAttribute " + hex(attribute) + ' ' + std::to_string(state));
    if (status != VI_SUCCESS) {
        return status;
    }
    switch (attribute) {
    case VI_ATTR_SEND_END_EN:
        fake().sendsEnd = state != 0;
        break;
    case VI_ATTR_TERMCHAR_EN:
        fake().usesTerminator = state != 0;
        break;
    case VI_ATTR_TMO_VALUE:
        fake().timeoutMs = static_cast<std::uint32_t>(state);
        break;
    default:
        break;
    }
    return VI_SUCCESS;
}

ViStatus viGetAttribute(ViObject, ViAttr attribute, void *state)
{
    const ViStatus status = begin("viGetAttribute " + hex(attribute));
    if (status != VI_SUCCESS) {
        return status;
    }
    const auto deliver = [state](auto value) { std::memcpy(state, &value, sizeof value); };
    switch (attribute) {
    case VI_ATTR_SEND_END_EN:
        deliver(ViBoolean{fake().sendsEnd});
        break;
    case VI_ATTR_TERMCHAR_EN:
        deliver(ViBoolean{fake().usesTerminator});
        break;
    case VI_ATTR_TMO_VALUE:
        deliver(ViUInt32{fake().timeoutMs});
        break;
    default:
        deliver(ViUInt16{fake().interfaceType});
        break;
    }
    return VI_SUCCESS;
}

ViStatus viPrintf(ViSession, const ViChar *format, ...)
{
    const ViStatus status = begin(std::string("viPrintf ") + format);
    if (status >= VI_SUCCESS) {
        take(format, true);
    }
    return status;
}

ViStatus viWrite(ViSession, const ViByte *buffer, ViUInt32 size, ViUInt32 *count)
{
    const std::string end = fake().sendsEnd ? " END" : "";
    const ViStatus status = begin("viWrite " + std::to_string(size) + end);
    *count = 0;
    if (status == VI_SUCCESS) {
        take(std::string(reinterpret_cast<const char *>(buffer), size), fake().sendsEnd);
        *count = size - std::min(size, fake().lostCount);
    }
    return status;
}

ViStatus viRead(ViSession, ViByte *buffer, ViUInt32 size, ViUInt32 *count)
{
    FakeVisa &state = fake();
    const ViStatus status = begin("viRead " + std::to_string(size));
    *count = 0;
    if (status < VI_SUCCESS) {
        return status;
    }
    if (size > 0 && state.output.empty()) {
        return VI_ERROR_TMO;
    }
    auto length = std::min<std::size_t>(size, state.output.size());
    if (!state.readLimits.empty()) {
        const int limit = state.readLimits.front();
        state.readLimits.pop_front();
        if (limit >= 0) {
            length = std::min(length, static_cast<std::size_t>(limit));
        }
    }
    std::memcpy(buffer, state.output.data(), length);
    state.output.erase(0, length);
    *count = static_cast<ViUInt32>(length);
    if (status != VI_SUCCESS) {
        return status;
    }
    return state.output.empty() || length < size ? VI_SUCCESS : VI_SUCCESS_MAX_CNT;
}

ViStatus viFindRsrc(ViSession, const ViChar *expression, ViFindList *list, ViUInt32 *count,
                    ViChar first[])
{
    const ViStatus status = begin(std::string("viFindRsrc ") + expression);
    if (status != VI_SUCCESS || fake().resources.empty()) {
        return status != VI_SUCCESS ? status : VI_ERROR_RSRC_NFOUND;
    }
    *list = 3;
    *count = static_cast<ViUInt32>(fake().resources.size());
    std::snprintf(first, VI_FIND_BUFLEN, "%s", fake().resources.front().c_str());
    fake().resources.erase(fake().resources.begin());
    return VI_SUCCESS;
}

ViStatus viFindNext(ViFindList, ViChar next[])
{
    const ViStatus status = begin("viFindNext");
    if (status != VI_SUCCESS || fake().resources.empty()) {
        return status != VI_SUCCESS ? status : VI_ERROR_RSRC_NFOUND;
    }
    std::snprintf(next, VI_FIND_BUFLEN, "%s", fake().resources.front().c_str());
    fake().resources.erase(fake().resources.begin());
    return VI_SUCCESS;
}
