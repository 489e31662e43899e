// SPDX-License-Identifier: Apache-2.0
#include "Log.h"

#include <cstdio>
#include <string>

namespace simulator {
namespace {

bool verboseFlag = false;

void writeLine(const std::string &line)
{
    // One call a line: the stream's own lock keeps lines of several threads apart.
    (void)std::fwrite(line.data(), 1, line.size(), stderr);
}

} // namespace

void Log::setVerbose(bool verbose)
{
    verboseFlag = verbose;
}

bool Log::isVerbose()
{
    return verboseFlag;
}

void Log::conversation(std::string_view who, std::string_view arrow, std::string_view text)
{
    constexpr std::size_t MaxLength = 500;
    if (!verboseFlag) {
        return;
    }
    std::string line;
    line.append(who).append(" ").append(arrow).append(" ");
    for (const char byte : text.substr(0, MaxLength)) {
        line += static_cast<unsigned char>(byte) < ' ' || byte == '\x7F' ? '.' : byte;
    }
    if (text.size() > MaxLength) {
        line += "...";
    }
    writeLine(line + '\n');
}

void Log::error(std::string_view text)
{
    writeLine("corvane-simulator: " + std::string(text) + '\n');
}

} // namespace simulator
