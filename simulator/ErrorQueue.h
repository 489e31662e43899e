// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <cstddef>
#include <deque>
#include <string>
#include <string_view>

namespace simulator {

/// The numbers of SCPI-99, volume 2, chapter 21, that this instrument uses, and one of its own.
enum ScpiError : int {
    NoError = 0,
    InvalidCharacter = -101,
    SyntaxError = -102,
    InvalidSeparator = -103,
    DataTypeError = -104,
    ParameterNotAllowed = -108,
    MissingParameter = -109,
    CommandHeaderError = -110,
    MnemonicTooLong = -112,
    UndefinedHeader = -113,
    HeaderSuffixOutOfRange = -114,
    InvalidNumber = -121,
    InvalidSuffix = -131,
    InvalidCharacterData = -141,
    InvalidString = -151,
    InvalidBlock = -161,
    ExecutionError = -200,
    SettingsConflict = -221,
    DataOutOfRange = -222,
    IllegalParameterValue = -224,
    OutOfMemory = -225,
    DataStale = -230,
    HardwareMissing = -241,
    MassStorageError = -250,
    MissingMedia = -252,
    MediaFull = -254,
    FileNameNotFound = -256,
    FileNameError = -257,
    MediaProtected = -258,
    SystemError = -310,
    QueueOverflow = -350,
    InputBufferOverrun = -363,
    QueryInterrupted = -410,
    QueryUnterminated = -420,
    DirectoryEmpty = 469,
};

/// The standard text of an error number; "Device-specific error" for an unknown one.
[[nodiscard]] std::string_view errorText(int number);

/// The instrument's error and event queue: first in, first out, shared by all its links.
class ErrorQueue
{
public:
    static constexpr std::size_t Capacity = 100;

    /// Appends an entry. `detail` follows the standard text behind a semicolon. It never holds a
    /// file name: controllers look for numbers in these lines, and a name may contain any digits.
    /// When the queue is full its last entry becomes the overflow error.
    void push(int number, std::string_view detail = {});

    /// Takes the oldest entry as `number,"text"`; `0,"No error"` when there is none.
    [[nodiscard]] std::string take();

    [[nodiscard]] std::size_t size() const { return m_entries.size(); }
    [[nodiscard]] bool isEmpty() const { return m_entries.empty(); }
    void clear() { m_entries.clear(); }

private:
    std::deque<std::string> m_entries;
};

} // namespace simulator
