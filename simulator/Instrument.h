// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "Analyzer.h"
#include "Arb.h"
#include "CommandTable.h"
#include "ErrorQueue.h"
#include "Faults.h"
#include "MassMemory.h"
#include "StatusRegisters.h"
#include "modeltable.h"

#include <condition_variable>
#include <functional>
#include <map>
#include <memory>
#include <mutex>
#include <string>
#include <string_view>

namespace simulator {

class Link;
struct ProgramUnit;

/// What makes one instrument.
struct InstrumentSetup
{
    const ModelInfo *model = nullptr; ///< never null when an instrument is made
    std::string serial;
    std::string firmware;
    std::string options;
    std::string root; ///< folder of this machine; empty: a temporary one, removed at the end
    Faults faults;
    std::uint64_t seed = 1; ///< of the noise that an analyzer records
};

/// One simulated instrument: its state, and what its commands do to it.
///
/// Any number of links use it, each from a thread of its own; whoever touches it holds `mutex()`.
class Instrument
{
public:
    enum class Wait { Ready, TimedOut, Aborted, PeerGone, Stopped };

    explicit Instrument(InstrumentSetup setup);
    ~Instrument();
    Instrument(const Instrument &) = delete;
    Instrument &operator=(const Instrument &) = delete;

    /// Makes the folders of the mass memory. False with the reason in `error`.
    [[nodiscard]] bool start(std::string &error);

    /// Ends all waiting; calls of `wait…` return at once from now on. Any thread, without mutex.
    void stop();

    [[nodiscard]] std::mutex &mutex() { return m_mutex; }

    /// Carries out a unit whose nodes are those of its whole header.
    void execute(Link &link, const ProgramUnit &unit);

    /// Whether the block of this unit is the content of a file, and where it is to be written.
    [[nodiscard]] bool takesFile(const ProgramUnit &unit) const;
    [[nodiscard]] int openTransfer(const ProgramUnit &unit, std::unique_ptr<FileWriter> &writer);

    void reportError(int number, std::string_view detail = {});

    [[nodiscard]] bool isOperationPending(TimePoint now) const;

    /// Brings the condition registers and the *OPC bit up to the present.
    void refresh(TimePoint now);
    [[nodiscard]] unsigned statusByte(const Link &link);

    /// *RST and device clear.
    void reset();
    void clearPendingCompletion() { status.completionPending = false; }

    /// *TRG and the trigger of the transport.
    void trigger();

    /// Waits until bytes of the link's answer can be read. `peerGone` is asked a few times a
    /// second.
    [[nodiscard]] Wait waitForOutput(std::unique_lock<std::mutex> &lock, Link &link,
                                     TimePoint deadline, const std::function<bool()> &peerGone);

    /// Exclusive access by one link. `waitForAccess` returns Ready once no other link has it.
    [[nodiscard]] Wait waitForAccess(std::unique_lock<std::mutex> &lock, Link &link,
                                     TimePoint deadline, const std::function<bool()> &peerGone);
    void setAccess(const Link *link) { m_access = link; }
    [[nodiscard]] const Link *access() const { return m_access; }
    void releaseAccess();

    /// Wakes all that wait, to look again. Any thread.
    void notify() { m_changed.notify_all(); }

    [[nodiscard]] const InstrumentSetup &setup() const { return m_setup; }
    [[nodiscard]] const ModelInfo &model() const { return *m_setup.model; }
    [[nodiscard]] Faults &faults() { return m_setup.faults; }
    [[nodiscard]] std::string identification() const;

    /// The GPIB terminator setting: END alone ends a message, a line feed does not.
    [[nodiscard]] bool endsOnEoiOnly() const { return m_endsOnEoiOnly; }
    void setEndsOnEoiOnly(bool only) { m_endsOnEoiOnly = only; }

    ErrorQueue errors;
    StatusRegisters status;
    MassMemory memory;
    Arb arb;
    Analyzer analyzer;

    /// Plain settings that differ from their default, by the pattern of their command.
    std::map<std::string_view, double> numbers;
    std::map<std::string_view, std::string> words;

private:
    using Condition = std::function<bool(TimePoint now, TimePoint &wake)>;
    [[nodiscard]] Wait waitFor(std::unique_lock<std::mutex> &lock, Link &link, TimePoint deadline,
                               const std::function<bool()> &peerGone, const Condition &condition);
    [[nodiscard]] TimePoint operationEnd() const;

    InstrumentSetup m_setup;
    CommandTable m_commands;
    std::mutex m_mutex;
    std::condition_variable m_changed;
    const Link *m_access = nullptr;
    std::string m_temporaryFolder;
    bool m_endsOnEoiOnly = false;
    bool m_stopped = false;
};

} // namespace simulator
