// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <QDialog>

/// The guide: pages for tasks, which lie in the program, so that no network is needed.
class GuideWindow : public QDialog
{
    Q_OBJECT

public:
    explicit GuideWindow(QWidget *parent = nullptr);
};
