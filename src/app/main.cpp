// SPDX-License-Identifier: Apache-2.0
#include "AboutBox.h"
#include "MainWindow.h"
#include "ScreenshotRun.h"
#include "settingsstores.h"
#include "toolframe/pictures.h"

#include <QApplication>
#include <QIcon>

#include <cstdio>
#include <cstring>
#include <memory>

namespace {

constexpr const char *HelpText =
    "Usage: corvane [--debug] [--no-visa] [--help] [--version]\n"
    "\n"
    "The desktop workbench for arbitrary-waveform signal generators.\n"
    "\n"
    "  --debug                   show debug messages in the message log\n"
    "  --no-visa                 work with local files alone\n"
    "  --screenshot DIR [FILE]   save pictures of the windows, with FILE of all tools that\n"
    "                            take it, into a folder, and quit\n"
    "  --help                    show this text\n"
    "  --version                 show the version\n";

/// Switches that need neither settings nor a display. True if one was answered.
bool answerQuestions(int argc, char **argv)
{
    for (int i = 1; i < argc; ++i) {
        if (std::strcmp(argv[i], "--version") == 0) {
            std::printf("corvane %s\n", qPrintable(programVersion()));
            return true;
        }
        if (std::strcmp(argv[i], "--help") == 0) {
            std::fputs(HelpText, stdout);
            return true;
        }
    }
    return false;
}

QIcon programIcon()
{
    QIcon icon;
    for (const int size : {16, 32, 48, 64, 128, 256}) {
        icon.addFile(QString(":/program/corvane-%1.png").arg(size));
    }
    return icon;
}

} // namespace

int main(int argc, char **argv)
{
    if (answerQuestions(argc, argv)) {
        return 0;
    }
    QApplication::setEffectEnabled(Qt::UI_FadeTooltip, true);
    QApplication application(argc, argv);
    QApplication::setApplicationName("corvane");
    QApplication::setApplicationVersion(programVersion());
    registerPictures();
    QApplication::setWindowIcon(programIcon());

    const QStringList arguments = QApplication::arguments();
    const qsizetype screenshot = arguments.indexOf("--screenshot");
    const QString folder = screenshot < 0 ? QString() : arguments.value(screenshot + 1);
    if (!folder.isEmpty()) {
        ScreenshotRun::detachSettings();
    }
    const auto colorStore = openColorStore();
    auto *window = new MainWindow; // deletes itself when closed
    std::unique_ptr<ScreenshotRun> run;
    if (!folder.isEmpty()) {
        run = std::make_unique<ScreenshotRun>(*window, folder, arguments.value(screenshot + 2));
        QMetaObject::invokeMethod(run.get(), &ScreenshotRun::start, Qt::QueuedConnection);
    }
    window->show();
    return QApplication::exec();
}
