// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <QAbstractFileIconProvider>
#include <QIcon>

/// Pictures and type names of the entries of the panes, chosen by the file name alone: the
/// toolkit's own provider opens files to find their type, which stalls large folders.
///
/// The file system model asks from a thread of its own, so the pictures are made beforehand.
class FileIcons : public QAbstractFileIconProvider
{
public:
    FileIcons();

    [[nodiscard]] QIcon icon(IconType type) const override;
    [[nodiscard]] QIcon icon(const QFileInfo &info) const override;
    [[nodiscard]] QString type(const QFileInfo &info) const override;

private:
    QIcon m_drive;
    QIcon m_folder;
    QIcon m_waveform;
    QIcon m_text;
    QIcon m_settings;
    QIcon m_binary;
};
