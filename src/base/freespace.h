// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <QString>

/// Whether the disk behind a file, which need not be there yet, or a folder has room for so many
/// more bytes. False, with the reason logged, if not; a disk that doesn't tell passes.
[[nodiscard]] bool hasRoomFor(const QString &path, qint64 bytes);

/// The same for temporary files.
[[nodiscard]] bool hasTemporaryRoomFor(qint64 bytes);
