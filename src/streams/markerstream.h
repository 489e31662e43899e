// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <QtGlobal>

class BufferedIO;

/// A file may state marker positions for fewer samples than it has: the stream then goes on with
/// its last byte, so that each of `samples` samples has markers to be carried on. The stream is at
/// its start before and after. False, with the reason logged, if that fails.
[[nodiscard]] bool completeMarkers(BufferedIO &stream, qint64 samples);
