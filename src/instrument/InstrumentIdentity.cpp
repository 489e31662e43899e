// SPDX-License-Identifier: Apache-2.0
#include "InstrumentIdentity.h"

#include "log/Tracer.h"

namespace {

bool hasNoOptions(const QString &options, const char *reason)
{
    if (!options.isEmpty()) {
        return false;
    }
    Tracer::Trace(Tracer::Error, reason);
    Tracer::Trace(Tracer::Error, "No option information available.");
    return true;
}

} // namespace

bool InstrumentIdentity::identify()
{
    vendor = idn.section(',', 0, 0);
    model = idn.section(',', 1, 1);
    firmware = idn.section(',', 3, 3);
    if (!vendor.toUpper().contains("HALVORN")) {
        return Tracer::fail("This device is not a Halvorn instrument.");
    }
    modelIndex = findModel(model);
    if (modelIndex == NoModel) {
        return Tracer::fail(QString("The device '%1' is not supported.").arg(model));
    }
    serial = serialOf(modelIndex, idn.section(',', 2, 2));
    return true;
}

QString InstrumentIdentity::interfaceName() const
{
    return resource.contains("::") ? resource.section("::", 0, 0) : QString();
}

bool InstrumentIdentity::isUnixFileSystem() const
{
    const InstrumentModel *row = modelRow(modelIndex);
    return row != nullptr && row->unixFileSystem;
}

bool InstrumentIdentity::hasBasebandCoder() const
{
    const InstrumentModel *row = modelRow(modelIndex);
    return row != nullptr && row->basebandCoder;
}

bool InstrumentIdentity::isAnalyzer() const
{
    const InstrumentModel *row = modelRow(modelIndex);
    return row != nullptr && row->analyzer;
}

std::optional<FrequencyRange> InstrumentIdentity::rfRange(int path) const
{
    if (hasNoOptions(options, "Cannot determine instrument RF options.")) {
        return std::nullopt;
    }
    return rfRangeOf(modelIndex, options, path);
}

std::optional<BasebandLimits> InstrumentIdentity::baseband(int index) const
{
    if (hasNoOptions(options, "Cannot determine instrument baseband options.")) {
        return std::nullopt;
    }
    return basebandOf(modelIndex, options, index);
}
