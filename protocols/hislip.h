// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <array>
#include <cstdint>
#include <span>

/// HiSLIP, IVI-6.1: what stands on the wire, the same for both ends.
namespace protocols::hislip {

constexpr std::uint16_t Port = 4880;
constexpr std::uint16_t Version = 0x0100; ///< 1.0
constexpr std::size_t HeaderSize = 16;
constexpr std::uint32_t FirstMessageId = 0xFFFFFF00;
constexpr std::uint32_t UnknownMessageId = 0xFFFFFFFF;

enum Type : std::uint8_t {
    Initialize = 0,
    InitializeResponse = 1,
    FatalError = 2,
    Error = 3,
    AsyncLock = 4,
    AsyncLockResponse = 5,
    Data = 6,
    DataEnd = 7,
    DeviceClearComplete = 8,
    DeviceClearAcknowledge = 9,
    AsyncRemoteLocalControl = 10,
    AsyncRemoteLocalResponse = 11,
    Trigger = 12,
    Interrupted = 13,
    AsyncInterrupted = 14,
    AsyncMaximumMessageSize = 15,
    AsyncMaximumMessageSizeResponse = 16,
    AsyncInitialize = 17,
    AsyncInitializeResponse = 18,
    AsyncDeviceClear = 19,
    AsyncServiceRequest = 20,
    AsyncStatusQuery = 21,
    AsyncStatusResponse = 22,
    AsyncDeviceClearAcknowledge = 23,
    AsyncLockInfo = 24,
    AsyncLockInfoResponse = 25,
};

/// The control code of a fatal error.
enum FatalCode : std::uint8_t {
    UnidentifiedFatal = 0,
    PoorlyFormedHeader = 1,
    ChannelsNotEstablished = 2,
    InvalidInitialization = 3,
    TooManyClients = 4,
};

/// The control code of an error that the connection survives.
enum ErrorCode : std::uint8_t {
    UnidentifiedError = 0,
    UnrecognizedType = 1,
    UnrecognizedControl = 2,
    UnrecognizedVendorType = 3,
    MessageTooLarge = 4,
};

/// What stands before each payload.
struct Header
{
    std::uint8_t type = 0;
    std::uint8_t control = 0;
    std::uint32_t parameter = 0;
    std::uint64_t length = 0; ///< bytes of the payload
};

template <typename Number>
void put(Number value, std::uint8_t *bytes)
{
    for (std::size_t k = sizeof(Number); k > 0; --k) {
        bytes[k - 1] = static_cast<std::uint8_t>(value);
        value = static_cast<Number>(value >> 8U);
    }
}

template <typename Number>
[[nodiscard]] Number get(const std::uint8_t *bytes)
{
    Number value = 0;
    for (std::size_t k = 0; k < sizeof(Number); ++k) {
        value = static_cast<Number>(static_cast<Number>(value << 8U) | bytes[k]);
    }
    return value;
}

/// All numbers in network order.
[[nodiscard]] inline std::array<std::uint8_t, HeaderSize> encode(const Header &header)
{
    std::array<std::uint8_t, HeaderSize> bytes{'H', 'S', header.type, header.control};
    put(header.parameter, bytes.data() + 4);
    put(header.length, bytes.data() + 8);
    return bytes;
}

/// False for bytes that are no header.
[[nodiscard]] inline bool decode(std::span<const std::uint8_t, HeaderSize> bytes, Header &header)
{
    header.type = bytes[2];
    header.control = bytes[3];
    header.parameter = get<std::uint32_t>(bytes.data() + 4);
    header.length = get<std::uint64_t>(bytes.data() + 8);
    return bytes[0] == 'H' && bytes[1] == 'S';
}

} // namespace protocols::hislip
