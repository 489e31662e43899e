// SPDX-License-Identifier: Apache-2.0
#include "AboutBox.h"
#include "MainWindow.h"
#include "startup.h"

#include <QApplication>
#include <QCommandLineParser>
#include <QDir>
#include <QTimer>

#include <cstdio>

namespace {

/// Answers the switches that need neither settings nor a display. True if one was answered. The
/// others are read where they have an effect; what isn't known is passed over in silence.
bool answerQuestions(int argc, char **argv)
{
    const QCoreApplication application(argc, argv);
    const QCommandLineOption help("help", "Show this text.");
    const QCommandLineOption version("version", "Show the version.");
    QCommandLineParser parser;
    parser.setApplicationDescription(
        "The desktop workbench for arbitrary-waveform signal generators.");
    parser.addOptions({{"debug", "Show debug messages in the message log."},
                       {"no-visa", "Work with local files alone."},
                       {"no-multi-process", "Compose on one processor."},
                       help,
                       version});
    parser.addPositionalArgument("file", "Files to open, each in the tool for its type.",
                                 "[file...]");
    // False for what isn't known, which is no fault here.
    (void)parser.parse(QCoreApplication::arguments());
    if (parser.isSet(version)) {
        std::printf("corvane %s\n", qPrintable(programVersion()));
        return true;
    }
    if (parser.isSet(help)) {
        std::fputs(qPrintable(parser.helpText()), stdout);
        return true;
    }
    return false;
}

/// What isn't an option.
QStringList filesOf(const QStringList &arguments)
{
    QStringList files;
    bool onlyFiles = false;
    for (const QString &argument : arguments) {
        if (!onlyFiles && argument == "--") {
            onlyFiles = true;
        } else if (onlyFiles || !argument.startsWith('-')) {
            files.append(argument);
        }
    }
    return files;
}

} // namespace

int main(int argc, char **argv)
{
    if (answerQuestions(argc, argv)) {
        return 0;
    }
    QApplication::setEffectEnabled(Qt::UI_FadeTooltip, true);
    const QApplication application(argc, argv);
    const auto colorStore = prepareApplication();
    auto *window = new MainWindow; // deletes itself when closed
    window->show();
    const QStringList files = filesOf(QCoreApplication::arguments().mid(1));
    QTimer::singleShot(0, window, [window, files] {
        window->openFiles(files);
        window->modules().offerLeftWork(QDir::homePath() + '/');
    });
    return QApplication::exec();
}
