// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "SourceWaveform.h"
#include "ToolJob.h"

#include <QString>

#include <optional>

/// A range of samples of a file, counted from 0.
struct SampleRange
{
    QString fileName;
    std::optional<qint64> from;  ///< nothing: the first sample
    std::optional<qint64> count; ///< nothing: up to the end

    /// What the user knows the two numbers by, for a refusal.
    QString fromName = "First sample";
    QString countName = "Sample count";
};

/// Why the range doesn't lie in a file of so many samples; empty if it does.
[[nodiscard]] QString rangeProblem(const SampleRange &range, qint64 samples);

/// Base of the jobs that look at a range of a file's samples: reads the file, then hands over.
class SampleReadJob : public ToolJob
{
    Q_OBJECT

public:
    explicit SampleReadJob(SampleRange range, QObject *parent = nullptr);

protected:
    /// Works on `count` samples from sample `begin`, which lie in the source.
    [[nodiscard]] virtual bool process(SourceWaveform &source, qint64 begin, qint64 count) = 0;

private:
    [[nodiscard]] bool work() final;

    SampleRange m_range;
    SourceWaveform m_source;
};
