// SPDX-License-Identifier: Apache-2.0
#include "FileAccess.h"

#include <QFileInfo>

FileAccess::FileAccess(QObject *parent)
    : ReadControl(parent)
{
}

bool FileAccess::open(const QString &fileName)
{
    close();
    if (!fileName.isEmpty()) {
        m_file.setFileName(fileName);
        forget();
    }
    // A pipe or a device may never end; the readers walk through files that can be searched.
    if (!QFileInfo(m_file.fileName()).isFile() || !m_file.open(QIODevice::ReadOnly)) {
        return false;
    }
    m_device = &m_file;
    return true;
}

void FileAccess::open(QIODevice &device)
{
    close();
    forget();
    m_device = &device;
}

void FileAccess::close()
{
    m_file.close();
    m_device = nullptr;
}
