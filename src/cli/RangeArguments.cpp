// SPDX-License-Identifier: Apache-2.0
#include "RangeArguments.h"

#include "CliOptions.h"
#include "Console.h"

#include "wvfile/HvFileIO.h"

#include <QFile>

void addRange(CLI::App &command, SampleRange &range)
{
    range.fromName = "--from";
    range.countName = "--count";
    addText(command, "file", range.fileName, "Waveform file to read")->required();
    addInteger(command, "--from", range.from, {"", 0, MaxSamples - 1.0},
               "First sample, counted from 0");
    addInteger(command, "--count", range.count, {"", 1, double(MaxSamples)},
               "Number of samples (default: up to the end)");
}

std::optional<WvFileSummary> scanned(const QString &fileName)
{
    WvFileSummary summary;
    if (!QFile::exists(fileName) || !HvFileIO().readWaveformInfo(fileName, &summary)) {
        return std::nullopt;
    }
    return summary;
}

bool rangeFits(Console &console, const SampleRange &range, int &exitCode)
{
    if (!range.from && !range.count) {
        return true;
    }
    const std::optional<WvFileSummary> summary = scanned(range.fileName);
    if (!summary || summary->samples < 1) {
        return true;
    }
    const QString problem = rangeProblem(range, summary->samples);
    if (!problem.isEmpty()) {
        exitCode = console.wrongUsage(problem);
    }
    return problem.isEmpty();
}
