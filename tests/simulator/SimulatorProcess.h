// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <QProcess>
#include <QString>
#include <QStringList>
#include <QTemporaryDir>

/// The built corvane-simulator as a child process, with a folder of its own for its files.
class SimulatorProcess
{
public:
    ~SimulatorProcess();

    /// Starts the program and waits for one ready line for each of `instrumentCount` instruments.
    /// False when it ended instead; `errorOutput` then tells why.
    [[nodiscard]] bool start(const QStringList &arguments, int instrumentCount = 1);

    /// Starts instruments behind gateways from the text of a configuration; "%ROOT%" in it stands
    /// for the folder.
    [[nodiscard]] bool startConfig(const QString &config, int instrumentCount = 1);

    /// Ends the program by a signal and gives its exit status; -1 when it did not end properly.
    int stop(int signalNumber);

    /// The ready lines without their first word.
    [[nodiscard]] QStringList ready() const { return m_ready; }

    /// The port of a gateway's ready line "127.0.0.1:PORT gpib0,ADDRESS".
    [[nodiscard]] quint16 gatewayPort(int line = 0) const;

    [[nodiscard]] QString errorOutput() const { return m_errorOutput; }
    [[nodiscard]] int exitCode() const { return m_process.exitCode(); }
    [[nodiscard]] qint64 processId() const { return m_process.processId(); }
    [[nodiscard]] QString root() const { return m_folder.filePath("root"); }
    [[nodiscard]] QString path(const QString &name) const { return m_folder.filePath(name); }

private:
    QTemporaryDir m_folder;
    QProcess m_process;
    QStringList m_ready;
    QString m_errorOutput;
};
