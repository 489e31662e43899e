// SPDX-License-Identifier: Apache-2.0
#include "ResourceManager.h"
#include "Session.h"
#include "statustext.h"
#include "visa.h"

#include <cstdio>
#include <cstring>
#include <new>

namespace {

using namespace visa;

// What was wrong with the configuration when a manager could last not be opened: the one thing a
// status code cannot tell, asked for by viStatusDesc.
std::mutex configurationErrorMutex;
std::string configurationError;

// No exception may reach a caller, who may be written in any language.
template <typename Function>
ViStatus guarded(Function function) noexcept
{
    try {
        return function();
    } catch (const std::bad_alloc &) {
        return VI_ERROR_ALLOC;
    } catch (...) {
        return VI_ERROR_SYSTEM_ERROR;
    }
}

// Calls `function(Session &)`; a handle of another kind knows no such operation.
template <typename Function>
ViStatus withSession(ViObject handle, Function function) noexcept
{
    return guarded([&]() -> ViStatus {
        const auto object = objectTable().findObject(handle);
        if (!object) {
            return VI_ERROR_INV_OBJECT;
        }
        const auto session = std::dynamic_pointer_cast<Session>(object);
        return session ? function(*session) : VI_ERROR_NSUP_OPER;
    });
}

// Callers hand in VI_FIND_BUFLEN characters.
void copyText(const std::string &text, ViChar *buffer)
{
    std::snprintf(buffer, VI_FIND_BUFLEN, "%s", text.c_str());
}

} // namespace

ViStatus viOpenDefaultRM(ViSession *manager)
{
    return guarded([&]() -> ViStatus {
        if (manager == nullptr) {
            return VI_ERROR_USER_BUF;
        }
        *manager = VI_NULL;
        std::string error;
        auto configuration = loadConfiguration(error);
        {
            const std::lock_guard lock(configurationErrorMutex);
            configurationError = error;
        }
        if (!configuration) {
            return VI_ERROR_INV_SETUP;
        }
        *manager = objectTable().add(std::make_shared<ResourceManager>(std::move(*configuration)),
                                     VI_NULL);
        return VI_SUCCESS;
    });
}

ViStatus viClose(ViObject object)
{
    return guarded([&]() -> ViStatus {
        const auto removed = objectTable().remove(object);
        for (const auto &entry : removed) {
            entry->close();
        }
        return removed.empty() ? VI_ERROR_INV_OBJECT : VI_SUCCESS;
    });
}

ViStatus viStatusDesc(ViObject object, ViStatus status, ViChar description[])
{
    // The text does not depend on the session, and a session that failed to open has none.
    (void)object;
    return guarded([&]() -> ViStatus {
        if (description == nullptr) {
            return VI_ERROR_USER_BUF;
        }
        std::string text = statusText(status);
        if (status == VI_ERROR_INV_SETUP) {
            const std::lock_guard lock(configurationErrorMutex);
            if (!configurationError.empty()) {
                text = configurationError;
            }
        }
        if (!text.empty()) {
            copyText(text, description);
            return VI_SUCCESS;
        }
        std::snprintf(description, VI_FIND_BUFLEN, "Unknown status code 0x%08X.",
                      static_cast<unsigned>(status));
        return VI_WARN_UNKNOWN_STATUS;
    });
}

ViStatus viOpen(ViSession manager, const ViChar *name, ViAccessMode mode, ViUInt32 openTimeout,
                ViSession *session)
{
    return guarded([&]() -> ViStatus {
        if (name == nullptr || session == nullptr) {
            return VI_ERROR_USER_BUF;
        }
        *session = VI_NULL;
        const auto owner = objectTable().find<ResourceManager>(manager);
        if (!owner) {
            return VI_ERROR_INV_OBJECT;
        }
        if (mode != VI_NO_LOCK) {
            return VI_ERROR_INV_ACC_MODE;
        }
        const auto resource = parseResourceName(name);
        if (!resource) {
            return VI_ERROR_INV_RSRC_NAME;
        }
        std::unique_ptr<Transport> transport;
        if (const ViStatus status = owner->open(*resource, openTimeout, transport);
            status != VI_SUCCESS) {
            return status;
        }
        *session =
            objectTable().add(std::make_shared<Session>(*resource, std::move(transport)), manager);
        return *session == VI_NULL ? VI_ERROR_INV_OBJECT : VI_SUCCESS;
    });
}

ViStatus viFindRsrc(ViSession manager, const ViChar *expression, ViFindList *findList,
                    ViUInt32 *count, ViChar first[])
{
    return guarded([&]() -> ViStatus {
        if (expression == nullptr || first == nullptr) {
            return VI_ERROR_USER_BUF;
        }
        const auto owner = objectTable().find<ResourceManager>(manager);
        if (!owner) {
            return VI_ERROR_INV_OBJECT;
        }
        if (findList != nullptr) {
            *findList = VI_NULL;
        }
        if (count != nullptr) {
            *count = 0;
        }
        std::vector<std::string> resources;
        if (const ViStatus status = owner->find(expression, resources); status != VI_SUCCESS) {
            return status;
        }
        if (count != nullptr) {
            *count = static_cast<ViUInt32>(resources.size());
        }
        copyText(resources.front(), first);
        if (findList == nullptr) {
            return VI_SUCCESS;
        }
        resources.erase(resources.begin());
        *findList = objectTable().add(std::make_shared<FindList>(std::move(resources)), manager);
        return *findList == VI_NULL ? VI_ERROR_INV_OBJECT : VI_SUCCESS;
    });
}

ViStatus viFindNext(ViFindList findList, ViChar next[])
{
    return guarded([&]() -> ViStatus {
        if (next == nullptr) {
            return VI_ERROR_USER_BUF;
        }
        const auto list = objectTable().find<FindList>(findList);
        if (!list) {
            return VI_ERROR_INV_OBJECT;
        }
        std::string resource;
        const ViStatus status = list->next(resource);
        if (status == VI_SUCCESS) {
            copyText(resource, next);
        }
        return status;
    });
}

ViStatus viSetAttribute(ViObject object, ViAttr attribute, ViAttrState state)
{
    return withSession(object,
                       [&](Session &session) { return session.setAttribute(attribute, state); });
}

ViStatus viGetAttribute(ViObject object, ViAttr attribute, void *state)
{
    if (state == nullptr) {
        return VI_ERROR_USER_BUF;
    }
    return withSession(object,
                       [&](Session &session) { return session.getAttribute(attribute, state); });
}

ViStatus viClear(ViSession session)
{
    return withSession(session, [](Session &opened) { return opened.clear(); });
}

ViStatus viGpibControlREN(ViSession session, ViUInt16 mode)
{
    return withSession(session, [&](Session &opened) { return opened.controlRemote(mode); });
}

ViStatus viSetBuf(ViSession session, ViUInt16 mask, ViUInt32 size)
{
    return withSession(session, [&](Session &opened) { return opened.setBuffer(mask, size); });
}

ViStatus viPrintf(ViSession session, const ViChar *format, ...)
{
    if (format == nullptr) {
        return VI_ERROR_INV_FMT;
    }
    return withSession(session, [&](Session &opened) { return opened.print(format); });
}

ViStatus viRead(ViSession session, ViByte *buffer, ViUInt32 size, ViUInt32 *count)
{
    std::size_t received = 0;
    ViStatus status = VI_ERROR_USER_BUF;
    if (buffer != nullptr || size == 0) {
        status = withSession(session, [&](Session &opened) {
            return opened.read(std::span(buffer, size), received);
        });
    }
    if (count != nullptr) {
        *count = static_cast<ViUInt32>(received);
    }
    return status;
}

ViStatus viWrite(ViSession session, const ViByte *buffer, ViUInt32 size, ViUInt32 *count)
{
    std::size_t sent = 0;
    ViStatus status = VI_ERROR_USER_BUF;
    if (buffer != nullptr || size == 0) {
        status = withSession(
            session, [&](Session &opened) { return opened.write(std::span(buffer, size), sent); });
    }
    if (count != nullptr) {
        *count = static_cast<ViUInt32>(sent);
    }
    return status;
}
