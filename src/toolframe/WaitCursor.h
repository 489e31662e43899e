// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <QGuiApplication>

/// Shows the wait cursor as long as it lives: for a call that blocks the window and can't be
/// cancelled.
class WaitCursor
{
public:
    WaitCursor() { QGuiApplication::setOverrideCursor(Qt::WaitCursor); }
    ~WaitCursor() { QGuiApplication::restoreOverrideCursor(); }
    Q_DISABLE_COPY_MOVE(WaitCursor)
};
