// SPDX-License-Identifier: Apache-2.0
#include "Console.h"
#include "ImportArguments.h"
#include "commands.h"

#include "base/EngineeringNumber.h"
#include "import/MatFileAccess.h"
#include "import/RiqFileAccess.h"
#include "import/dataguess.h"
#include "jobs/DataImportJob.h"
#include "jobs/DirectoryJob.h"
#include "jobs/MatImportJob.h"
#include "jobs/RiqImportJob.h"
#include "jobs/WavImportJob.h"

#include <QJsonArray>
#include <QJsonDocument>
#include <QJsonObject>

#include <limits>

namespace {

int listWav(ImportArguments &arguments)
{
    WavFileAccess file;
    const std::optional<WavHeader> header = WavImportJob::readHeader(file, arguments.inputFile);
    if (!header) {
        return arguments.console.failed();
    }
    return printList(arguments,
                     QJsonDocument(QJsonObject{{"sampleRate", header->sampleRate},
                                               {"samples", header->samples()},
                                               {"playTime", header->playTime()},
                                               {"channels", header->channels},
                                               {"bits", header->bitsPerSample},
                                               {"float", header->isFloat}}),
                     QString("Sample Rate: %1\nSamples:     %2\nPlay Time:   %3\n"
                             "Channels:    %4\nBits:        %5%6\n")
                         .arg(engineeringText(header->sampleRate, "Hz"))
                         .arg(header->samples())
                         .arg(engineeringText(header->playTime(), "s"))
                         .arg(header->channels)
                         .arg(header->bitsPerSample)
                         .arg(header->isFloat ? ", float" : ""));
}

int runWav(ImportArguments &arguments)
{
    if (arguments.list) {
        return listWav(arguments);
    }
    int exitCode = ExitDone;
    if (!outputStands(arguments, exitCode)) {
        return exitCode;
    }
    WavImportJob job({.inputFile = arguments.inputFile,
                      .target = arguments.target(),
                      .clockFromFile = !arguments.clockHz.has_value()});
    return arguments.console.run(job);
}

/// Ends a command that leaves open which part of a file is meant, with the list of them.
int askForChoice(ImportArguments &arguments, const QString &list, const QString &reason)
{
    for (const QString &line : list.split('\n', Qt::SkipEmptyParts)) {
        arguments.console.error(line);
    }
    return arguments.console.wrongUsage(reason);
}

/// Opens a file and reads its directory; if that fails, `exitCode` tells how to end.
template <typename Reader>
bool readDirectory(ImportArguments &arguments, Reader &file, int &exitCode)
{
    if (!file.open(arguments.inputFile)) {
        arguments.console.error(QString("Cannot open file '%1'.").arg(arguments.inputFile));
        exitCode = arguments.console.failed();
        return false;
    }
    DirectoryJob<Reader> job(file, "Reading Directory...");
    exitCode = arguments.console.run(job);
    return exitCode == ExitDone;
}

struct MatArguments : ImportArguments
{
    using ImportArguments::ImportArguments;
    QString variable;
};

QString matText(const QList<MatEntry> &entries)
{
    QString text;
    for (const MatEntry &entry : entries) {
        text += QString("%1  %2%3  %4 x %5  %6\n")
                    .arg(entry.name.isEmpty() ? "(no name)" : entry.name,
                         entry.complex ? "Complex " : "", entry.className())
                    .arg(entry.dimensions[0])
                    .arg(entry.dimensions[1])
                    .arg(entry.obstacle().isEmpty() ? "usable" : entry.obstacle());
    }
    return text;
}

int listMat(MatArguments &arguments, const QList<MatEntry> &entries)
{
    QJsonArray array;
    for (const MatEntry &entry : entries) {
        array.append(QJsonObject{{"name", entry.name},
                                 {"class", entry.className()},
                                 {"complex", entry.complex},
                                 {"rows", entry.dimensions[0]},
                                 {"columns", entry.dimensions[1]},
                                 {"usable", entry.obstacle().isEmpty()},
                                 {"reason", entry.obstacle()}});
    }
    return printList(arguments, QJsonDocument(array), matText(entries));
}

/// The variables of the file; nothing if it can't be read.
std::optional<QList<MatEntry>> variablesOf(MatArguments &arguments, int &exitCode)
{
    MatFileAccess file;
    if (!readDirectory(arguments, file, exitCode)) {
        return std::nullopt;
    }
    QList<MatEntry> entries = file.directory();
    entries.removeIf([](const MatEntry &entry) { return !entry.isShown(); });
    return entries;
}

/// Without a name the only variable that can be imported is meant. False if there isn't just one.
bool chooseVariable(MatArguments &arguments, int &exitCode)
{
    const std::optional<QList<MatEntry>> variables = variablesOf(arguments, exitCode);
    if (!variables) {
        return false;
    }
    QList<MatEntry> entries = *variables;
    entries.removeIf([](const MatEntry &entry) { return !entry.obstacle().isEmpty(); });
    if (entries.size() == 1) {
        arguments.variable = entries.first().name;
        return true;
    }
    exitCode = askForChoice(
        arguments, matText(*variables),
        QString("--variable is required: the file holds %1 variables that can be imported")
            .arg(entries.size()));
    return false;
}

int runMat(MatArguments &arguments)
{
    int exitCode = ExitDone;
    if (arguments.list) {
        const std::optional<QList<MatEntry>> entries = variablesOf(arguments, exitCode);
        return entries ? listMat(arguments, *entries) : exitCode;
    }
    if (!arguments.clockHz) {
        return arguments.console.wrongUsage("--clock is required");
    }
    if (!outputStands(arguments, exitCode) ||
        (arguments.variable.isEmpty() && !chooseVariable(arguments, exitCode))) {
        return exitCode;
    }
    MatImportJob job({.inputFile = arguments.inputFile,
                      .variable = arguments.variable,
                      .target = arguments.target()});
    return arguments.console.run(job);
}

struct RiqArguments : ImportArguments
{
    using ImportArguments::ImportArguments;
    std::optional<qint64> packet;
};

QString riqText(const QList<RiqEntry> &entries)
{
    QString text;
    for (qsizetype i = 0; i < entries.size(); ++i) {
        const RiqEntry &entry = entries[i];
        text += QString("Packet %1: %2 samples, %3 blocks, %4, IF %5, bandwidth %6, %7, %8\n")
                    .arg(i + 1)
                    .arg(entry.samples)
                    .arg(entry.blocks)
                    .arg(engineeringText(entry.sampleRate, "Hz"),
                         engineeringText(entry.ifFrequency, "Hz"),
                         engineeringText(entry.ifBandwidth, "Hz"),
                         engineeringText(entry.playTime(), "s"),
                         entry.timeStamp.toString(Qt::ISODateWithMs));
    }
    return text;
}

int listRiq(RiqArguments &arguments, const QList<RiqEntry> &entries)
{
    QJsonArray array;
    for (qsizetype i = 0; i < entries.size(); ++i) {
        const RiqEntry &entry = entries[i];
        array.append(QJsonObject{{"packet", i + 1},
                                 {"samples", entry.samples},
                                 {"sampleRate", entry.sampleRate},
                                 {"ifFrequency", entry.ifFrequency},
                                 {"bandwidth", entry.ifBandwidth},
                                 {"playTime", entry.playTime()},
                                 {"blocks", static_cast<qint64>(entry.blocks)},
                                 {"timeStamp", entry.timeStamp.toString(Qt::ISODateWithMs)}});
    }
    return printList(arguments, QJsonDocument(array), riqText(entries));
}

/// The packet that is meant; nothing if that isn't clear.
std::optional<int> chosenPacket(RiqArguments &arguments, const QList<RiqEntry> &entries,
                                int &exitCode)
{
    if (entries.isEmpty()) {
        arguments.console.error("The file holds no packets.");
        exitCode = arguments.console.failed();
        return std::nullopt;
    }
    if (!arguments.packet && entries.size() > 1) {
        exitCode = askForChoice(
            arguments, riqText(entries),
            QString("--packet is required: the file holds %1 packets").arg(entries.size()));
        return std::nullopt;
    }
    const qint64 packet = arguments.packet.value_or(1);
    if (packet > entries.size()) {
        exitCode = arguments.console.wrongUsage(
            QString("--packet: '%1' is out of range; permitted: 1 to %2")
                .arg(packet)
                .arg(entries.size()));
        return std::nullopt;
    }
    return static_cast<int>(packet);
}

int runRiq(RiqArguments &arguments)
{
    int exitCode = ExitDone;
    RiqFileAccess file;
    if (!arguments.list && !outputStands(arguments, exitCode)) {
        return exitCode;
    }
    if (!readDirectory(arguments, file, exitCode)) {
        return exitCode;
    }
    if (arguments.list) {
        return listRiq(arguments, file.entries());
    }
    const std::optional<int> packet = chosenPacket(arguments, file.entries(), exitCode);
    if (!packet) {
        return exitCode;
    }
    RiqImportJob job(file, {.packet = *packet,
                            .target = arguments.target(),
                            .clockFromFile = !arguments.clockHz.has_value()});
    return arguments.console.run(job);
}

struct DataArguments : ImportArguments
{
    using ImportArguments::ImportArguments;
    QString secondFile;
    QString preset;
    QString savedPreset;
    bool text = false;
    bool binary = false;
    bool isSigned = false;
    bool isUnsigned = false;
    bool bigEndian = false;
    int format = 0;
    int bits = 0;
    CLI::Option *formatOption = nullptr;
    CLI::Option *bitsOption = nullptr;
    std::optional<qint64> limit;
};

/// Puts the options that were given over the settings of the preset.
void applyOptions(const DataArguments &arguments, ImportPreset &preset)
{
    WvImportJob &job = preset.job;
    if (arguments.text || arguments.binary) {
        job.binary = arguments.binary;
    }
    job.file1 = arguments.inputFile;
    job.file2 = arguments.secondFile;
    job.useFile2 = !arguments.secondFile.isEmpty();
    ValueFormat &format = job.format;
    if (*arguments.formatOption) {
        format.dataFormat = static_cast<DataFormat>(arguments.format);
        // As in the form, rational numbers have no 16 bits.
        if (!*arguments.bitsOption && arguments.preset.isEmpty()) {
            format.precision = format.dataFormat == DataFormat::Rational ? DataPrecision::Bits32
                                                                         : DataPrecision::Bits16;
        }
    }
    if (*arguments.bitsOption) {
        format.precision = static_cast<DataPrecision>(arguments.bits);
    }
    if (arguments.isSigned || arguments.isUnsigned) {
        format.isSigned = arguments.isSigned;
    } else if (arguments.preset.isEmpty()) {
        // As in the form, where decimal text starts signed and all else unsigned.
        format.isSigned = !job.binary && format.dataFormat != DataFormat::Hexadecimal;
    }
    format.bigEndian = format.bigEndian || arguments.bigEndian;
    if (*arguments.scalingOption || arguments.preset.isEmpty()) {
        job.scaling = static_cast<ImportScaling>(arguments.scaling);
    }
}

int runData(DataArguments &arguments)
{
    Console &console = arguments.console;
    ImportPreset preset;
    if (!arguments.preset.isEmpty() && !loadPreset(arguments.preset, preset)) {
        return console.failed();
    }
    int exitCode = ExitDone;
    if (!outputStands(arguments, exitCode)) {
        return exitCode;
    }
    if (!arguments.text && !arguments.binary && arguments.preset.isEmpty()) {
        DataGuess guess;
        if (!guessData(arguments.inputFile, guess)) {
            return console.failed();
        }
        preset.job.binary = guess.binary;
    }
    applyOptions(arguments, preset);
    const bool hasClock = arguments.clockHz || !arguments.preset.isEmpty();
    if (!hasClock && preset.job.binary) {
        return console.wrongUsage("--clock is required");
    }
    DataImportRequest request;
    request.input = preset.job;
    request.target = arguments.target();
    request.target.clockHz = arguments.clockHz.value_or(hasClock ? preset.clockHz : 0);
    if (!arguments.preset.isEmpty()) {
        OutputOptions &output = request.target.output;
        output.comment = output.comment ? output.comment : preset.comment;
        output.copyright = output.copyright ? output.copyright : preset.copyright;
    }
    request.clockFromFile = !arguments.clockHz;
    request.limit = arguments.limit.value_or(0);
    DataImportJob job(request);
    exitCode = console.run(job);
    if (exitCode == ExitDone && !arguments.savedPreset.isEmpty()) {
        preset.outputFile = request.target.output.fileName;
        preset.comment = request.target.output.comment.value_or(QString());
        preset.copyright = request.target.output.copyright.value_or(QString());
        preset.clockHz = job.clockHz();
        exitCode = savePreset(arguments.savedPreset, preset) ? ExitDone : console.failed();
    }
    return exitCode;
}

void addDataCommand(CLI::App &import, CommandSet &commands)
{
    auto data = std::make_shared<DataArguments>(commands.console);
    CLI::App &command =
        addCommand<DataArguments>(import, "data", "Import numbers from text or raw binary files",
                                  commands.action, data, runData);
    addImportOptions(command, *data, "File with I and Q, or with I alone",
                     " (default: what a CLOCKRATE line or the preset says)");
    addText(command, "file2", data->secondFile, "File with Q");
    CLI::Option *text = command.add_flag("--text", data->text, "Numbers as text, a sample a line");
    command.add_flag("--binary", data->binary, "Raw numbers")->excludes(text);
    data->formatOption =
        addChoice(command, "--format", data->format, {"integer", "rational", "hex"},
                  "Kind of the numbers (default: integer)");
    data->bitsOption = addChoice(command, "--bits", data->bits, {"8", "14", "16", "32", "64"},
                                 "Width of a number (default: 16, of rational ones 32)");
    CLI::Option *isSigned = command.add_flag("--signed", data->isSigned,
                                             "Signed numbers (the default of decimal text)");
    command.add_flag("--unsigned", data->isUnsigned, "Unsigned numbers")->excludes(isSigned);
    command.add_flag("--big-endian", data->bigEndian, "Binary: most significant byte first");
    addText(command, "--preset", data->preset,
            "Settings as saved by the dialog or --save-preset; "
            "options given win")
        ->type_name("FILE")
        ->group("Presets");
    addText(command, "--save-preset", data->savedPreset, "File to save the settings in")
        ->type_name("FILE")
        ->group("Presets");
    addInteger(command, "--limit", data->limit,
               {{}, 1, static_cast<double>(std::numeric_limits<int>::max())},
               "Stop after this many samples");
}

void addMatCommand(CLI::App &import, CommandSet &commands)
{
    auto mat = std::make_shared<MatArguments>(commands.console);
    CLI::App &command = addCommand<MatArguments>(
        import, "mat", "Import a complex vector from a MATLAB level 5 file", commands.action, mat,
        runMat);
    addImportOptions(command, *mat, "MATLAB file to read", " (required)");
    addText(command, "--variable", mat->variable,
            "Name of the vector (default: the only one that can be imported)");
    addListOptions(command, *mat);
    addImportPresets(command, commands, "Mat2Wv");
}

void addRiqCommand(CLI::App &import, CommandSet &commands)
{
    auto riq = std::make_shared<RiqArguments>(commands.console);
    CLI::App &command = addCommand<RiqArguments>(
        import, "riq", "Import a packet from a .riq recording", commands.action, riq, runRiq);
    addImportOptions(command, *riq, "Recording to read", " (default: the packet's sample rate)");
    addInteger(command, "--packet", riq->packet,
               {{}, 1, static_cast<double>(std::numeric_limits<int>::max())},
               "Number of the packet, from 1 (default: the only one)");
    addListOptions(command, *riq);
    addImportPresets(command, commands, "Riq2Wv");
}

void addWavCommand(CLI::App &import, CommandSet &commands)
{
    auto wav = std::make_shared<ImportArguments>(commands.console);
    CLI::App &command = addCommand<ImportArguments>(
        import, "wav", "Import a WAVE file: I is the left or only channel, Q the right one",
        commands.action, wav, runWav);
    addImportOptions(command, *wav, "WAVE file to read", " (default: the file's sample rate)");
    addListOptions(command, *wav);
    addImportPresets(command, commands, "Wav2Wv");
}

} // namespace

void addImportCommands(CommandSet &commands)
{
    CLI::App *import = commands.app.add_subcommand("import", "Make a waveform from other data");
    import->require_subcommand(1);
    addDataCommand(*import, commands);
    addMatCommand(*import, commands);
    addRiqCommand(*import, commands);
    addWavCommand(*import, commands);
    addSigmfCommand(*import, commands);
}
