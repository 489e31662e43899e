// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "ToolJob.h"

#include <QString>

/// Reads the directory of a file of samples, as a job that shows its progress and can be stopped.
/// `Reader` is one of the readers with readDirectory().
template <typename Reader>
class DirectoryJob : public ToolJob
{
public:
    /// The reader has its file open and outlives the job; it holds the directory afterwards.
    DirectoryJob(Reader &reader, QString label)
        : m_reader(reader)
        , m_label(std::move(label))
    {
    }

private:
    [[nodiscard]] bool work() override
    {
        const JobStep step(*this, m_label, m_reader);
        return m_reader.readDirectory();
    }

    Reader &m_reader;
    QString m_label;
};
