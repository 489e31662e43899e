// SPDX-License-Identifier: Apache-2.0
#include "PreviewRunner.h"

#include <QScopedValueRollback>

#include <utility>

PreviewRunner::PreviewRunner(std::function<void()> run, std::function<void()> cancel)
    : m_run(std::move(run))
    , m_cancel(std::move(cancel))
{
}

void PreviewRunner::request()
{
    if (m_running) {
        m_again = true;
        m_cancel();
        return;
    }
    const QScopedValueRollback<bool> running(m_running, true);
    do {
        m_again = false;
        m_run();
    } while (m_again);
}
