// SPDX-License-Identifier: Apache-2.0
#include "AboutBox.h"

#include <QIcon>

AboutBox::AboutBox(QWidget *parent)
    : QMessageBox(parent)
{
    setWindowTitle(parent ? parent->window()->windowTitle() : "HV Corvane");
    setTextFormat(Qt::RichText);
    setIconPixmap(QIcon(":/program/corvane-256.png").pixmap(96, 96));
    setText(QString("<h2>HV Corvane</h2>"
                    "<h4>Version %1, %2</h4>"
                    "<p>The desktop workbench for<br/>"
                    "arbitrary-waveform signal generators.</p>"
                    "<p>Made by the Corvane developers, Halvorn.<br/>"
                    "Apache License 2.0.</p>"
                    "<p>Icons: drawings of the project's own.</p>")
                .arg(programVersion(), CORVANE_BUILD_DATE));
    setStandardButtons(QMessageBox::Close);
    setEscapeButton(QMessageBox::Close);
}

QString programVersion()
{
    return CORVANE_VERSION;
}
