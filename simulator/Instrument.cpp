// SPDX-License-Identifier: Apache-2.0
#include "Instrument.h"

#include "CommandContext.h"
#include "FileWriter.h"
#include "Link.h"
#include "ProgramUnit.h"

#include <algorithm>
#include <cerrno>
#include <cstdlib>
#include <filesystem>
#include <system_error>

namespace simulator {
namespace {

// So often a waiting reader looks whether its peer is still there.
constexpr std::chrono::milliseconds LookInterval{200};

Applies kindOf(const ModelInfo &model)
{
    if (model.analyzer) {
        return ToAnalyzer;
    }
    return model.coder ? ToGenerator : ToPlainGenerator;
}

} // namespace

Instrument::Instrument(InstrumentSetup setup)
    : memory(setup.model->unixPaths, rootFolders(*setup.model, setup.options))
    , analyzer(setup.model->steppedSampleRate, setup.seed)
    , m_setup(std::move(setup))
{
    for (const std::span<const Command> commands :
         {commonCommands(), systemCommands(), memoryCommands(), generatorCommands(),
          analyzerCommands(), settingCommands()}) {
        m_commands.add(commands, kindOf(model()));
    }
}

Instrument::~Instrument()
{
    if (!m_temporaryFolder.empty()) {
        std::error_code ignored;
        std::filesystem::remove_all(m_temporaryFolder, ignored);
    }
}

bool Instrument::start(std::string &error)
{
    std::string folder = m_setup.root;
    if (folder.empty()) {
        std::error_code failure;
        const std::filesystem::path base = std::filesystem::temp_directory_path(failure);
        folder = ((failure ? "/tmp" : base) / "corvane-simulator-XXXXXX").string();
        if (::mkdtemp(folder.data()) == nullptr) {
            error = "cannot make the temporary folder '" + folder +
                    "': " + std::generic_category().message(errno);
            return false;
        }
        m_temporaryFolder = folder;
    }
    if (!memory.open(folder, error)) {
        return false;
    }
    for (std::int64_t i = faults().number("queue").value_or(0); i > 0; --i) {
        reportError(SystemError);
    }
    return true;
}

void Instrument::stop()
{
    const std::lock_guard lock(m_mutex);
    m_stopped = true;
    m_changed.notify_all();
}

void Instrument::execute(Link &link, const ProgramUnit &unit)
{
    const CommandTable::Result found = m_commands.find(unit.nodes, unit.common);
    if (found.command == nullptr) {
        reportError(found.error);
        return;
    }
    const Command &command = *found.command;
    const CommandHandler handler = unit.query ? command.query : command.set;
    if (handler == nullptr) {
        reportError(UndefinedHeader);
        return;
    }
    const std::size_t count = unit.parameters.size();
    if (count > (unit.query ? command.maxQueryParameters : command.maxParameters)) {
        reportError(ParameterNotAllowed);
        return;
    }
    if (!unit.query && count < command.minParameters) {
        reportError(MissingParameter);
        return;
    }
    const TimePoint now = Clock::now();
    refresh(now);
    CommandContext context{*this, link, unit, command, now};
    handler(context);
    refresh(now);
    m_changed.notify_all();
}

bool Instrument::takesFile(const ProgramUnit &unit) const
{
    const CommandTable::Result found = m_commands.find(unit.nodes, unit.common);
    return found.command != nullptr && found.command->pattern == FileDataPattern && !unit.query &&
           unit.parameters.size() == 2 && unit.parameters.front().kind == Parameter::Kind::String;
}

int Instrument::openTransfer(const ProgramUnit &unit, std::unique_ptr<FileWriter> &writer)
{
    return memory.openForWriting(unit.parameters.front().text, writer);
}

void Instrument::reportError(int number, std::string_view detail)
{
    errors.push(number, detail);
    status.noteError(number);
}

bool Instrument::isOperationPending(TimePoint now) const
{
    return arb.isLoading(now) || analyzer.isPending(now);
}

TimePoint Instrument::operationEnd() const
{
    return std::max(arb.loadEnd(), analyzer.sweepEnd());
}

void Instrument::refresh(TimePoint now)
{
    unsigned condition = 0;
    if (arb.isLoading(now)) {
        condition |= Settling;
    }
    if (analyzer.isSweeping(now)) {
        condition |= Sweeping;
    }
    if (analyzer.isWaiting()) {
        condition |= WaitingForTrigger;
    }
    status.operation.setCondition(condition);
    if (status.completionPending && !isOperationPending(now)) {
        status.completionPending = false;
        status.events |= OperationComplete;
    }
}

unsigned Instrument::statusByte(const Link &link)
{
    refresh(Clock::now());
    return status.statusByte(!errors.isEmpty(), !link.output().isEmpty());
}

void Instrument::reset()
{
    arb.reset();
    analyzer.reset();
    memory.reset();
    numbers.clear();
    words.clear();
    m_endsOnEoiOnly = false;
    clearPendingCompletion();
}

void Instrument::trigger()
{
    analyzer.trigger(Clock::now());
    m_changed.notify_all();
}

void Instrument::releaseAccess()
{
    m_access = nullptr;
    m_changed.notify_all();
}

std::string Instrument::identification() const
{
    if (m_setup.faults.has("idn")) {
        return m_setup.faults.text("idn");
    }
    // Generators put the part number in front of the serial number, analyzers a variant behind it.
    std::string part(model().name);
    std::erase(part, '-');
    const std::string serial =
        model().analyzer ? m_setup.serial + "/01" : part + '/' + m_setup.serial + "/01";
    return "Halvorn," + std::string(model().name) + ',' + serial + ',' + m_setup.firmware;
}

Instrument::Wait Instrument::waitFor(std::unique_lock<std::mutex> &lock, Link &link,
                                     TimePoint deadline, const std::function<bool()> &peerGone,
                                     const Condition &condition)
{
    for (;;) {
        if (m_stopped) {
            return Wait::Stopped;
        }
        if (link.takeAbort()) {
            return Wait::Aborted;
        }
        const TimePoint now = Clock::now();
        TimePoint wake = std::min(deadline, now + LookInterval);
        if (condition(now, wake)) {
            return Wait::Ready;
        }
        if (now >= deadline) {
            return Wait::TimedOut;
        }
        if (peerGone()) {
            return Wait::PeerGone;
        }
        m_changed.wait_until(lock, wake);
    }
}

Instrument::Wait Instrument::waitForOutput(std::unique_lock<std::mutex> &lock, Link &link,
                                           TimePoint deadline,
                                           const std::function<bool()> &peerGone)
{
    return waitFor(lock, link, deadline, peerGone, [&](TimePoint now, TimePoint &wake) {
        TimePoint ready = link.output().readyTime();
        if (link.output().awaitsOperation()) {
            ready = std::max(ready, operationEnd());
        }
        wake = std::min(wake, ready);
        return now >= ready;
    });
}

Instrument::Wait Instrument::waitForAccess(std::unique_lock<std::mutex> &lock, Link &link,
                                           TimePoint deadline,
                                           const std::function<bool()> &peerGone)
{
    return waitFor(lock, link, deadline, peerGone, [&](TimePoint, TimePoint &) {
        return m_access == nullptr || m_access == &link;
    });
}

} // namespace simulator
