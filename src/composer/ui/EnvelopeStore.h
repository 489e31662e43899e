// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "wvfile/HvFileIO.h"

#include <QHash>
#include <QObject>
#include <QSet>
#include <QString>
#include <QThreadPool>

#include <array>
#include <memory>

/// The outline of a source file: its largest magnitude in each of a fixed number of stretches.
struct Envelope
{
    static constexpr int BinCount = 512;

    std::array<float, BinCount> peaks{}; ///< of full scale 1
    qint64 samples = 0;

    /// The largest magnitude of the source samples from `from` to before `to`.
    [[nodiscard]] float peak(double from, double to) const;
};

/// Outlines of the files that are shown, read in the background one after the other. Files that
/// can't be read have none.
class EnvelopeStore : public QObject
{
    Q_OBJECT

public:
    explicit EnvelopeStore(QObject *parent = nullptr);
    /// Ends the reading.
    ~EnvelopeStore() override;

    /// The outline of a file; null until it has been read, which the first call asks for.
    [[nodiscard]] const Envelope *find(const QString &fileName);

signals:
    /// A further outline is there.
    void changed();

private:
    void read(const QString &fileName);

    QHash<QString, Envelope> m_envelopes;
    QSet<QString> m_requested;
    HvFileIO m_file; // read from by the one thread of the pool
    std::atomic<bool> m_ending{false};
    QThreadPool m_pool;
};
