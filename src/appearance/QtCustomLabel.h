// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <QLabel>

/// A label that looks like the display of an instrument. The style sheet knows it by its name.
class QtCustomLabel : public QLabel
{
    Q_OBJECT

public:
    explicit QtCustomLabel(QWidget *parent = nullptr);
};
