// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <QProcess>
#include <QString>
#include <QStringList>

/// One run of the built corvane-cli, in a folder of the test's choice.
struct CliRun
{
    int exitCode = -1;
    QByteArray output; ///< standard output
    QStringList lines; ///< standard error

    [[nodiscard]] QString lastLine() const { return lines.value(lines.size() - 1); }

    /// The program's file; CORVANE_BIN names its folder.
    static QString program() { return qEnvironmentVariable("CORVANE_BIN") + "/corvane-cli"; }

    static CliRun in(const QString &folder, const QStringList &arguments)
    {
        return of(folder, program(), arguments);
    }

    /// Through the shell, with "$CLI" for the program, to redirect or close its streams.
    static CliRun shell(const QString &folder, const QString &command)
    {
        qputenv("CLI", program().toLocal8Bit());
        return of(folder, "/bin/sh", {"-c", command});
    }

    static CliRun of(const QString &folder, const QString &file, const QStringList &arguments)
    {
        QProcess process;
        process.setWorkingDirectory(folder);
        process.start(file, arguments);
        CliRun run;
        if (process.waitForFinished(60000) && process.exitStatus() == QProcess::NormalExit) {
            run.exitCode = process.exitCode();
        }
        run.output = process.readAllStandardOutput();
        const QString errors = QString::fromUtf8(process.readAllStandardError());
        run.lines = errors.split('\n', Qt::SkipEmptyParts);
        return run;
    }
};
