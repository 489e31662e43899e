// SPDX-License-Identifier: Apache-2.0
#include "Options.h"

#include "configfile.h"

#include <CLI/CLI.hpp>
#include <arpa/inet.h>

#include <algorithm>
#include <charconv>
#include <filesystem>
#include <utility>

namespace simulator {
namespace {

constexpr std::string_view DefaultModel = "TGX-870";
constexpr std::string_view DefaultSerial = "100001";
constexpr std::string_view DefaultFirmware = "1.0";
constexpr std::string_view DefaultAddress = "127.0.0.2";
constexpr std::uint64_t MaxPort = 65535;
constexpr std::uint64_t FirstFreePort = 1025;
constexpr std::uint64_t MaxGpib = 30;

std::optional<std::uint64_t> wholeNumber(std::string_view text)
{
    std::uint64_t value = 0;
    const auto result = std::from_chars(text.data(), text.data() + text.size(), value);
    if (text.empty() || result.ec != std::errc() || result.ptr != text.data() + text.size()) {
        return std::nullopt;
    }
    return value;
}

// The simulator writes files for whoever asks, so it answers on this machine alone.
bool isLoopback(const std::string &address)
{
    constexpr std::uint32_t LoopbackNet = 127;
    in_addr value{};
    return ::inet_pton(AF_INET, address.c_str(), &value) == 1 &&
           ntohl(value.s_addr) >> 24U == LoopbackNet;
}

// A field of *IDN?, whose separators must not stand in it.
bool isIdentityField(std::string_view text)
{
    return !text.empty() && std::all_of(text.begin(), text.end(), [](char byte) {
        return byte > ' ' && byte != ',' && byte != '/' && byte != '\x7F';
    });
}

bool isPrintable(std::string_view text)
{
    return std::none_of(text.begin(), text.end(), [](char byte) {
        return static_cast<unsigned char>(byte) < ' ' || byte == '\x7F';
    });
}

bool loadConfig(const std::string &name, Options &options, std::string &error)
{
    const std::optional<std::string> text = protocols::readTextFile(name);
    if (!text) {
        error = "cannot read the configuration file '" + name + "'";
        return false;
    }
    const auto fail = [&] {
        error = name + ": " + error;
        return false;
    };
    const auto entries = protocols::parseIni(*text, error);
    if (!entries) {
        return fail();
    }
    const std::string folder = std::filesystem::path(name).parent_path().string();
    auto instruments = instrumentsOf(*entries, folder, error);
    if (!instruments) {
        return fail();
    }
    options.instruments = std::move(*instruments);
    return true;
}

} // namespace

std::optional<InstrumentPlace> checkInstrument(const RawInstrument &raw, std::string &error)
{
    InstrumentPlace place;
    InstrumentSetup &setup = place.instrument;
    const auto refuse = [&](std::string_view name, const std::string &value,
                            std::string_view allowed) {
        error = raw.label + std::string(name) + " is '" + value + "'; " + std::string(allowed);
        return std::nullopt;
    };

    const std::string model = raw.model.value_or(std::string(DefaultModel));
    setup.model = findModel(model);
    if (setup.model == nullptr) {
        return refuse("model", model, "there are " + modelNames());
    }
    setup.serial = raw.serial.value_or(std::string(DefaultSerial));
    if (!isIdentityField(setup.serial)) {
        return refuse("serial", setup.serial, "it needs characters other than blank, ',' and '/'");
    }
    setup.firmware = raw.firmware.value_or(std::string(DefaultFirmware));
    if (!isIdentityField(setup.firmware)) {
        return refuse("firmware", setup.firmware,
                      "it needs characters other than blank, ',' and '/'");
    }
    setup.options = raw.options.value_or(std::string(setup.model->defaultOptions));
    if (!isPrintable(setup.options)) {
        return refuse("options", setup.options, "control characters are not allowed");
    }
    setup.root = raw.root.value_or(std::string());
    if (raw.root && raw.root->empty()) {
        return refuse("root", *raw.root, "it needs the name of a folder");
    }
    if (raw.seed) {
        const auto seed = wholeNumber(*raw.seed);
        if (!seed) {
            return refuse("seed", *raw.seed, "a whole number from 0 on is needed");
        }
        setup.seed = *seed;
    }
    for (const std::string &fault : raw.faults) {
        if (!setup.faults.set(fault, error)) {
            error.insert(0, raw.label);
            return std::nullopt;
        }
    }

    if (!raw.gateway) {
        place.address = raw.address.value_or(std::string(DefaultAddress));
        place.announce = raw.announce;
        if (!raw.announce && !isLoopback(place.address)) {
            return refuse("address", place.address,
                          "it has to be one of 127.0.0.0/8, unless --announce is given");
        }
        if (raw.gpib) {
            return refuse("gpib", *raw.gpib, "it goes with a gateway only");
        }
        return place;
    }
    if (raw.address) {
        return refuse("address", *raw.address, "it does not go with a gateway");
    }
    const auto port = wholeNumber(*raw.gateway);
    if (!port || *port > MaxPort || (*port != 0 && *port < FirstFreePort)) {
        return refuse("gateway", *raw.gateway,
                      "a port from 1025 to 65535, or 0 for any free one, is needed");
    }
    const auto gpib = wholeNumber(raw.gpib.value_or(std::string()));
    if (!gpib || *gpib > MaxGpib) {
        return refuse("gpib", raw.gpib.value_or(std::string()),
                      "a gateway's instrument needs an address from 0 to 30");
    }
    place.gateway = static_cast<std::uint16_t>(*port);
    place.gpib = static_cast<unsigned>(*gpib);
    return place;
}

std::optional<Options> parseOptions(std::vector<std::string> arguments, std::string &error)
{
    Options options;
    RawInstrument raw{.label = "--"};
    std::optional<std::string> config;

    CLI::App app("Answers like a bench instrument, on this machine alone.", "corvane-simulator");
    app.footer("Models:\n" + modelNames() + "\n\nFaults:\n" + Faults::help());
    app.set_version_flag("--version", "corvane-simulator " CORVANE_VERSION);
    app.add_flag("--verbose", options.verbose, "logs each command and answer");
    bool withoutHislip = false;
    app.add_flag("--no-hislip", withoutHislip, "leaves port 4880 alone");
    auto *file = app.add_option("--config", config,
                                "several instruments, one group of an INI file each, with the keys "
                                "model, serial, firmware, options, root, seed, fault, and either "
                                "address, or gateway (a port above 1024) and gpib (0 to 30)");
    struct Switch
    {
        const char *name;
        std::optional<std::string> &value;
        const char *help;
    };
    for (const Switch &one :
         {Switch{"--model", raw.model, "instrument model, default TGX-870"},
          Switch{"--serial", raw.serial, "serial number, default 100001"},
          Switch{"--firmware", raw.firmware, "firmware version, default 1.0"},
          Switch{"--options", raw.options, "answer to *OPT?, default that of the model"},
          Switch{"--address", raw.address,
                 "own address of 127.0.0.0/8, default 127.0.0.2; the ports 111, 4880 and 5025 "
                 "are opened there"},
          Switch{"--root", raw.root,
                 "folder that stands for the top of the file system, default a temporary one"},
          Switch{"--seed", raw.seed, "seed of the noise that an analyzer records, default 1"}}) {
        app.add_option(one.name, one.value, one.help)->excludes(file);
    }
    app.add_flag("--announce", raw.announce,
                 "answers searches of the network (VXI-11 broadcasts, multicast DNS) on the "
                 "interface of --address, which may be any address of this machine then")
        ->excludes(file);
    app.add_option("--fault", raw.faults, "NAME[=VALUE]: a fault to show; may be repeated")
        ->expected(1)
        ->take_all()
        ->excludes(file);

    try {
        // The parser takes them from the end.
        std::reverse(arguments.begin(), arguments.end());
        app.parse(std::move(arguments));
    } catch (const CLI::CallForVersion &version) {
        options.text = std::string(version.what()) + '\n';
        return options;
    } catch (const CLI::Success &) {
        options.text = app.help();
        return options;
    } catch (const CLI::ParseError &failure) {
        error = std::string(failure.what()) + "; see --help";
        return std::nullopt;
    }

    if (config) {
        if (!loadConfig(*config, options, error)) {
            return std::nullopt;
        }
        for (InstrumentPlace &place : options.instruments) {
            place.hislip = !withoutHislip;
        }
        return options;
    }
    std::optional<InstrumentPlace> place = checkInstrument(raw, error);
    if (!place) {
        return std::nullopt;
    }
    place->hislip = !withoutHislip;
    options.instruments.push_back(std::move(*place));
    return options;
}

} // namespace simulator
