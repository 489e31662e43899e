// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <QObject>
#include <QString>

#include <atomic>
#include <functional>
#include <span>

class BufferedIO;

/// The stream processor of the tools: passes over whole data streams ("IQF" and float I/Q records).
///
/// An object serves one thread at a time and works on the calling one, which lets its event loop
/// run every 100 ms. Streams belong to the caller and must outlive the call. A pass that fails has
/// logged the reason at error level and leaves its output as far as it got, to be thrown away.
class Resample : public QObject
{
    Q_OBJECT

public:
    explicit Resample(QObject *parent = nullptr);

    /// Multiplies the first `samples` samples by the factor, in place, in single precision. What
    /// was written has reached the device after the next restart of the stream.
    [[nodiscard]] bool rescale(int samples, double factor, BufferedIO *stream);

    /// Measures the linear peak and RMS of the vectors of the first `samples` samples. Both
    /// outputs are set on success only.
    [[nodiscard]] bool statistics(int samples, BufferedIO *stream, double *peak, double *rms);

public slots:
    /// Makes the running pass fail within 100 ms. Each pass starts with the wish cleared. May be
    /// called from any thread.
    void cancel();

signals:
    /// Progress of the running pass, not more often than every 100 ms.
    void ProgressUpdate(int iPercentage);

private:
    using BlockWork = std::function<void(std::span<float>)>;

    /// Runs the work over the first `samples` samples, block by block, and writes them back.
    [[nodiscard]] bool transformInPlace(int samples, BufferedIO *stream, const BlockWork &work);

    std::atomic<bool> m_cancelled = false;
};
