// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "FileWriter.h"
#include "UniqueFd.h"

#include <cstdint>
#include <memory>
#include <string>
#include <string_view>
#include <vector>

namespace simulator {

/// The file system of an instrument, kept in a folder of this machine.
///
/// A path is walked component by component without following symbolic links, and ".." is refused,
/// so that nothing outside of the folder can be reached. Operations return the SCPI error number,
/// 0 for none. Not thread-safe.
class MassMemory
{
public:
    struct Entry
    {
        std::string name;
        std::string_view type; ///< "DIR", "ASC", "BIN" or "SET"
        std::uint64_t size = 0;
    };
    struct Catalog
    {
        std::uint64_t usedBytes = 0; ///< sum of the listed files
        std::uint64_t freeBytes = 0;
        std::vector<Entry> entries; ///< in the order of their names
        bool filtered = false;      ///< the path ended in a file name or pattern
    };

    /// `unixPaths`: paths begin at "/"; otherwise at one of the drives in `roots`. An instrument
    /// without roots has no mass memory: each operation fails.
    MassMemory(bool unixPaths, const std::vector<std::string> &roots);

    /// Opens the folder that stands for the top of the file system and makes it and the roots in it
    /// where they are missing. False with the reason in `error`.
    [[nodiscard]] bool open(const std::string &folder, std::string &error);

    [[nodiscard]] int catalog(std::string_view path, Catalog &result) const;
    [[nodiscard]] int openForReading(std::string_view path, UniqueFd &fd,
                                     std::uint64_t &size) const;
    [[nodiscard]] int openForWriting(std::string_view path, std::unique_ptr<FileWriter> &writer);
    [[nodiscard]] int remove(std::string_view path);
    [[nodiscard]] int makeDirectory(std::string_view path);
    [[nodiscard]] int removeDirectory(std::string_view path);

    /// An existing target is never replaced.
    [[nodiscard]] int move(std::string_view from, std::string_view to);
    [[nodiscard]] int copy(std::string_view from, std::string_view to);

    [[nodiscard]] int changeDirectory(std::string_view path);
    [[nodiscard]] std::string currentDirectory() const;

    /// Back to the first root.
    void reset();

private:
    using Components = std::vector<std::string>;

    /// The folder that holds the last component of a path, and that component.
    struct Place
    {
        UniqueFd folder;
        std::string name;    ///< empty when the path is the top folder itself
        bool isRoot = false; ///< a root of the instrument, or a folder on the way to one
    };

    [[nodiscard]] int split(std::string_view path, Components &components) const;
    [[nodiscard]] int locate(std::string_view path, Place &place) const;
    [[nodiscard]] int enter(UniqueFd &folder, const std::string &name) const;
    [[nodiscard]] std::string actualName(int folder, const std::string &name) const;
    [[nodiscard]] bool isRoot(const Components &components) const;

    bool m_unixPaths;
    std::vector<Components> m_roots;
    Components m_current;
    UniqueFd m_top;
};

} // namespace simulator
