// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "streams/levels.h"

#include <QObject>

#include <atomic>
#include <optional>

class BufferedIO;

/// Measures the levels of a range of samples of a data stream. Synchronous; lets the event loop run
/// every 100 ms.
class RangeMeter : public QObject
{
    Q_OBJECT

public:
    using QObject::QObject;

    /// Sums over `count` samples from sample `begin`, which lie in the stream. Nothing, with the
    /// reason logged, if they can't be read or the work was cancelled.
    [[nodiscard]] std::optional<LevelSums> measure(BufferedIO &data, qint64 begin, qint64 count);

public slots:
    void cancel();

signals:
    void ProgressUpdate(int iPercentage);

private:
    std::atomic<bool> m_cancelled{false};
};
