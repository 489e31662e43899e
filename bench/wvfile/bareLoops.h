// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <QtGlobal>

#include <string>

/// The yardsticks: plain loops of read(2), convert and write(2) in blocks of 1 MiB, with no tags,
/// no markers, no levels, no progress. Each writes a new file `target` and returns the number of
/// samples that went through, -1 on a failure of the system.

/// 16-bit words, from `offset` of the source on, to floats.
qint64 bareDecode(const std::string &source, qint64 offset, qint64 samples,
                  const std::string &target);

/// Floats, from `offset` of the source on, to 16-bit words.
qint64 bareEncode(const std::string &source, qint64 offset, qint64 samples,
                  const std::string &target);
