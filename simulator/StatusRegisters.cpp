// SPDX-License-Identifier: Apache-2.0
#include "StatusRegisters.h"

#include <utility>

namespace simulator {

void StatusGroup::setCondition(unsigned condition)
{
    const unsigned risen = condition & ~m_condition;
    const unsigned fallen = m_condition & ~condition;
    m_events |= (risen & positive) | (fallen & negative);
    m_condition = condition;
}

unsigned StatusGroup::takeEvents()
{
    return std::exchange(m_events, 0);
}

void StatusGroup::preset()
{
    enable = 0;
    positive = Mask;
    negative = 0;
}

void StatusRegisters::noteError(int number)
{
    // SCPI-99, volume 2, 21.8: each class of errors has its bit.
    if (number <= -400 && number > -500) {
        events |= QueryError;
    } else if (number <= -200 && number > -300) {
        events |= ExecutionErrorBit;
    } else if (number <= -100 && number > -200) {
        events |= CommandErrorBit;
    } else {
        events |= DeviceError;
    }
}

unsigned StatusRegisters::statusByte(bool errorAvailable, bool messageAvailable) const
{
    unsigned status = 0;
    if (errorAvailable) {
        status |= ErrorAvailable;
    }
    if (messageAvailable) {
        status |= MessageAvailable;
    }
    if (questionable.summary()) {
        status |= QuestionableSummary;
    }
    if (operation.summary()) {
        status |= OperationSummary;
    }
    if ((events & eventEnable) != 0) {
        status |= EventSummary;
    }
    if ((status & serviceEnable) != 0) {
        status |= MasterSummary;
    }
    return status;
}

void StatusRegisters::clear()
{
    events = 0;
    operation.clearEvents();
    questionable.clearEvents();
    completionPending = false;
}

} // namespace simulator
