// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <atomic>
#include <functional>

/// How a long operation on an instrument tells its progress and learns that it is to stop. Shared
/// by all operations of one device, of which one runs at a time.
struct OperationControl
{
    /// Takes the progress in percent. Never empty.
    std::function<void(int percent)> report;

    /// Set by a slot while the operation lets events through, or by another thread. An operation
    /// starts with the flag cleared.
    std::atomic<bool> cancelled{false};

    /// Whether the user's input is let through while an instrument is being opened, since nothing
    /// but a cancel can come of it.
    bool takesInput = false;
};
