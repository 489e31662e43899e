// SPDX-License-Identifier: Apache-2.0
#include "DlgBase.h"

DlgBase::DlgBase(QWidget *parent)
    : QDialog(parent)
{
    // Tools are windows beside the main window, some of them large: they can be maximised.
    setWindowFlags(Qt::Window | Qt::WindowTitleHint | Qt::WindowSystemMenuHint |
                   Qt::WindowMinMaxButtonsHint | Qt::WindowCloseButtonHint);
}

void DlgBase::instrumentsUpdated(const QList<InstrConfigEntry> & /*instruments*/) {}

void DlgBase::sendTargetChanged(const QString & /*instrument*/) {}

void DlgBase::writeSettings(QSettings & /*settings*/) {}

void DlgBase::readSettings(QSettings & /*settings*/) {}
