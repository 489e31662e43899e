// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <QFrame>

/// A thin line between two groups of controls. The style sheet knows it by its name.
class QtCustomHorLine : public QFrame
{
    Q_OBJECT

public:
    explicit QtCustomHorLine(QWidget *parent = nullptr);
};
