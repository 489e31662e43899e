// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "InstrumentJob.h"

#include "instrument/GeneratorControl.h"

/// Reads what a generator does, after a change of it if there is one.
class GeneratorJob final : public InstrumentJob
{
    Q_OBJECT

public:
    enum class Operation {
        Read,
        Change,  ///< the RF side
        StopArb, ///< the RF side stays as it is
    };

    GeneratorJob(InstrumentRef instrument, Operation operation, GeneratorChange change = {},
                 QObject *parent = nullptr);

    /// As it is after the operation.
    [[nodiscard]] const GeneratorState &state() const { return m_state; }

protected:
    [[nodiscard]] bool talk(VisaDevice &device) override;

private:
    Operation m_operation;
    GeneratorChange m_change;
    GeneratorState m_state;
};
