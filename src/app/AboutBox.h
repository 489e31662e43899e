// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <QMessageBox>

/// Name, version and date of the program, its maker, and where its pictures come from.
class AboutBox : public QMessageBox
{
    Q_OBJECT

public:
    explicit AboutBox(QWidget *parent = nullptr);
};

/// Version of the program, "0.1.0".
[[nodiscard]] QString programVersion();
