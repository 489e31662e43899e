// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <QByteArray>
#include <QtGlobal>

#include <span>

enum class MarkerAction { High, Low, Toggle, Pattern };

/// One change of marker traces over a range of samples.
struct MarkerEdit
{
    quint8 mask = 1;  ///< the traces concerned, bit 0 is marker 1
    qint64 first = 0; ///< sample, counted from 0
    qint64 last = 0;  ///< sample at or behind `first`, included
    MarkerAction action = MarkerAction::High;
    QByteArray pattern; ///< of Pattern: '0' and '1', one a sample, repeated from `first` on
};

/// Applies the part of an edit that lies in a block of marker bytes whose first one is that of
/// sample `position`. Toggle sets the first sample of the range, clears the second, and so on.
void applyMarkerEdit(const MarkerEdit &edit, qint64 position, std::span<quint8> markers);
