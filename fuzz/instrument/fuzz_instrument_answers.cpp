// SPDX-License-Identifier: Apache-2.0
// What an instrument answers: who it is, its options, and the catalogue of a folder, one a line.
#include "instrument/instrumentmodels.h"
#include "instrument/instrumenttext.h"
#include "instrument/remotepaths.h"
#include "support/fuzzcheck.h"

#include <cstdint>
#include <string_view>

namespace {

QString takeLine(std::string_view &text)
{
    const std::string_view line = text.substr(0, text.find('\n'));
    text.remove_prefix(std::min(line.size() + 1, text.size()));
    const QString answer = fromInstrument(line.data(), static_cast<quint32>(line.size()));
    require(!answer.contains(QChar(0)) && answer == answer.simplified());
    return answer;
}

void checkIdentity(const QString &idn, const QString &options)
{
    const QStringList fields = idn.split(',');
    const int model = findModel(fields.value(1));
    const InstrumentModel *row = modelRow(model);
    require((row == nullptr) == (model == NoModel));
    require(row == nullptr || fields.value(1).contains(row->name));
    require(serialOf(model, fields.value(2)).size() <= fields.value(2).size());
    for (const QString &root : rootsOf(model, options)) {
        require(!root.isEmpty());
    }
    for (const int place : {1, 2}) {
        const std::optional<FrequencyRange> range = rfRangeOf(model, options, place);
        require(!range || (range->lower >= 0 && range->lower < range->upper));
        const std::optional<BasebandLimits> limits = basebandOf(model, options, place);
        // An option of another model says nothing of the size.
        require(!limits || (limits->size >= 0 && limits->clock > 0 && limits->bandwidth > 0));
    }
}

void checkCatalogue(const QString &answer)
{
    qsizetype used = 0;
    for (const RemoteFileEntry &entry : parseCatalogue(answer)) {
        require(!entry.name.isEmpty() && !entry.name.startsWith('.') && !entry.type.isEmpty());
        require(!entry.name.contains('"') && !entry.type.contains(','));
        used += entry.name.size() + entry.type.size();
        const QString path = joinRemotePath("/var/user/", entry.name, '/');
        // An apostrophe is doubled when the path is quoted.
        require(!path.contains('\\') && path.startsWith("/var/user/"));
        const RemotePath parts = splitPath(path);
        require(parts.directory + parts.fileName == path);
    }
    require(used <= answer.size());
}

} // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t *data, std::size_t size)
{
    std::string_view text(reinterpret_cast<const char *>(data), size);
    const QString idn = takeLine(text);
    const QString options = takeLine(text);
    checkIdentity(idn, options);
    checkCatalogue(takeLine(text));
    (void)takeErrors();
    return 0;
}
