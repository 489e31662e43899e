// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "InstrumentJob.h"

/// Sends a text to an instrument and reads the answer to a query.
class QueryJob final : public InstrumentJob
{
    Q_OBJECT

public:
    /// Of a command the answer isn't read, but the error queue is, unless an answer waits there.
    enum class Kind { Query, Command };

    QueryJob(InstrumentRef instrument, Kind kind, QString text, QObject *parent = nullptr);

    /// Also there when the instrument has complained besides.
    [[nodiscard]] const QString &answer() const { return m_answer; }

protected:
    [[nodiscard]] bool talk(VisaDevice &device) override;

private:
    Kind m_kind;
    QString m_text;
    QString m_answer;
};
