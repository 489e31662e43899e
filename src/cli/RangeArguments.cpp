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

bool rangeFits(Console &console, const SampleRange &range, int &exitCode)
{
    WvFileSummary summary;
    if ((!range.from && !range.count) || !QFile::exists(range.fileName) ||
        !HvFileIO().readWaveformInfo(range.fileName, &summary) || summary.samples < 1) {
        return true;
    }
    const QString problem = rangeProblem(range, summary.samples);
    if (!problem.isEmpty()) {
        exitCode = console.wrongUsage(problem);
    }
    return problem.isEmpty();
}
