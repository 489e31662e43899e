// SPDX-License-Identifier: Apache-2.0
#include "FileIcons.h"

#include <QFileInfo>
#include <QStringList>

QIcon FileIcons::picture(const QString &name)
{
    QIcon icon(":/icons16/" + name + ".png");
    icon.addFile(":/icons32/" + name + ".png");
    return icon;
}

FileIcons::FileIcons()
    : m_drive(picture("drive"))
    , m_folder(picture("folder"))
    , m_waveform(picture("file_waveform"))
    , m_text(picture("file_ascii"))
    , m_settings(picture("file_settings"))
    , m_binary(picture("file_binary"))
{
}

QIcon FileIcons::icon(IconType type) const
{
    switch (type) {
    case Folder:
        return m_folder;
    case File:
        return m_binary;
    default:
        return m_drive;
    }
}

QIcon FileIcons::icon(const QFileInfo &info) const
{
    static const QStringList textTypes{"txt", "csv", "asc", "log", "md"};
    static const QStringList settingsTypes{"ini", "cms", "col", "conf"};
    if (info.isRoot()) {
        return m_drive;
    }
    if (info.isDir()) {
        return m_folder;
    }
    const QString suffix = info.suffix().toLower();
    if (suffix == "wv") {
        return m_waveform;
    }
    if (textTypes.contains(suffix)) {
        return m_text;
    }
    return settingsTypes.contains(suffix) ? m_settings : m_binary;
}

QString FileIcons::type(const QFileInfo &info) const
{
    if (info.isRoot()) {
        return "Drive";
    }
    if (info.isDir()) {
        return "Folder";
    }
    const QString suffix = info.suffix().toUpper();
    return suffix.isEmpty() ? "File" : suffix + " File";
}
