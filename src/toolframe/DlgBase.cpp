// SPDX-License-Identifier: Apache-2.0
#include "DlgBase.h"

#include "pictures.h"

DlgBase::DlgBase(QWidget *parent)
    : QDialog(parent)
{
    registerPictures();
    // Tools are windows beside the main window, some of them large: they can be maximised.
    setWindowFlags(Qt::Window | Qt::WindowTitleHint | Qt::WindowSystemMenuHint |
                   Qt::WindowMinMaxButtonsHint | Qt::WindowCloseButtonHint);
}

bool DlgBase::startModule(const QString & /*path*/)
{
    return false;
}

QString DlgBase::moduleName() const
{
    return {};
}

QString DlgBase::menuPath() const
{
    return {};
}

bool DlgBase::sourceAllowed(bool local) const
{
    return local;
}

bool DlgBase::selectionAllowed(bool isFile) const
{
    return isFile;
}

bool DlgBase::extensionAllowed(const QString & /*upperCaseExtension*/) const
{
    return false;
}

void DlgBase::instrumentsUpdated(const QList<InstrConfigEntry> & /*instruments*/) {}

void DlgBase::writeSettings(QSettings & /*settings*/) {}

void DlgBase::readSettings(QSettings & /*settings*/) {}
