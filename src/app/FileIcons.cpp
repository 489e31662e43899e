// SPDX-License-Identifier: Apache-2.0
#include "FileIcons.h"

#include "appearance/lineicon.h"

#include <QFileInfo>
#include <QStringList>

FileIcons::FileIcons()
    : m_drive(lineIcon("drive"))
    , m_folder(lineIcon("folder"))
    , m_waveform(lineIcon("file_waveform"))
    , m_text(lineIcon("file_ascii"))
    , m_settings(lineIcon("file_settings"))
    , m_binary(lineIcon("file_binary"))
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
