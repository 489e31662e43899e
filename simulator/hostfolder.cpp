// SPDX-License-Identifier: Apache-2.0
#include "hostfolder.h"

#include "ErrorQueue.h"

#include <dirent.h>
#include <sys/stat.h>

#include <cerrno>
#include <memory>
#include <utility>

namespace simulator {
namespace {

// Without O_NONBLOCK a named pipe in the folder would hang its opener.
constexpr int FileFlags = O_NOFOLLOW | O_CLOEXEC | O_NONBLOCK;

struct DirectoryCloser
{
    void operator()(DIR *directory) const { ::closedir(directory); }
};
using Directory = std::unique_ptr<DIR, DirectoryCloser>;

// The folder's descriptor stays with the caller: the stream gets one of its own, which starts at
// the first entry each time.
Directory openDirectory(int folder)
{
    UniqueFd fd(::openat(folder, ".", FolderFlags));
    Directory directory(fd.isValid() ? ::fdopendir(fd.get()) : nullptr);
    if (directory) {
        (void)fd.release();
    }
    return directory;
}

} // namespace

int scpiErrorOf(int systemError)
{
    switch (systemError) {
    case ENOENT:
        return FileNameNotFound;
    case ENOSPC:
    case EDQUOT:
        return MediaFull;
    case EACCES:
    case EPERM:
    case EROFS:
        return MediaProtected;
    case ELOOP:
    case ENOTDIR:
    case EISDIR:
    case EEXIST:
    case ENAMETOOLONG:
    case EINVAL:
    case ENXIO:
        return FileNameError;
    default:
        return MassStorageError;
    }
}

void forEachName(int folder, const std::function<void(std::string_view name)> &visitor)
{
    const Directory directory = openDirectory(folder);
    if (!directory) {
        return;
    }
    while (const dirent *entry = ::readdir(directory.get())) {
        const std::string_view name = entry->d_name;
        if (name != "." && name != "..") {
            visitor(name);
        }
    }
}

int openRegular(int folder, const std::string &name, int flags, UniqueFd &fd)
{
    UniqueFd opened(::openat(folder, name.c_str(), flags | FileFlags, 0666));
    if (!opened.isValid()) {
        return scpiErrorOf(errno);
    }
    struct stat status
    {
    };
    if (::fstat(opened.get(), &status) != 0 || !S_ISREG(status.st_mode)) {
        return FileNameError;
    }
    fd = std::move(opened);
    return NoError;
}

} // namespace simulator
