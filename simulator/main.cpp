// SPDX-License-Identifier: Apache-2.0
#include "Log.h"
#include "Options.h"
#include "Simulator.h"

#include <pthread.h>

#include <csignal>
#include <cstdio>
#include <cstdlib>
#include <string>
#include <vector>

namespace {

constexpr int WrongUsage = 2;

void print(const std::string &text)
{
    (void)std::fwrite(text.data(), 1, text.size(), stdout);
    (void)std::fflush(stdout);
}

} // namespace

int main(int argc, char **argv)
{
    using simulator::Options;

    const std::vector<std::string> arguments(argv + 1, argv + argc);
    std::string error;
    const std::optional<Options> options = simulator::parseOptions(arguments, error);
    if (!options) {
        simulator::Log::error(error);
        return WrongUsage;
    }
    if (!options->text.empty()) {
        print(options->text);
        return EXIT_SUCCESS;
    }
    simulator::Log::setVerbose(options->verbose);

    // Blocked before any thread is made, so that only the wait below sees them.
    sigset_t signals;
    sigemptyset(&signals);
    sigaddset(&signals, SIGINT);
    sigaddset(&signals, SIGTERM);
    pthread_sigmask(SIG_BLOCK, &signals, nullptr);
    (void)std::signal(SIGPIPE, SIG_IGN);

    simulator::Simulator instruments;
    if (!instruments.start(options->instruments, error)) {
        simulator::Log::error(error);
        return EXIT_FAILURE;
    }
    for (const std::string &line : instruments.readyLines()) {
        print(line + '\n');
    }

    int received = 0;
    (void)sigwait(&signals, &received);
    instruments.stop();
    return EXIT_SUCCESS;
}
