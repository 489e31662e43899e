// SPDX-License-Identifier: Apache-2.0
#include "CliOptions.h"
#include "Console.h"
#include "Presets.h"
#include "commands.h"

#include "jobs/CreateJob.h"

#include <limits>
#include <map>

namespace {

struct CreateArguments
{
    Console &console;
    CreateKind kind;
    CreateChoices choices;
    int ramp = 0;
    int scaling = 0;
    bool zeroCrest = false;
    std::optional<qint64> seed;
    std::map<const SignalField *, std::optional<double>> numbers;
    OutputArguments output;

    [[nodiscard]] double value(const SignalField &field) const
    {
        const auto found = numbers.find(&field);
        return found == numbers.end() ? field.start : found->second.value_or(field.start);
    }
};

int runCreate(CreateArguments &arguments)
{
    if (!mayWrite(arguments.console, arguments.output.options.fileName, arguments.output.force)) {
        return arguments.console.failed();
    }
    arguments.choices.ramp = static_cast<RampKind>(arguments.ramp);
    arguments.choices.customOversampling =
        arguments.numbers[&signalfields::oversampling].has_value();
    CreateRequest request;
    request.output = arguments.output.options;
    request.signal =
        makeSettings(arguments.kind, arguments.choices,
                     [&arguments](const SignalField &field) { return arguments.value(field); });
    request.minClockHz = arguments.value(signalfields::minClock);
    request.maxClockHz = arguments.value(signalfields::maxClock);
    request.clockHz = arguments.numbers[&signalfields::clockRate];
    request.autoScaling = arguments.scaling == 0;
    request.zeroCrest = arguments.zeroCrest;
    if (arguments.seed) {
        request.seed = static_cast<unsigned>(*arguments.seed);
    }
    CreateJob job(request);
    return arguments.console.run(job);
}

/// The number of a kind in the dialog's list of waveforms, by which it keeps the choice.
int mainChoice(CreateKind kind)
{
    switch (kind) {
    case CreateKind::Function:
        return 0;
    case CreateKind::Am:
        return 1;
    case CreateKind::Pm:
        return 2;
    case CreateKind::Fm:
        return 3;
    case CreateKind::Sweep:
        return 4;
    case CreateKind::MultiCarrier:
        return 5;
    case CreateKind::Pulse:
    case CreateKind::Chirp:
        return 6;
    case CreateKind::Noise:
        break;
    }
    return 7;
}

/// One kind of signal as a command, with the options that all kinds share.
class KindCommand
{
public:
    KindCommand(CommandSet &commands, CLI::App &create, const std::string &name, CreateKind kind,
                const std::string &help)
        : m_arguments(std::make_shared<CreateArguments>(CreateArguments{.console = commands.console,
                                                                        .kind = kind,
                                                                        .choices = {},
                                                                        .seed = {},
                                                                        .numbers = {},
                                                                        .output = {}}))
        , m_command(addCommand<CreateArguments>(create, name, help, commands.action, m_arguments,
                                                runCreate))
    {
        number("--min-clock", signalfields::minClock, SharedGroup);
        number("--max-clock", signalfields::maxClock, SharedGroup);
        addNumber(m_command, "--clock", m_arguments->numbers[&signalfields::clockRate],
                  rangeOf(signalfields::clockRate),
                  std::string("Clock written to the file (default: fitted). ") +
                      signalfields::clockRate.help)
            ->group(SharedGroup);
        addChoice(m_command, "--scaling", m_arguments->scaling, {"auto", "none"},
                  "Level scaling (default: auto)")
            ->group(SharedGroup);
        m_command
            .add_flag("--zero-crest", m_arguments->zeroCrest, "State a peak to RMS ratio of 0 dB")
            ->group(SharedGroup);
        addInteger(m_command, "--seed", m_arguments->seed,
                   {"", 0, static_cast<double>(std::numeric_limits<unsigned>::max())},
                   "Seed of random values, for repeatable signals (default: the time of day)")
            ->group(SharedGroup);
        addOutputArguments(m_command, m_arguments->output);
    }

    KindCommand &number(const std::string &name, const SignalField &field,
                        const char *group = "Options")
    {
        keep(name, field);
        addNumber(m_command, name, m_arguments->numbers[&field], rangeOf(field), helpOf(field))
            ->group(group);
        return *this;
    }

    /// A number of which only whole values make sense.
    KindCommand &count(const std::string &name, const SignalField &field)
    {
        keep(name, field);
        addInteger(m_command, name, m_arguments->numbers[&field], rangeOf(field), helpOf(field));
        return *this;
    }

    KindCommand &subKind(const std::string &name, const QStringList &names, const std::string &help)
    {
        addChoice(m_command, name, m_arguments->choices.subKind, names, help);
        m_kept.append(PresetField{.option = name,
                                  .key = "wv.sub",
                                  .names = names,
                                  .condition = {"wv.main", mainChoice(m_arguments->kind)}});
        return *this;
    }

    KindCommand &ramp()
    {
        const QStringList names{"linear", "rcos"};
        addChoice(m_command, "--ramp", m_arguments->ramp, names,
                  "Shape of the edges (default: linear)");
        const bool isChirp = m_arguments->kind == CreateKind::Chirp;
        m_kept +=
            {.option = "--ramp", .key = isChirp ? "chirp.ramp" : "pulse.ramp", .names = names};
        return *this;
    }

    KindCommand &randomPhase()
    {
        bool &isRandom = m_arguments->choices.randomPhase;
        m_command.add_flag("--random-phase,!--no-random-phase", isRandom,
                           "Give each carrier a random phase (default), or all the same one");
        m_kept.append(PresetField{.option = "--random-phase", .key = "mc.rndp"});
        return *this;
    }

    /// To be called behind all options: what is kept in presets.
    void presets(Presets &presets)
    {
        constexpr double Version = 1.0; // of the settings that the dialog keeps
        const bool isChirp = m_arguments->kind == CreateKind::Chirp;
        presets.add(m_command, "WvCreate", m_kept + presetTexts(),
                    {{"ver", Version},
                     {"wv.main", mainChoice(m_arguments->kind)},
                     {"wv.sub", isChirp ? 1 : 0}});
    }

private:
    /// Heads the options of all kinds.
    static constexpr const char *SharedGroup = "All kinds of signals";

    void keep(const std::string &name, const SignalField &field)
    {
        if (field.key == nullptr) {
            return;
        }
        PresetField kept{.option = name, .key = field.key, .unit = field.unit};
        if (&field == &signalfields::oversampling) {
            kept.condition = {"fn.overen", true};
        }
        m_kept.append(kept);
    }

    [[nodiscard]] static NumberRange rangeOf(const SignalField &field)
    {
        return {field.unit, field.min, field.max};
    }

    [[nodiscard]] static std::string helpOf(const SignalField &field)
    {
        const QString start = numberText(field.start, field.unit);
        const std::string text = field.help == nullptr ? field.text : field.help;
        return text + " (default: " + start.toStdString() + ")";
    }

    std::shared_ptr<CreateArguments> m_arguments;
    CLI::App &m_command;
    QList<PresetField> m_kept;
};

void addPeriodicKinds(CommandSet &commands, CLI::App &create)
{
    using namespace signalfields;
    KindCommand(commands, create, "function", CreateKind::Function, "Periodic function")
        .subKind("--shape", {"sine", "square", "triangular", "sawtooth"}, "Shape (default: sine)")
        .number("--freq", frequency)
        .number("--amp-i", amplitudeI)
        .number("--amp-q", amplitudeQ)
        .number("--offset-i", offsetI)
        .number("--offset-q", offsetQ)
        .number("--phase-q", phaseQ)
        .count("--oversampling", oversampling)
        .presets(commands.presets);
    KindCommand(commands, create, "multicarrier", CreateKind::MultiCarrier, "Many carriers")
        .number("--spacing", spacing)
        .count("--carriers", carriers)
        .number("--offset-i", carrierOffsetI)
        .randomPhase()
        .presets(commands.presets);
    KindCommand(commands, create, "noise", CreateKind::Noise, "Band-limited noise")
        .subKind("--color", {"white", "pink", "brown"}, "Colour (default: white)")
        .number("--bandwidth", noiseBandwidth)
        .number("--duration", noiseDuration)
        .presets(commands.presets);
}

void addPulseKinds(CommandSet &commands, CLI::App &create)
{
    using namespace signalfields;
    KindCommand(commands, create, "pulse", CreateKind::Pulse, "Single pulse")
        .number("--rise", pulseRise)
        .number("--on", pulseOn)
        .number("--fall", pulseFall)
        .number("--blank", pulseBlank)
        .ramp()
        .number("--resolution", pulseResolution)
        .presets(commands.presets);
    KindCommand(commands, create, "chirp", CreateKind::Chirp, "Pulse with a frequency ramp")
        .number("--rise", chirpRise)
        .number("--on", chirpOn)
        .number("--fall", chirpFall)
        .number("--blank", chirpBlank)
        .ramp()
        .number("--resolution", chirpResolution)
        .number("--range", chirpRange)
        .presets(commands.presets);
}

void addModulatedKinds(CommandSet &commands, CLI::App &create)
{
    using namespace signalfields;
    KindCommand(commands, create, "fm", CreateKind::Fm, "Frequency modulation by one or two tones")
        .subKind("--tones", {"1", "2"}, "Number of tones (default: 1)")
        .number("--freq", fmFrequency)
        .number("--dev", fmDeviation)
        .number("--freq2", fmFrequency2)
        .number("--dev2", fmDeviation2)
        .presets(commands.presets);
    KindCommand(commands, create, "sweep", CreateKind::Sweep, "Frequency sweep")
        .subKind("--shape", {"linear", "sine", "triangular"}, "Course (default: linear)")
        .number("--dev", sweepDeviation)
        .number("--time", sweepTime)
        .number("--start-phase", sweepStart)
        .number("--stop-phase", sweepStop)
        .presets(commands.presets);
    KindCommand(commands, create, "am", CreateKind::Am, "Amplitude modulation")
        .subKind("--mode",
                 {"regular", "lsb", "usb", "lsb+c", "usb+c", "lsb+usb", "2-tone", "2-tone-nc"},
                 "Mode (default: regular)")
        .number("--freq", amFrequency)
        .number("--depth", amDepth)
        .number("--freq2", amFrequency2)
        .number("--depth2", amDepth2)
        .presets(commands.presets);
    KindCommand(commands, create, "pm", CreateKind::Pm, "Phase modulation by a tone")
        .number("--freq", pmFrequency)
        .number("--dev", pmDeviation)
        .presets(commands.presets);
}

} // namespace

void addCreateCommands(CommandSet &commands)
{
    CLI::App *create = commands.app.add_subcommand("create", "Make a signal");
    create->require_subcommand(1);
    addPeriodicKinds(commands, *create);
    addPulseKinds(commands, *create);
    addModulatedKinds(commands, *create);
}
