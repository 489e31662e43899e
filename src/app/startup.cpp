// SPDX-License-Identifier: Apache-2.0
#include "startup.h"

#include "AboutBox.h"
#include "appearance/StyleSheet.h"
#include "settingsstores.h"

#include <QApplication>
#include <QIcon>

// Outside the namespace, as the macro wants it.
static void initPictures()
{
    Q_INIT_RESOURCE(program);
}

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
    initPictures();
    QApplication::setWindowIcon(programIcon());
    auto colors = openColorStore();
    startColors(*colors);
    return colors;
}
