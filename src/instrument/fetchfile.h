// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <QString>

class VisaDevice;

/// Copies a file from the instrument by way of a new file beside the local one, which it replaces
/// only when all went well: after a failure or a cancel there is no part of a file, and a file that
/// was there before is as it was. Something other than a plain file, such as a pipe, is written to
/// directly.
[[nodiscard]] bool fetchRemoteFile(VisaDevice &device, const QString &remotePath,
                                   const QString &localPath);
