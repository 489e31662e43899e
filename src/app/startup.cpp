// SPDX-License-Identifier: Apache-2.0
#include "startup.h"

#include "AboutBox.h"
#include "appearance/StyleSheet.h"
#include "settingsstores.h"
#include "toolframe/pictures.h"

#include <QApplication>
#include <QIcon>

namespace {

QIcon programIcon()
{
    QIcon icon;
    for (const int size : {16, 32, 48, 64, 128, 256}) {
        icon.addFile(QStringLiteral(":/program/corvane-%1.png").arg(size));
    }
    return icon;
}

} // namespace

std::unique_ptr<QSettings> prepareApplication()
{
    QApplication::setApplicationName("corvane");
    QApplication::setApplicationVersion(programVersion());
    QGuiApplication::setDesktopFileName("org.halvorn.corvane");
    registerPictures();
    QApplication::setWindowIcon(programIcon());
    auto colors = openColorStore();
    startColors(*colors);
    return colors;
}
