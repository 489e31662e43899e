// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "visa.h"

#include <map>
#include <memory>
#include <mutex>
#include <vector>

namespace visa {

/// What a handle of the interface stands for: a resource manager, a session or a find list.
class Object
{
public:
    Object() = default;
    virtual ~Object() = default;
    Object(const Object &) = delete;
    Object &operator=(const Object &) = delete;

    /// Ends the calls that still run in other threads and waits for them.
    virtual void close() {}
};

/// All open objects by their handles. Any thread. A call that works on an object keeps it alive,
/// also while another thread closes it.
class ObjectTable
{
public:
    /// `parent` is the handle of the manager, VI_NULL for a manager itself. VI_NULL if the parent
    /// was closed meanwhile.
    [[nodiscard]] ViObject add(std::shared_ptr<Object> object, ViObject parent);

    /// The object if it is of type T, else null.
    template <typename T>
    [[nodiscard]] std::shared_ptr<T> find(ViObject handle)
    {
        return std::dynamic_pointer_cast<T>(findObject(handle));
    }

    [[nodiscard]] std::shared_ptr<Object> findObject(ViObject handle);

    /// Takes the object and those that name it as parent out of the table, children first.
    [[nodiscard]] std::vector<std::shared_ptr<Object>> remove(ViObject handle);

private:
    struct Entry
    {
        std::shared_ptr<Object> object;
        ViObject parent = VI_NULL;
    };

    std::mutex m_mutex;
    std::map<ViObject, Entry> m_entries;
    ViObject m_lastHandle = VI_NULL;
};

/// The one table of the process.
[[nodiscard]] ObjectTable &objectTable();

} // namespace visa
