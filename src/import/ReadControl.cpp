// SPDX-License-Identifier: Apache-2.0
#include "ReadControl.h"

ReadControl::ReadControl(QObject *parent)
    : QObject(parent)
{
}

void ReadControl::cancel()
{
    m_cancelled = true;
}

ProgressClock ReadControl::startProgress()
{
    m_cancelled = false;
    return ProgressClock([this](int percent) { emit ProgressUpdate(percent); }, m_cancelled);
}
