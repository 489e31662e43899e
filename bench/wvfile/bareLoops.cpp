// SPDX-License-Identifier: Apache-2.0
#include "bareLoops.h"

#include <algorithm>
#include <vector>

#include <fcntl.h>
#include <unistd.h>

namespace {

constexpr size_t blockBytes = 1'048'576;

/// Reads `total` values of one kind in blocks, converts and writes them; the count that came
/// through.
template <typename From, typename To, typename Convert>
qint64 convertFile(const std::string &source, qint64 offset, qint64 total,
                   const std::string &target, const Convert &convert)
{
    const int in = ::open(source.c_str(), O_RDONLY | O_CLOEXEC);
    const int out = ::open(target.c_str(), O_WRONLY | O_CREAT | O_EXCL | O_CLOEXEC, 0600);
    if (in < 0 || out < 0 || ::lseek(in, offset, SEEK_SET) < 0) {
        return -1;
    }
    std::vector<From> from(blockBytes / sizeof(From));
    std::vector<To> to(from.size());
    qint64 done = 0;
    while (done < total) {
        const auto wanted =
            static_cast<size_t>(std::min<qint64>(total - done, static_cast<qint64>(from.size())));
        const ssize_t got = ::read(in, from.data(), wanted * sizeof(From));
        if (got <= 0) {
            break;
        }
        const size_t count = static_cast<size_t>(got) / sizeof(From);
        for (size_t i = 0; i < count; ++i) {
            to[i] = convert(from[i]);
        }
        const auto bytes = static_cast<ssize_t>(count * sizeof(To));
        if (::write(out, to.data(), count * sizeof(To)) != bytes) {
            break;
        }
        done += static_cast<qint64>(count);
    }
    ::close(in);
    ::close(out);
    return done;
}

} // namespace

qint64 bareDecode(const std::string &source, qint64 offset, qint64 samples,
                  const std::string &target)
{
    const auto decode = [](qint16 word) { return (static_cast<float>(word) - 0.5F) / 32767.0F; };
    return convertFile<qint16, float>(source, offset, 2 * samples, target, decode) / 2;
}

qint64 bareEncode(const std::string &source, qint64 offset, qint64 samples,
                  const std::string &target)
{
    const auto encode = [](float value) {
        const float limited = std::min(1.0F, std::max(-1.0F, value));
        const float scaled = limited * 32767.0F + 0.5F;
        return static_cast<qint16>(static_cast<int>(scaled));
    };
    return convertFile<float, qint16>(source, offset, 2 * samples, target, encode) / 2;
}
