// SPDX-License-Identifier: Apache-2.0
// A block that an instrument sends, in pieces as the first byte says, followed by what it answers
// to the question for errors.
#include "base/OutputFile.h"
#include "instrument/BlockReader.h"
#include "instrument/VisaLibrary.h"
#include "support/MemoryStream.h"
#include "support/fuzzcheck.h"

#include <cstdint>
#include <cstring>
#include <string_view>

namespace {

constexpr qint64 MaxStreamBytes = 4096;

std::string_view replyBytes; ///< not read yet
std::size_t pieceBytes = 1;  ///< of one read at most
int longestSilence = 0;      ///< good reads without a byte that are left

ViStatus readReply(ViSession /*session*/, ViByte *buffer, ViUInt32 size, ViUInt32 *count)
{
    const std::size_t taken = std::min({std::size_t{size}, pieceBytes, replyBytes.size()});
    std::memcpy(buffer, replyBytes.data(), taken);
    replyBytes.remove_prefix(taken);
    *count = static_cast<ViUInt32>(taken);
    if (taken == 0 && longestSilence-- <= 0) {
        return VI_ERROR_TMO;
    }
    return taken == size ? VI_SUCCESS_MAX_CNT : VI_SUCCESS;
}

ViStatus acceptText(ViSession /*session*/, const ViChar * /*format*/, ...)
{
    return VI_SUCCESS;
}

/// A library within this program: what it takes it forgets, what it sends is the input.
void provideLibrary()
{
    VisaLibrary &library = VisaLibrary::instance();
    // Only a library that could be loaded is asked for functions; which one doesn't matter.
    qputenv("CORVANE_VISA_LIBRARY", "libz.so.1");
    require(library.load());
    VisaFunctions &functions = library.editFunctions();
    functions.viStatusDesc = [](ViObject, ViStatus, ViChar *text) -> ViStatus {
        std::strcpy(text, "status");
        return VI_SUCCESS;
    };
    functions.viOpen = [](ViSession, const ViChar *, ViAccessMode, ViUInt32,
                          ViSession *session) -> ViStatus {
        *session = 2;
        return VI_SUCCESS;
    };
    functions.viClear = [](ViSession) -> ViStatus { return VI_SUCCESS; };
    functions.viSetAttribute = [](ViObject, ViAttr, ViAttrState) -> ViStatus { return VI_SUCCESS; };
    functions.viGetAttribute = [](ViObject, ViAttr attribute, void *state) -> ViStatus {
        std::memset(state, 0, attribute == VI_ATTR_TMO_VALUE ? sizeof(ViUInt32) : sizeof(ViUInt16));
        return VI_SUCCESS;
    };
    functions.viSetBuf = [](ViSession, ViUInt16, ViUInt32) -> ViStatus { return VI_SUCCESS; };
    functions.viPrintf = acceptText;
    functions.viRead = readReply;
    functions.viWrite = [](ViSession, const ViByte *, ViUInt32 size, ViUInt32 *count) -> ViStatus {
        *count = size;
        return VI_SUCCESS;
    };
    library.manager = 1;
}

} // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t *data, std::size_t size)
{
    static const bool provided = (provideLibrary(), true);
    static MemoryStream samples;
    require(provided);
    if (size == 0) {
        return 0;
    }
    const unsigned mode = data[0];
    const std::string_view all(reinterpret_cast<const char *>(data) + 1, size - 1);
    replyBytes = all;
    pieceBytes = std::size_t{1} << (mode % 16);
    longestSilence = static_cast<int>(mode / 16 % 8);
    VisaSession session;
    OperationControl control{[](int percent) { require(percent >= 0 && percent <= 100); }};
    require(static_cast<bool>(session.open("GPIB0::28::INSTR", control)));
    (void)takeErrors();
    BlockReader reader(session, control);
    if (mode < 128) {
        samples.clear();
        const bool ok = reader.readStream(samples.stream, MaxStreamBytes);
        require(ok != takeErrors());
        const qint64 content = samples.contentSize() - BufferedIO::HeaderSize;
        require(content <= std::min<qint64>(MaxStreamBytes, static_cast<qint64>(all.size())));
        require(!ok || (all.starts_with('#') && content >= 0));
        if (ok && content > 0) {
            const std::string_view block(samples.device.bytes.constData() + BufferedIO::HeaderSize,
                                         static_cast<std::size_t>(content));
            require(all.substr(2).find(block) != std::string_view::npos);
        }
    } else {
        // Not to a disk; a device is written in place.
        OutputFile file("/dev/null");
        const bool ok = reader.readFile("/var/user/a.wv", "a.wv", file);
        require(!ok || all.starts_with('#'));
        (void)takeErrors();
    }
    return 0;
}
