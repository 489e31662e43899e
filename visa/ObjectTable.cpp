// SPDX-License-Identifier: Apache-2.0
#include "ObjectTable.h"

namespace visa {

ViObject ObjectTable::add(std::shared_ptr<Object> object, ViObject parent)
{
    const std::lock_guard lock(m_mutex);
    if (parent != VI_NULL && !m_entries.contains(parent)) {
        return VI_NULL;
    }
    do {
        ++m_lastHandle;
    } while (m_lastHandle == VI_NULL || m_entries.contains(m_lastHandle));
    m_entries[m_lastHandle] = {std::move(object), parent};
    return m_lastHandle;
}

std::shared_ptr<Object> ObjectTable::findObject(ViObject handle)
{
    const std::lock_guard lock(m_mutex);
    const auto entry = m_entries.find(handle);
    return entry == m_entries.end() ? nullptr : entry->second.object;
}

std::vector<std::shared_ptr<Object>> ObjectTable::remove(ViObject handle)
{
    const std::lock_guard lock(m_mutex);
    std::vector<std::shared_ptr<Object>> removed;
    const auto own = m_entries.find(handle);
    if (handle == VI_NULL || own == m_entries.end()) {
        return removed;
    }
    for (auto entry = m_entries.begin(); entry != m_entries.end();) {
        if (entry->second.parent == handle) {
            removed.push_back(std::move(entry->second.object));
            entry = m_entries.erase(entry);
        } else {
            ++entry;
        }
    }
    removed.push_back(std::move(own->second.object));
    m_entries.erase(own);
    return removed;
}

ObjectTable &objectTable()
{
    // Never destroyed: at the end of the process sessions close with their descriptors, and no
    // destructor has to talk to instruments then.
    static auto *const table = new ObjectTable;
    return *table;
}

} // namespace visa
