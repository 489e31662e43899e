// SPDX-License-Identifier: Apache-2.0
#include "MassMemory.h"

#include "ErrorQueue.h"
#include "ProgramUnit.h"
#include "hostfolder.h"

#include <fcntl.h>
#include <fnmatch.h>
#include <strings.h>
#include <sys/stat.h>
#include <sys/statvfs.h>

#include <algorithm>
#include <array>
#include <cerrno>
#include <cstdio>
#include <system_error>
#include <utility>

namespace simulator {
namespace {

constexpr std::size_t MaxNameLength = 255;

bool isPrintable(std::string_view name)
{
    return std::all_of(name.begin(), name.end(),
                       [](char byte) { return static_cast<unsigned char>(byte) >= ' '; });
}

std::string_view typeOf(std::string_view name)
{
    constexpr std::array<std::string_view, 6> TextSuffixes{"TXT", "CSV", "INI",
                                                           "LOG", "XML", "ASC"};
    constexpr std::array<std::string_view, 3> SettingsSuffixes{"SET", "SAV", "STA"};
    const std::size_t point = name.rfind('.');
    if (point == std::string_view::npos) {
        return "BIN";
    }
    const std::string suffix = upperCase(name.substr(point + 1));
    if (std::find(TextSuffixes.begin(), TextSuffixes.end(), suffix) != TextSuffixes.end()) {
        return "ASC";
    }
    if (std::find(SettingsSuffixes.begin(), SettingsSuffixes.end(), suffix) !=
        SettingsSuffixes.end()) {
        return "SET";
    }
    return "BIN";
}

// A pattern with * and ? as fnmatch takes it, to which [ and \ are special too.
std::string shellPattern(const std::string &pattern)
{
    if (pattern == "*.*") {
        return "*"; // fits names without a suffix as well
    }
    std::string result;
    for (const char byte : pattern) {
        if (byte == '[' || byte == '\\') {
            result += '\\';
        }
        result += byte;
    }
    return result;
}

} // namespace

MassMemory::MassMemory(bool unixPaths, const std::vector<std::string> &roots)
    : m_unixPaths(unixPaths)
{
    for (const std::string &root : roots) {
        Components components;
        std::size_t begin = 0;
        while (begin < root.size()) {
            const std::size_t end = std::min(root.find('/', begin), root.size());
            if (end > begin) {
                components.push_back(root.substr(begin, end - begin));
            }
            begin = end + 1;
        }
        m_roots.push_back(std::move(components));
    }
    reset();
}

bool MassMemory::open(const std::string &folder, std::string &error)
{
    // The user's own path to the folder may hold links; below it none is followed.
    for (std::size_t slash = folder.find('/', 1); slash != std::string::npos;
         slash = folder.find('/', slash + 1)) {
        (void)::mkdir(folder.substr(0, slash).c_str(), 0777);
    }
    (void)::mkdir(folder.c_str(), 0777);
    m_top = UniqueFd(::open(folder.c_str(), O_RDONLY | O_DIRECTORY | O_CLOEXEC));
    const auto fail = [&](const std::string &path) {
        error = "cannot use the folder '" + path + "': " + std::generic_category().message(errno);
        return false;
    };
    if (!m_top.isValid()) {
        return fail(folder);
    }
    for (const Components &root : m_roots) {
        std::string path = folder;
        UniqueFd at(::openat(m_top.get(), ".", FolderFlags));
        for (const std::string &name : root) {
            path += '/' + name;
            if (::mkdirat(at.get(), name.c_str(), 0777) != 0 && errno != EEXIST) {
                return fail(path);
            }
            at = UniqueFd(::openat(at.get(), name.c_str(), FolderFlags));
            if (!at.isValid()) {
                return fail(path);
            }
        }
    }
    return true;
}

void MassMemory::reset()
{
    m_current = m_roots.empty() ? Components() : m_roots.front();
}

std::string MassMemory::currentDirectory() const
{
    std::string path = m_unixPaths ? "/" : "";
    const char separator = m_unixPaths ? '/' : '\\';
    for (const std::string &component : m_current) {
        path += component + separator;
    }
    return path;
}

// Turns a path into its components from the top folder on. Both separators are understood by all
// models, since controllers mix them.
int MassMemory::split(std::string_view path, Components &components) const
{
    const auto isSeparator = [](char byte) { return byte == '/' || byte == '\\'; };
    if (m_roots.empty()) {
        return HardwareMissing;
    }

    components.clear();
    if (!m_unixPaths && path.size() >= 2 && path[1] == ':') {
        const std::string drive = upperCase(path.substr(0, 2));
        if (std::none_of(m_roots.begin(), m_roots.end(),
                         [&](const Components &root) { return root.front() == drive; })) {
            return MissingMedia;
        }
        components.push_back(drive);
        path.remove_prefix(2);
    } else if (path.empty() || !isSeparator(path.front())) {
        components = m_current;
    } else if (!m_unixPaths) {
        components.push_back(m_current.front());
    }

    while (!path.empty()) {
        std::size_t length = 0;
        while (length < path.size() && !isSeparator(path[length])) {
            ++length;
        }
        const std::string_view name = path.substr(0, length);
        path.remove_prefix(std::min(length + 1, path.size()));
        if (name.empty() || name == ".") {
            continue;
        }
        if (name == ".." || name.size() > MaxNameLength || !isPrintable(name)) {
            return FileNameError;
        }
        if (!m_unixPaths && name.find_first_of(":<>|\"") != std::string_view::npos) {
            return FileNameError;
        }
        components.emplace_back(name);
    }
    return NoError;
}

// Drive-based instruments do not tell capital letters from small ones.
std::string MassMemory::actualName(int folder, const std::string &name) const
{
    struct stat status
    {
    };
    if (m_unixPaths || ::fstatat(folder, name.c_str(), &status, AT_SYMLINK_NOFOLLOW) == 0) {
        return name;
    }
    std::string actual = name;
    forEachName(folder, [&](std::string_view entry) {
        if (entry.size() == name.size() &&
            ::strncasecmp(entry.data(), name.data(), name.size()) == 0) {
            actual = entry;
        }
    });
    return actual;
}

int MassMemory::enter(UniqueFd &folder, const std::string &name) const
{
    UniqueFd child(::openat(folder.get(), actualName(folder.get(), name).c_str(), FolderFlags));
    if (!child.isValid()) {
        return scpiErrorOf(errno);
    }
    folder = std::move(child);
    return NoError;
}

bool MassMemory::isRoot(const Components &components) const
{
    return std::any_of(m_roots.begin(), m_roots.end(), [&](const Components &root) {
        return components.size() <= root.size() &&
               std::equal(components.begin(), components.end(), root.begin());
    });
}

int MassMemory::locate(std::string_view path, Place &place) const
{
    Components components;
    if (const int error = split(path, components); error != NoError) {
        return error;
    }
    place.isRoot = isRoot(components);
    place.folder = UniqueFd(::openat(m_top.get(), ".", FolderFlags));
    if (!place.folder.isValid()) {
        return scpiErrorOf(errno);
    }
    if (components.empty()) {
        return NoError;
    }
    for (std::size_t i = 0; i + 1 < components.size(); ++i) {
        if (const int error = enter(place.folder, components[i]); error != NoError) {
            return error;
        }
    }
    place.name = actualName(place.folder.get(), components.back());
    return NoError;
}

int MassMemory::catalog(std::string_view path, Catalog &result) const
{
    result = {};
    Place place;
    if (const int error = locate(path, place); error != NoError) {
        return error;
    }

    std::string pattern = place.name;
    if (place.name.empty()) {
        pattern = "*.*";
    } else {
        const int error = enter(place.folder, place.name);
        const bool isPattern = place.name.find_first_of("*?") != std::string::npos;
        struct stat status
        {
        };
        const bool isFile =
            ::fstatat(place.folder.get(), place.name.c_str(), &status, AT_SYMLINK_NOFOLLOW) == 0 &&
            S_ISREG(status.st_mode);
        if (error != NoError && !isPattern && !isFile) {
            return error;
        }
        result.filtered = error != NoError;
        if (error == NoError) {
            pattern = "*.*";
        }
    }

    pattern = shellPattern(pattern);
    const int flags = m_unixPaths ? 0 : FNM_CASEFOLD;
    forEachName(place.folder.get(), [&](std::string_view name) {
        const std::string text(name);
        const bool fits = result.filtered && name == place.name;
        if (!isPrintable(name) || (!fits && ::fnmatch(pattern.c_str(), text.c_str(), flags) != 0)) {
            return;
        }
        struct stat status
        {
        };
        if (::fstatat(place.folder.get(), text.c_str(), &status, AT_SYMLINK_NOFOLLOW) != 0) {
            return;
        }
        if (S_ISDIR(status.st_mode)) {
            result.entries.push_back({text, "DIR", 0});
        } else if (S_ISREG(status.st_mode)) {
            const auto size = static_cast<std::uint64_t>(status.st_size);
            result.entries.push_back({text, typeOf(name), size});
            result.usedBytes += size;
        }
    });
    std::sort(result.entries.begin(), result.entries.end(),
              [](const Entry &a, const Entry &b) { return a.name < b.name; });

    struct statvfs space
    {
    };
    if (::fstatvfs(place.folder.get(), &space) == 0) {
        result.freeBytes = static_cast<std::uint64_t>(space.f_bavail) * space.f_frsize;
    }
    return NoError;
}

int MassMemory::openForReading(std::string_view path, UniqueFd &fd, std::uint64_t &size) const
{
    Place place;
    if (const int error = locate(path, place); error != NoError) {
        return error;
    }
    if (place.name.empty()) {
        return FileNameError;
    }
    if (const int error = openRegular(place.folder.get(), place.name, O_RDONLY, fd);
        error != NoError) {
        return error;
    }
    struct stat status
    {
    };
    if (::fstat(fd.get(), &status) != 0) {
        return scpiErrorOf(errno);
    }
    size = static_cast<std::uint64_t>(status.st_size);
    return NoError;
}

int MassMemory::openForWriting(std::string_view path, std::unique_ptr<FileWriter> &writer)
{
    Place place;
    if (const int error = locate(path, place); error != NoError) {
        return error;
    }
    if (place.name.empty() || place.name.find_first_of("*?") != std::string::npos) {
        return FileNameError;
    }
    UniqueFd fd;
    if (const int error = openRegular(place.folder.get(), place.name, O_WRONLY | O_CREAT, fd);
        error != NoError) {
        return error;
    }
    // Cut only now that it is known to be a plain file.
    if (::ftruncate(fd.get(), 0) != 0) {
        return scpiErrorOf(errno);
    }
    writer = std::make_unique<FileWriter>(std::move(fd));
    return NoError;
}

int MassMemory::remove(std::string_view path)
{
    Place place;
    if (const int error = locate(path, place); error != NoError) {
        return error;
    }
    if (place.isRoot) {
        return FileNameError;
    }
    return ::unlinkat(place.folder.get(), place.name.c_str(), 0) == 0 ? NoError
                                                                      : scpiErrorOf(errno);
}

int MassMemory::makeDirectory(std::string_view path)
{
    Place place;
    if (const int error = locate(path, place); error != NoError) {
        return error;
    }
    if (place.name.empty() || place.name.find_first_of("*?") != std::string::npos) {
        return FileNameError;
    }
    return ::mkdirat(place.folder.get(), place.name.c_str(), 0777) == 0 ? NoError
                                                                        : scpiErrorOf(errno);
}

int MassMemory::removeDirectory(std::string_view path)
{
    Place place;
    if (const int error = locate(path, place); error != NoError) {
        return error;
    }
    if (place.isRoot) {
        return MediaProtected;
    }
    return ::unlinkat(place.folder.get(), place.name.c_str(), AT_REMOVEDIR) == 0
               ? NoError
               : scpiErrorOf(errno);
}

int MassMemory::move(std::string_view from, std::string_view to)
{
    Place source;
    Place target;
    if (const int error = locate(from, source); error != NoError) {
        return error;
    }
    if (const int error = locate(to, target); error != NoError) {
        return error;
    }
    if (source.isRoot || target.isRoot) {
        return MediaProtected;
    }
    if (target.name.find_first_of("*?") != std::string::npos) {
        return FileNameError;
    }
    return ::renameat2(source.folder.get(), source.name.c_str(), target.folder.get(),
                       target.name.c_str(), RENAME_NOREPLACE) == 0
               ? NoError
               : scpiErrorOf(errno);
}

int MassMemory::copy(std::string_view from, std::string_view to)
{
    constexpr std::size_t PieceSize = 262'144;
    UniqueFd source;
    std::uint64_t size = 0;
    if (const int error = openForReading(from, source, size); error != NoError) {
        return error;
    }
    Place target;
    if (const int error = locate(to, target); error != NoError) {
        return error;
    }
    if (target.isRoot || target.name.find_first_of("*?") != std::string::npos) {
        return FileNameError;
    }
    UniqueFd fd;
    if (const int error =
            openRegular(target.folder.get(), target.name, O_WRONLY | O_CREAT | O_EXCL, fd);
        error != NoError) {
        return error;
    }
    FileWriter writer(std::move(fd));
    std::vector<char> piece(PieceSize);
    ssize_t count = 0;
    while ((count = ::read(source.get(), piece.data(), piece.size())) > 0) {
        writer.write(std::span(piece).first(static_cast<std::size_t>(count)));
    }
    if (count < 0) {
        return scpiErrorOf(errno);
    }
    return writer.finish();
}

int MassMemory::changeDirectory(std::string_view path)
{
    Place place;
    if (const int error = locate(path, place); error != NoError) {
        return error;
    }
    if (!place.name.empty()) {
        if (const int error = enter(place.folder, place.name); error != NoError) {
            return error;
        }
    }
    Components components;
    const int error = split(path, components);
    if (error == NoError) {
        m_current = std::move(components);
    }
    return error;
}

} // namespace simulator
