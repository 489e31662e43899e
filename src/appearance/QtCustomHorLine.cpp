// SPDX-License-Identifier: Apache-2.0
#include "QtCustomHorLine.h"

QtCustomHorLine::QtCustomHorLine(QWidget *parent)
    : QFrame(parent)
{
    setFrameShape(QFrame::HLine);
    setFixedHeight(1);
}
