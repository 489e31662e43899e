// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "base/ProgressClock.h"

#include <QObject>

#include <atomic>

/// The progress of a reader and the wish to stop it. Its calls are synchronous, log why they fail,
/// and let the event loop run every 100 ms.
class ReadControl : public QObject
{
    Q_OBJECT

public slots:
    /// Ends the running call at its next tick.
    void cancel();

signals:
    void ProgressUpdate(int iPercentage);

protected:
    explicit ReadControl(QObject *parent);

    /// The clock of a call that begins; wishes to stop from before it are forgotten.
    [[nodiscard]] ProgressClock startProgress();

private:
    std::atomic<bool> m_cancelled{false};
};
