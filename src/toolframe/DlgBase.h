// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <QDialog>
#include <QList>
#include <QString>

class QSettings;
struct InstrConfigEntry;

/// Base of all tool dialogs: modeless windows that the main window creates once, enters in its
/// menus and starts with the path of the selected file.
///
/// A tool says by its texts where it appears, by the three tests what it works on, and keeps its
/// settings in a group of its own. The defaults are those of a tool that takes no file at all.
class DlgBase : public QDialog
{
    Q_OBJECT

public:
    explicit DlgBase(QWidget *parent = nullptr);

    /// Prepares the dialog for a file, or a folder (its path ends in "/"). False means that it
    /// can't start; the reason has been logged, and the dialog stays as it was.
    [[nodiscard]] virtual bool startModule(const QString &path);

    /// Text of the entry in the context menu of the panes.
    [[nodiscard]] virtual QString moduleName() const;

    /// Place in the menu bar, "/Menu/Entry"; empty for none.
    [[nodiscard]] virtual QString menuPath() const;

    /// Whether the tool works on the local file system or on that of an instrument.
    [[nodiscard]] virtual bool sourceAllowed(bool local) const;

    /// Whether the tool works on files, or folders.
    [[nodiscard]] virtual bool selectionAllowed(bool isFile) const;

    /// Whether the tool takes files of this type, "WV" for "noise.wv".
    [[nodiscard]] virtual bool extensionAllowed(const QString &upperCaseExtension) const;

    /// The list of configured instruments has changed.
    virtual void instrumentsUpdated(const QList<InstrConfigEntry> &instruments);

public slots:
    /// Saves the tool's group of settings.
    virtual void writeSettings(QSettings &settings);

    /// Restores the tool's group of settings.
    virtual void readSettings(QSettings &settings);
};
