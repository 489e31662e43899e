// SPDX-License-Identifier: Apache-2.0
#include "QtCustomLabel.h"

QtCustomLabel::QtCustomLabel(QWidget *parent)
    : QLabel(parent)
{
}
