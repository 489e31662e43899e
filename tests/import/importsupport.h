// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "streams/TempStream.h"

#include <QProcess>
#include <QString>

#include <vector>

/// The floats that a data stream holds behind its head.
inline std::vector<float> floatsOf(TempStream &stream)
{
    std::vector<float> values;
    float value = 0;
    if (stream->checkHeader(BufferedIO::DataHeader)) {
        while (stream->readBlock(sizeof value, &value) == sizeof value) {
            values.push_back(value);
        }
    }
    return values;
}

/// Runs a script with Debian's own interpreter, whose packages the tests install, in a folder.
/// False, with its words in the test's log, if it fails.
[[nodiscard]] inline bool runPython(const QString &folder, const QString &script)
{
    QProcess python;
    python.setWorkingDirectory(folder);
    python.setProcessChannelMode(QProcess::ForwardedChannels);
    python.start("/usr/bin/python3", {"-c", "import numpy as np, scipy.io as io\n" + script});
    constexpr int patienceMs = 60000;
    return python.waitForFinished(patienceMs) && python.exitStatus() == QProcess::NormalExit &&
           python.exitCode() == 0;
}
