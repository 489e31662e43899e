// SPDX-License-Identifier: Apache-2.0
#include "SimulatorProcess.h"

#include <QElapsedTimer>
#include <QFile>

#include <csignal>

namespace {

constexpr int StartMilliseconds = 20000;

} // namespace

SimulatorProcess::~SimulatorProcess()
{
    if (m_process.state() != QProcess::NotRunning) {
        (void)stop(SIGTERM);
    }
}

bool SimulatorProcess::start(const QStringList &arguments, int instrumentCount)
{
    m_process.start(qEnvironmentVariable("CORVANE_BIN") + "/corvane-simulator", arguments);
    QElapsedTimer timer;
    timer.start();
    while (m_ready.size() < instrumentCount && timer.elapsed() < StartMilliseconds) {
        if (!m_process.canReadLine() && !m_process.waitForReadyRead(StartMilliseconds)) {
            break;
        }
        while (m_process.canReadLine()) {
            const QString line = QString::fromUtf8(m_process.readLine()).trimmed();
            if (line.startsWith("ready ")) {
                m_ready << line.mid(6);
            }
        }
    }
    if (m_ready.size() == instrumentCount) {
        return true;
    }
    if (m_process.error() == QProcess::FailedToStart) {
        m_errorOutput = m_process.program() + ": " + m_process.errorString();
    } else {
        m_process.waitForFinished(StartMilliseconds);
    }
    m_errorOutput += QString::fromUtf8(m_process.readAllStandardError());
    return false;
}

bool SimulatorProcess::startConfig(const QString &config, int instrumentCount)
{
    QFile file(path("simulator.ini"));
    if (!file.open(QIODevice::WriteOnly)) {
        return false;
    }
    file.write(QString(config).replace("%ROOT%", root()).toUtf8());
    file.close();
    return start({"--config", file.fileName()}, instrumentCount);
}

int SimulatorProcess::stop(int signalNumber)
{
    ::kill(static_cast<pid_t>(m_process.processId()), signalNumber);
    const bool ended = m_process.waitForFinished(StartMilliseconds);
    m_errorOutput += QString::fromUtf8(m_process.readAllStandardError());
    return ended && m_process.exitStatus() == QProcess::NormalExit ? m_process.exitCode() : -1;
}

quint16 SimulatorProcess::gatewayPort(int line) const
{
    return m_ready.value(line).section(' ', 0, 0).section(':', 1).toUShort();
}
