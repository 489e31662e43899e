// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <QList>
#include <QMetaType>

/// One sample of a waveform, full scale 1.
struct IqSample
{
    double i = 0;
    double q = 0;

    friend bool operator==(const IqSample &, const IqSample &) = default;
};

using IqList = QList<IqSample>;

Q_DECLARE_TYPEINFO(IqSample, Q_PRIMITIVE_TYPE);
Q_DECLARE_METATYPE(IqSample)
