// SPDX-License-Identifier: Apache-2.0
#include "GeneratorJob.h"

#include "instrument/VisaDevice.h"

#include <utility>

GeneratorJob::GeneratorJob(InstrumentRef instrument, Operation operation, GeneratorChange change,
                           QObject *parent)
    : InstrumentJob(std::move(instrument),
                    operation == Operation::Read ? "Reading..." : "Sending...", parent)
    , m_operation(operation)
    , m_change(change)
{
}

bool GeneratorJob::talk(VisaDevice &device)
{
    if ((m_operation == Operation::Change && !device.changeState(m_change)) ||
        (m_operation == Operation::StopArb && !device.stopArb())) {
        return false;
    }
    return device.readState(m_state);
}
