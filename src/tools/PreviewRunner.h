// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <functional>

/// Runs the preview of a form. A preview lets the event loop run, so that a value may change while
/// one is running: that one is then cancelled, and the next one takes the new values.
class PreviewRunner
{
public:
    PreviewRunner(std::function<void()> run, std::function<void()> cancel);

    /// Makes the preview; from within a running one: makes it again.
    void request();

    [[nodiscard]] bool isRunning() const { return m_running; }

private:
    std::function<void()> m_run;
    std::function<void()> m_cancel;
    bool m_running = false;
    bool m_again = false;
};
