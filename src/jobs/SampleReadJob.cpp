// SPDX-License-Identifier: Apache-2.0
#include "SampleReadJob.h"

#include "log/Tracer.h"

#include <utility>

QString rangeProblem(const SampleRange &range, qint64 samples)
{
    const qint64 from = range.from.value_or(0);
    if (from < 0 || from >= samples) {
        return QString("%1: %2 lies outside the file; permitted: 0 to %3")
            .arg(range.fromName)
            .arg(from)
            .arg(samples - 1);
    }
    const qint64 count = range.count.value_or(samples - from);
    if (count < 1 || count > samples - from) {
        return QString("%1: %2 leads outside the file; permitted: 1 to %3")
            .arg(range.countName)
            .arg(count)
            .arg(samples - from);
    }
    return {};
}

SampleReadJob::SampleReadJob(SampleRange range, QObject *parent)
    : ToolJob(parent)
    , m_range(std::move(range))
{
}

bool SampleReadJob::work()
{
    if (!m_source.read(*this, m_range.fileName, SampleReading::Located)) {
        return false;
    }
    const qint64 samples = m_source.info().samples;
    const QString problem = rangeProblem(m_range, samples);
    if (!problem.isEmpty()) {
        return Tracer::fail(problem);
    }
    const qint64 begin = m_range.from.value_or(0);
    return mayProceed() && process(m_source, begin, m_range.count.value_or(samples - begin));
}
