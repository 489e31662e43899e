// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "OperationControl.h"

#include <QString>

struct InstrumentIdentity;
class VisaSession;

/// The times that a start takes part in, in ms.
struct ArbIntervals
{
    int second = 1000; ///< the unit of the longest wait, and of the progress without a coder
    int poll = 1000;   ///< between two looks at the instrument
    int settle = 250;  ///< from ready to switching on
};

/// Starts a waveform file on a generator. Lives for one operation of a session.
class ArbControl
{
public:
    ArbControl(VisaSession &session, const InstrumentIdentity &identity, OperationControl &control,
               const ArbIntervals &intervals);

    /// See VisaDevice::startArb.
    [[nodiscard]] bool start(const QString &path, int seconds);

    /// See VisaDevice::waitForArbReady.
    [[nodiscard]] bool waitUntilReady(int seconds);

private:
    enum class State { Busy, Ready, Unknown };
    [[nodiscard]] State readState(int &progress);

    VisaSession &m_session;
    const InstrumentIdentity &m_identity;
    OperationControl &m_control;
    ArbIntervals m_intervals;
};
