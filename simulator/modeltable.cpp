// SPDX-License-Identifier: Apache-2.0
#include "modeltable.h"

#include <algorithm>
#include <array>

namespace simulator {
namespace {

constexpr std::string_view UserFolder = "/var/user";

constexpr ModelInfo coderOnDrive(std::string_view name, std::string_view options)
{
    return {.name = name, .roots = "D:", .coder = true, .defaultOptions = options};
}

constexpr ModelInfo plainOnDrive(std::string_view name, std::string_view options)
{
    return {.name = name, .roots = "D:", .defaultOptions = options};
}

constexpr ModelInfo plainOnUnix(std::string_view name, std::string_view options)
{
    return {.name = name, .unixPaths = true, .roots = UserFolder, .defaultOptions = options};
}

constexpr ModelInfo withoutFiles(std::string_view name, std::string_view options)
{
    return {.name = name, .defaultOptions = options};
}

constexpr ModelInfo analyzer(std::string_view name, std::string_view options, bool stepped = false)
{
    return {.name = name,
            .roots = "D:",
            .analyzer = true,
            .steppedSampleRate = stepped,
            .defaultOptions = options};
}

// The option that comes last is one that nobody asks for: controllers look for "-R13," with the
// comma, which the last option of an answer lacks.
constexpr std::array<ModelInfo, 28> Table{{
    coderOnDrive("TGX-830", "TGX830-R14,TGX830-P3,TGX830-K1"),
    coderOnDrive("TGX-810", "TGX810-R13,TGX810-R23,TGX810-P1,TGX810-P1,TGX810-K1"),
    coderOnDrive("TGX-820", "TGX820-R16,TGX820-R26,TGX820-P3,TGX820-P2,TGX820-K1"),
    plainOnUnix("TGX-840", "TGX840-K1"),
    plainOnDrive("TBX-310", "TBX300-P6,TBX300-K1"),
    withoutFiles("TQX-120", "TQX120-K1"),
    coderOnDrive("TBX-410", "TBX410-P1,TBX410-K1"),
    plainOnUnix("TGX-850", "TGX850-K1"),
    plainOnUnix("TGX-860", "TGX860-K1"),
    withoutFiles("TQX-110", "TQX110-K1"),
    plainOnDrive("TBX-320", "TBX300-P5,TBX300-K1"),
    {.name = "TGX-870",
     .unixPaths = true,
     .roots = UserFolder,
     .diskOption = "TGX870-P13",
     .coder = true,
     .defaultOptions = "TGX870-R16,TGX870-P9,TGX870-P10,TGX870-P13,TGX870-K1"},
    plainOnUnix("TGX-880", "TGX880-K1"),
    plainOnDrive("TCX-520", "TCX520-K1"),
    plainOnDrive("TCX-550", "TCX550-K1"),
    coderOnDrive("TVX", "TVX-K1"),
    coderOnDrive("TVX-710", "TVX710-K1"),
    analyzer("PAX-610", "PAX610-K1", true),
    analyzer("PAX-620", "PAX600-A1,PAX620-K1", true),
    analyzer("PAX-690", "PAX690-K1"),
    analyzer("PAX-630", "PAX600-A1,PAX600-D1,PAX630-K1"),
    analyzer("PAX-700", "PAX700-K1"),
    analyzer("PAX-680", "PAX600-A1,PAX600-D1,PAX680-K1"),
    analyzer("PAX-670", "PAX600-A1,PAX600-D1,PAX670-K1"),
    analyzer("PAX-660", "PAX600-A1,PAX660-K1"),
    analyzer("PAX-640", "PAX600-D1,PAX640-K1"),
    analyzer("PAX-650", "PAX650-K1"),
    {.name = "PAX-710", .roots = "D:|E:|F:", .defaultOptions = "PAX710-K1"},
}};

} // namespace

std::span<const ModelInfo> modelTable()
{
    return Table;
}

const ModelInfo *findModel(std::string_view name)
{
    const auto *found = std::find_if(Table.begin(), Table.end(),
                                     [name](const ModelInfo &model) { return model.name == name; });
    return found == Table.end() ? nullptr : found;
}

std::string modelNames()
{
    std::string names;
    for (const ModelInfo &model : Table) {
        if (!names.empty()) {
            names += ", ";
        }
        names += model.name;
    }
    return names;
}

std::vector<std::string> rootFolders(const ModelInfo &model, std::string_view options)
{
    std::vector<std::string> folders;
    std::string_view rest = model.roots;
    while (!rest.empty()) {
        const std::size_t length = std::min(rest.find('|'), rest.size());
        folders.emplace_back(rest.substr(0, length));
        rest.remove_prefix(std::min(length + 1, rest.size()));
    }
    if (!model.diskOption.empty() && options.find(model.diskOption) != std::string_view::npos) {
        folders.emplace_back("/hdd");
    }
    return folders;
}

} // namespace simulator
