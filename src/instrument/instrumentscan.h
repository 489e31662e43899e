// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <QList>

class VisaDevice;
class VisaSession;
struct OperationControl;

/// See VisaDevice::scanResources. The session need not be open; it gives the library's words.
[[nodiscard]] bool scanInstruments(QList<VisaDevice *> &found, int kind, const VisaSession &session,
                                   OperationControl &control);
