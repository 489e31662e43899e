// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "DlgBase.h"

#include <QString>
#include <QStringList>

#include <functional>
#include <memory>

/// What the program knows of a tool before its dialog is made.
struct ToolInfo
{
    enum class Selection { File, FileOrFolder };

    QString name;     ///< text of the entry in the context menu of the panes
    QString menuPath; ///< "/Menu/Entry" in the menu bar; empty for none
    Selection selection = Selection::File;
    QStringList extensions; ///< upper case, such as "WV"; empty for files of any type
    std::function<std::unique_ptr<DlgBase>()> make;

    /// Types, upper case, for which this tool is the one to start among those that take them.
    QStringList preferredFor = {};

    /// Whether Alt+Enter starts it.
    bool tellsProperties = false;

    QString icon = {};      ///< name of its lineIcon(); empty for none
    QString guidePage = {}; ///< its heading in the user guide, as links write it

    /// Whether a crash has left work of the tool that it offers at its next start; may be empty.
    std::function<bool()> hasLeftWork = {};

    [[nodiscard]] bool isPreferredFor(const QString &path) const
    {
        return preferredFor.contains(path.toUpper().section('.', -1));
    }

    /// Whether the tool is made for files of this one's type.
    [[nodiscard]] bool isMadeFor(const QString &path) const
    {
        return extensions.contains(path.toUpper().section('.', -1)) || isPreferredFor(path);
    }

    /// Whether the tool works on an entry of a pane. A path that ends in "/" is a folder. All tools
    /// work on the local file system only.
    [[nodiscard]] bool accepts(const QString &path, bool local) const
    {
        if (!local) {
            return false;
        }
        if (path.endsWith('/')) {
            return selection == Selection::FileOrFolder;
        }
        // A file without a dot has the whole path as its type, which no tool takes that wants one.
        return extensions.isEmpty() || extensions.contains(path.toUpper().section('.', -1));
    }
};

/// A tool whose dialog is of a class that needs nothing but a parent.
template <typename Dialog>
[[nodiscard]] ToolInfo toolInfo(const QString &name, const QString &menuPath,
                                ToolInfo::Selection selection, const QStringList &extensions,
                                const QString &icon = {}, const QString &guidePage = {})
{
    return {.name = name,
            .menuPath = menuPath,
            .selection = selection,
            .extensions = extensions,
            .make = [] { return std::make_unique<Dialog>(); },
            .icon = icon,
            .guidePage = guidePage};
}
