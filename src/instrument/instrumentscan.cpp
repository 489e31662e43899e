// SPDX-License-Identifier: Apache-2.0
#include "instrumentscan.h"

#include "OperationControl.h"
#include "VisaDevice.h"
#include "VisaSession.h"

#include "log/Tracer.h"

#include <QMutexLocker>

#include <algorithm>
#include <array>
#include <memory>

bool scanInstruments(QList<VisaDevice *> &found, int kind, const VisaSession &session,
                     OperationControl &control)
{
    if (kind != VisaDevice::ScanGpib && kind != VisaDevice::ScanUsb) {
        return Tracer::fail("Invalid remte control interface type.");
    }
    VisaLibrary &library = VisaLibrary::instance();
    const VisaFunctions *visa =
        library.functions(&VisaFunctions::viFindRsrc, &VisaFunctions::viFindNext);
    if (visa == nullptr) {
        return false;
    }
    Tracer::Trace(Tracer::Information, kind == VisaDevice::ScanGpib
                                           ? "Scanning for local GPIB devices..."
                                           : "Scanning for local USB devices...");
    // On USB the vendor number keeps other makers' devices out of the search.
    const char *expression =
        kind == VisaDevice::ScanGpib ? "GPIB?*INSTR" : "USB[0-9]::0x7FE3::?*INSTR";
    control.report(0);
    // Larger than the 256 characters that VISA promises not to exceed.
    std::array<char, 1024> text{};
    ViFindList list = VI_NULL;
    ViUInt32 count = 0;
    ViStatus status = VI_SUCCESS;
    {
        const QMutexLocker locker(&library.mutex);
        status = visa->viFindRsrc(library.manager, expression, &list, &count, text.data());
    }
    if (status == VI_ERROR_RSRC_NFOUND) {
        Tracer::Trace(Tracer::Information, "No devices found.");
        control.report(100);
        return true;
    }
    if (status != VI_SUCCESS) {
        Tracer::Trace(Tracer::Error, "No devices found. viFindRsrc() returned an error.");
        session.reportStatus(status);
        return false;
    }
    control.report(10);
    Tracer::Trace(Tracer::Information, QString("%1 resource(s) found. Evaluating...").arg(count));
    for (quint64 number = 1; status == VI_SUCCESS; ++number) {
        control.report(static_cast<int>(
            std::min<quint64>(100, 100 * number / std::max<ViUInt32>(count, 1) + 10)));
        text.back() = '\0';
        const QString resource = QString::fromLatin1(text.data());
        auto device = std::make_unique<VisaDevice>();
        if (device->isResourceOpenElsewhere(resource)) {
            // A second session might disturb the pane that works with it.
            Tracer::Trace(Tracer::Information,
                          QString("The device '%1' is in use and was not asked.").arg(resource));
        } else if (device->openResource(resource)) {
            device->closeResource();
            found.append(device.release());
        }
        if (control.cancelled) {
            return Tracer::fail("*** User break.");
        }
        status = visa->viFindNext(list, text.data());
    }
    control.report(100);
    return true;
}
