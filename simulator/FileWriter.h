// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "UniqueFd.h"

#include <cstddef>
#include <span>
#include <vector>

namespace simulator {

/// Writes one file in big pieces.
class FileWriter
{
public:
    explicit FileWriter(UniqueFd fd);
    ~FileWriter();
    FileWriter(const FileWriter &) = delete;
    FileWriter &operator=(const FileWriter &) = delete;

    /// Appends bytes; after a failure the rest is swallowed and `finish` tells.
    void write(std::span<const char> bytes);

    /// Writes what is buffered. Returns the SCPI error of the whole work, 0 for none.
    [[nodiscard]] int finish();

private:
    void writeOut(std::span<const char> bytes);

    UniqueFd m_fd;
    std::vector<char> m_buffer;
    std::size_t m_used = 0;
    int m_error = 0;
};

} // namespace simulator
