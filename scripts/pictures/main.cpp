// SPDX-License-Identifier: Apache-2.0
#include "ScreenshotRun.h"

#include "app/MainWindow.h"
#include "app/startup.h"
#include "appearance/ColorSet.h"
#include "appearance/StyleSheet.h"

#include <QApplication>
#include <QCommandLineParser>

#include <cstdio>

int main(int argc, char **argv)
{
    const QApplication application(argc, argv);
    QCommandLineParser parser;
    parser.setApplicationDescription("Saves pictures of the windows of corvane into FOLDER, with "
                                     "FILE of all tools that take it.");
    // The window reads these itself.
    parser.addOptions({{"debug", "As of corvane."}, {"no-visa", "As of corvane."}});
    const QCommandLineOption colors("colors", "Number of the color preset.", "N");
    parser.addOption(colors);
    parser.addHelpOption();
    parser.addPositionalArgument("FOLDER", "Made when missing.");
    parser.addPositionalArgument("FILE", "A waveform.", "[FILE]");
    parser.process(application);
    const QStringList arguments = parser.positionalArguments();
    if (arguments.isEmpty() || arguments.size() > 2) {
        std::fputs(qPrintable(parser.helpText()), stderr);
        return 2;
    }
    ScreenshotRun::detachSettings();
    const auto colorStore = prepareApplication();
    bool isPreset = false;
    const int preset = parser.value(colors).toInt(&isPreset);
    if (isPreset && preset >= 0 && preset < ColorPresetCount) {
        setColorPreset(static_cast<ColorPreset>(preset));
        applyColors();
    }
    auto *window = new MainWindow; // deletes itself when closed
    ScreenshotRun run(*window, arguments.at(0), arguments.value(1));
    QMetaObject::invokeMethod(&run, &ScreenshotRun::start, Qt::QueuedConnection);
    window->show();
    return QApplication::exec();
}
