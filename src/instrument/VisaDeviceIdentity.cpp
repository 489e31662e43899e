// SPDX-License-Identifier: Apache-2.0
// What kind of instrument this is, what it can do, and which are there.
#include "VisaDevice.h"

#include "CancelScope.h"
#include "VisaLibrary.h"
#include "instrumentmodels.h"

#include "log/Tracer.h"

#include <QMutexLocker>

#include <algorithm>
#include <array>
#include <memory>

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

QString VisaDevice::interfaceName() const
{
    return m_resource.contains("::") ? m_resource.section("::", 0, 0) : QString();
}

bool VisaDevice::isUnixFileSystem() const
{
    const InstrumentModel *model = modelRow(m_modelIndex);
    return model != nullptr && model->unixFileSystem;
}

QChar VisaDevice::pathSeparator() const
{
    return isUnixFileSystem() ? '/' : '\\';
}

bool VisaDevice::hasBasebandCoder() const
{
    const InstrumentModel *model = modelRow(m_modelIndex);
    return model != nullptr && model->basebandCoder;
}

bool VisaDevice::isAnalyzer() const
{
    const InstrumentModel *model = modelRow(m_modelIndex);
    return model != nullptr && model->analyzer;
}

QStringList VisaDevice::rootDirectories() const
{
    return rootsOf(m_modelIndex, m_opt);
}

bool VisaDevice::rfFrequencyRange(int path, double &lower, double &upper) const
{
    if (hasNoOptions(m_opt, "Cannot determine instrument RF options.")) {
        return false;
    }
    const std::optional<FrequencyRange> range = rfRangeOf(m_modelIndex, m_opt, path);
    if (range) {
        lower = range->lower;
        upper = range->upper;
    }
    return range.has_value();
}

bool VisaDevice::basebandCapabilities(int index, int &size, int &clock, int &bandwidth) const
{
    if (hasNoOptions(m_opt, "Cannot determine instrument baseband options.")) {
        return false;
    }
    const std::optional<BasebandLimits> limits = basebandOf(m_modelIndex, m_opt, index);
    if (limits) {
        size = limits->size;
        clock = limits->clock;
        bandwidth = limits->bandwidth;
    }
    return limits.has_value();
}

bool VisaDevice::scanResources(QList<VisaDevice *> &found, int kind)
{
    if (kind != ScanGpib && kind != ScanUsb) {
        return Tracer::fail("Invalid remte control interface type.");
    }
    VisaLibrary &library = VisaLibrary::instance();
    const VisaFunctions *visa =
        library.functions(&VisaFunctions::viFindRsrc, &VisaFunctions::viFindNext);
    if (visa == nullptr) {
        return false;
    }
    const CancelScope cancelScope(m_cancelRequested);
    Tracer::Trace(Tracer::Information, kind == ScanGpib ? "Scanning for local GPIB devices..."
                                                        : "Scanning for local USB devices...");
    // On USB the vendor number keeps other makers' devices out of the search.
    const char *expression = kind == ScanGpib ? "GPIB?*INSTR" : "USB[0-9]::0x7FE3::?*INSTR";
    emit ProgressUpdate(0);
    // Larger than the 256 characters that VISA promises not to exceed.
    std::array<char, 1024> text{};
    ViFindList list = VI_NULL;
    ViUInt32 count = 0;
    ViStatus status = VI_SUCCESS;
    {
        const QMutexLocker locker(&library.mutex);
        status = visa->viFindRsrc(library.manager, expression, &list, &count, text.data());
    }
    if (status != VI_SUCCESS) {
        Tracer::Trace(Tracer::Error, "No devices found. viFindRsrc() returned an error.");
        reportStatus(status);
        return false;
    }
    emit ProgressUpdate(10);
    Tracer::Trace(Tracer::Information, QString("%1 resource(s) found. Evaluating...").arg(count));
    for (quint64 number = 1; status == VI_SUCCESS; ++number) {
        emit ProgressUpdate(static_cast<int>(
            std::min<quint64>(100, 100 * number / std::max<ViUInt32>(count, 1) + 10)));
        text.back() = '\0';
        auto device = std::make_unique<VisaDevice>();
        if (device->openResource(QString::fromLatin1(text.data()))) {
            device->closeResource();
            found.append(device.release());
        }
        if (m_cancelRequested) {
            return Tracer::fail("*** User break.");
        }
        status = visa->viFindNext(list, text.data());
    }
    emit ProgressUpdate(100);
    return true;
}
