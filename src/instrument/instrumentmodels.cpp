// SPDX-License-Identifier: Apache-2.0
#include "instrumentmodels.h"

#include <QList>

#include <algorithm>
#include <array>
#include <initializer_list>

namespace {

constexpr std::array<InstrumentModel, 28> Models{{
    // name, Unix paths, roots, disk option, coder, reserved, analyzer
    {"TGX-830", false, "D:", "", true, false, false},
    {"TGX-810", false, "D:", "", true, false, false},
    {"TGX-820", false, "D:", "", true, false, false},
    {"TGX-840", true, "/var/user/", "", false, false, false},
    {"TBX-310", false, "D:", "", false, true, false},
    {"TQX-120", false, "", "", false, false, false},
    {"TBX-410", false, "D:", "", true, true, false},
    {"TGX-850", true, "/var/user/", "", false, false, false},
    {"TGX-860", true, "/var/user/", "", false, false, false},
    {"TQX-110", false, "", "", false, true, false},
    {"TBX-320", false, "D:", "", false, true, false},
    {"TGX-870", true, "/var/user/", "TGX870-P13", true, false, false},
    {"TGX-880", true, "/var/user/", "", false, false, false},
    {"TCX-520", false, "D:", "", false, true, false},
    {"TCX-550", false, "D:", "", false, true, false},
    {"TVX", false, "D:", "", true, true, false},
    {"TVX-710", false, "D:", "", true, true, false},
    {"PAX-610", false, "D:", "", false, false, true},
    {"PAX-620", false, "D:", "", false, false, true},
    {"PAX-690", false, "D:", "", false, false, true},
    {"PAX-630", false, "D:", "", false, false, true},
    {"PAX-700", false, "D:", "", false, false, true},
    {"PAX-680", false, "D:", "", false, false, true},
    {"PAX-670", false, "D:", "", false, false, true},
    {"PAX-660", false, "D:", "", false, false, true},
    {"PAX-640", false, "D:", "", false, false, true},
    {"PAX-650", false, "D:", "", false, false, true},
    {"PAX-710", false, "D:|E:|F:", "", false, true, false},
}};

/// Rows with capabilities of their own.
enum ModelRow : int {
    Tgx830 = 0,
    Tgx810 = 1,
    Tgx820 = 2,
    Tbx310 = 4,
    Tbx410 = 6,
    Tbx320 = 10,
    Tgx870 = 11,
};

struct OptionRange
{
    const char *option;
    FrequencyRange range;
};

std::optional<FrequencyRange> firstRange(const QString &options,
                                         std::initializer_list<OptionRange> ranges)
{
    for (const OptionRange &entry : ranges) {
        if (options.contains(QLatin1String(entry.option))) {
            return entry.range;
        }
    }
    return std::nullopt;
}

struct BasebandOption
{
    const char *text;
    int code;
};

// In the order of the search. Some texts hold the comma behind them, which keeps "-P1," from being
// found in "-P10,"; those of the last place in an answer have none.
constexpr std::array<BasebandOption, 21> BasebandOptions{{
    {"TGX810-P1,", 2},  {"TGX810-P2,", 1}, {"TGX810-P3,", 3},  {"TGX830-P1,", 2},
    {"TGX830-P2,", 1},  {"TGX830-P3,", 3}, {"TGX820-P1,", 2},  {"TGX820-P2,", 1},
    {"TGX820-P3,", 3},  {"TBX300-P4,", 4}, {"TBX300-P5,", 5},  {"TBX300-P6,", 6},
    {"TBX410-P1,", 2},  {"TBX410-P2,", 1}, {"TBX410-P3,", 3},  {"TGX870-P7,", 7},
    {"TGX870-P8,", 8},  {"TGX870-P9", 9},  {"TGX870-P10", 10}, {"TGX830-P11,", 11},
    {"TGX830-P12", 12},
}};

struct FoundBaseband
{
    qsizetype position = 0;
    int code = 0;
};

/// The at most two basebands that the options name, in the order in which they are named there.
QList<FoundBaseband> findBasebands(QString options)
{
    constexpr int MaxBasebands = 2;
    QList<FoundBaseband> found;
    for (int round = 0; round < MaxBasebands; ++round) {
        for (const BasebandOption &option : BasebandOptions) {
            const QLatin1String text(option.text);
            const qsizetype position = options.indexOf(text);
            if (position >= 0) {
                found.append({position, option.code});
                // Cut out, so that a second one of the same kind can be found.
                options.remove(position, text.size());
                break;
            }
        }
    }
    // Stable, since the cut may bring the second to the place of the first.
    std::stable_sort(
        found.begin(), found.end(),
        [](const FoundBaseband &a, const FoundBaseband &b) { return a.position < b.position; });
    return found;
}

struct MemorySize
{
    int code = 0;
    int samples = 0;
};

int sizeOf(int code, std::initializer_list<MemorySize> sizes)
{
    for (const MemorySize &entry : sizes) {
        if (entry.code == code) {
            return entry.samples;
        }
    }
    return 0;
}

} // namespace

int findModel(const QString &modelField)
{
    for (int row = 0; row < static_cast<int>(Models.size()); ++row) {
        if (modelField.contains(QLatin1String(modelRow(row)->name))) {
            return row;
        }
    }
    return NoModel;
}

const InstrumentModel *modelRow(int index)
{
    return index >= 0 && index < static_cast<int>(Models.size())
               ? &Models[static_cast<size_t>(index)]
               : nullptr;
}

QStringList rootsOf(int modelIndex, const QString &options)
{
    const InstrumentModel *model = modelRow(modelIndex);
    if (model == nullptr) {
        return {};
    }
    QStringList roots = QString(model->roots).split('|', Qt::SkipEmptyParts);
    const QLatin1String diskOption(model->diskOption);
    if (model->unixFileSystem && !diskOption.isEmpty() && options.contains(diskOption)) {
        roots.append("/hdd/");
    }
    return roots;
}

std::optional<FrequencyRange> rfRangeOf(int modelIndex, const QString &options, int path)
{
    constexpr double Low = 100e3;
    switch (modelIndex) {
    case Tgx830:
    case Tgx810:
    case Tgx820:
        if (path == 1) {
            return firstRange(options, {{"-R12,", {Low, 2.2e9}},
                                        {"-R13,", {Low, 3e9}},
                                        {"-R14,", {Low, 4e9}},
                                        {"-R16,", {Low, 6e9}}});
        }
        if (path == 2 && modelIndex != Tgx830) {
            return firstRange(
                options, {{"-R22,", {Low, 2.2e9}}, {"-R23,", {Low, 3e9}}, {"-R26,", {Low, 6e9}}});
        }
        break;
    case Tgx870:
        if (path == 1) {
            return firstRange(options, {{"-R13,", {9e3, 3e9}}, {"-R16,", {9e3, 6e9}}});
        }
        break;
    default:
        break;
    }
    return std::nullopt;
}

std::optional<BasebandLimits> basebandOf(int modelIndex, const QString &options, int baseband)
{
    const QList<FoundBaseband> found = findBasebands(options);
    if (baseband < 1 || baseband > found.size()) {
        return std::nullopt;
    }
    const int code = found.at(baseband - 1).code;
    switch (modelIndex) {
    case Tgx830:
    case Tgx810:
    case Tgx820:
    case Tbx410:
        return BasebandLimits{sizeOf(code, {{1, 16'777'216}, {2, 67'108'864}, {3, 134'217'728}}),
                              40'000'000, 100'000'000};
    case Tbx310:
    case Tbx320: {
        const int size = sizeOf(code, {{4, 268'435'456}, {5, 1'073'741'824}, {6, 536'870'912}});
        return modelIndex == Tbx310 ? BasebandLimits{size, 100'000'000, 300'000'000}
                                    : BasebandLimits{size, 264'000'000, 600'000'000};
    }
    case Tgx870: {
        if (baseband > 1) {
            return std::nullopt;
        }
        const bool isWide = code == 7 || code == 8;
        BasebandLimits limits =
            isWide ? BasebandLimits{33'554'432, 120'000'000, 150'000'000}
                   : BasebandLimits{sizeOf(code, {{9, 33'554'432}}), 60'000'000, 90'000'000};
        // The second option is the memory extension of the first.
        if (found.size() > 1 && found.at(1).code == 10) {
            limits.size = 268'435'456;
        }
        return limits;
    }
    default:
        return std::nullopt;
    }
}

std::optional<BasebandLimits> largestBasebandOf(int modelIndex)
{
    std::optional<BasebandLimits> largest;
    for (const BasebandOption &first : BasebandOptions) {
        for (const BasebandOption &second : BasebandOptions) {
            const QString options = QString("%1,%2,").arg(first.text, second.text);
            if (const auto limits = basebandOf(modelIndex, options, 1)) {
                BasebandLimits &widest = largest ? *largest : largest.emplace();
                widest.size = std::max(widest.size, limits->size);
                widest.clock = std::max(widest.clock, limits->clock);
                widest.bandwidth = std::max(widest.bandwidth, limits->bandwidth);
            }
        }
    }
    return largest;
}

QString serialOf(int modelIndex, const QString &field)
{
    const InstrumentModel *model = modelRow(modelIndex);
    const bool isAnalyzer = model != nullptr && model->analyzer;
    return field.section('/', isAnalyzer ? 0 : 1, isAnalyzer ? 0 : 1);
}
