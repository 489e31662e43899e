// SPDX-License-Identifier: Apache-2.0
#include "ErrorQueue.h"

#include <algorithm>
#include <array>
#include <utility>

namespace simulator {
namespace {

constexpr std::array<std::pair<int, std::string_view>, 36> Texts{{
    {NoError, "No error"},
    {InvalidCharacter, "Invalid character"},
    {SyntaxError, "Syntax error"},
    {InvalidSeparator, "Invalid separator"},
    {DataTypeError, "Data type error"},
    {ParameterNotAllowed, "Parameter not allowed"},
    {MissingParameter, "Missing parameter"},
    {CommandHeaderError, "Command header error"},
    {MnemonicTooLong, "Program mnemonic too long"},
    {UndefinedHeader, "Undefined header"},
    {HeaderSuffixOutOfRange, "Header suffix out of range"},
    {InvalidNumber, "Invalid character in number"},
    {InvalidSuffix, "Invalid suffix"},
    {InvalidCharacterData, "Invalid character data"},
    {InvalidString, "Invalid string data"},
    {InvalidBlock, "Invalid block data"},
    {ExecutionError, "Execution error"},
    {SettingsConflict, "Settings conflict"},
    {DataOutOfRange, "Data out of range"},
    {IllegalParameterValue, "Illegal parameter value"},
    {OutOfMemory, "Out of memory"},
    {DataStale, "Data corrupt or stale"},
    {HardwareMissing, "Hardware missing"},
    {MassStorageError, "Mass storage error"},
    {MissingMedia, "Missing media"},
    {MediaFull, "Media full"},
    {FileNameNotFound, "File name not found"},
    {FileNameError, "File name error"},
    {MediaProtected, "Media protected"},
    {SystemError, "System error"},
    {QueueOverflow, "Queue overflow"},
    {InputBufferOverrun, "Input buffer overrun"},
    {QueryInterrupted, "Query INTERRUPTED"},
    {QueryUnterminated, "Query UNTERMINATED"},
    {DirectoryEmpty, "Directory is empty or does not exist"},
    {-300, "Device-specific error"},
}};

std::string entryText(int number, std::string_view detail)
{
    std::string text = std::to_string(number) + ",\"";
    text += errorText(number);
    if (!detail.empty()) {
        text += ';';
        text += detail;
    }
    return text + '"';
}

} // namespace

std::string_view errorText(int number)
{
    const auto *found = std::find_if(Texts.begin(), Texts.end(),
                                     [number](const auto &text) { return text.first == number; });
    return found == Texts.end() ? "Device-specific error" : found->second;
}

void ErrorQueue::push(int number, std::string_view detail)
{
    if (m_entries.size() < Capacity) {
        m_entries.push_back(entryText(number, detail));
    } else {
        m_entries.back() = entryText(QueueOverflow, {});
    }
}

std::string ErrorQueue::take()
{
    if (m_entries.empty()) {
        return entryText(NoError, {});
    }
    std::string text = std::move(m_entries.front());
    m_entries.pop_front();
    return text;
}

} // namespace simulator
