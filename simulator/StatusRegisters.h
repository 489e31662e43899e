// SPDX-License-Identifier: Apache-2.0
#pragma once

namespace simulator {

/// Bits of the standard event status register, IEEE 488.2, 11.5.1.
enum EventStatus : unsigned {
    OperationComplete = 1,
    QueryError = 4,
    DeviceError = 8,
    ExecutionErrorBit = 16,
    CommandErrorBit = 32,
    PowerOn = 128,
};

/// Bits of the status byte, IEEE 488.2, 11.2 and SCPI-99, volume 1, 9.
enum StatusByte : unsigned {
    ErrorAvailable = 4,
    QuestionableSummary = 8,
    MessageAvailable = 16,
    EventSummary = 32,
    MasterSummary = 64,
    OperationSummary = 128,
};

/// Bits of the operation condition register, SCPI-99, volume 1, 9.3.
enum OperationCondition : unsigned {
    Settling = 2, ///< a waveform is being loaded
    Sweeping = 8,
    WaitingForTrigger = 32,
};

/// A condition register with its transition filters, event and enable registers.
class StatusGroup
{
public:
    /// Takes a new condition and latches its transitions.
    void setCondition(unsigned condition);

    [[nodiscard]] unsigned condition() const { return m_condition; }
    [[nodiscard]] unsigned takeEvents();
    [[nodiscard]] bool summary() const { return (m_events & enable) != 0; }
    void clearEvents() { m_events = 0; }

    /// STATus:PRESet.
    void preset();

    unsigned enable = 0;
    unsigned positive = Mask; ///< transitions to 1 that are latched
    unsigned negative = 0;    ///< transitions to 0 that are latched

    static constexpr unsigned Mask = 0x7FFF; ///< bit 15 is never used

private:
    unsigned m_condition = 0;
    unsigned m_events = 0;
};

/// The status reporting of an instrument.
struct StatusRegisters
{
    StatusGroup operation;
    StatusGroup questionable;
    unsigned events = PowerOn;      ///< ESR
    unsigned eventEnable = 0;       ///< ESE
    unsigned serviceEnable = 0;     ///< SRE
    bool completionPending = false; ///< *OPC waits for the pending operation

    /// Sets the bit of ESR that an entry of the error queue stands for.
    void noteError(int number);

    /// The status byte; the two arguments are the states of the error queue and of a link's output.
    [[nodiscard]] unsigned statusByte(bool errorAvailable, bool messageAvailable) const;

    /// *CLS, apart from the error queue.
    void clear();
};

} // namespace simulator
