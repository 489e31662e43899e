// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "instrument/InstrConfigEntry.h"
#include "toolframe/ToolInfo.h"

#include <QList>
#include <QObject>
#include <QPair>
#include <QString>

#include <deque>
#include <memory>

class QAction;
class QMenuBar;
class QSettings;

/// All tools of the program: enters them in the menus, enables them according to the selected
/// entry, makes their dialogs at the first use, starts them, and passes settings on to them.
class ModulesDb : public QObject
{
    Q_OBJECT

public:
    using ToolAction = QPair<QAction *, const ToolInfo *>;

    /// Takes the table of tools, whose order is that of the menus. Makes no dialog.
    ModulesDb();
    ~ModulesDb() override;

    /// Appends a tool; to be called before the menus are built.
    void addTool(ToolInfo info);

    /// Enters the tools in a menu bar, adding the menus that it lacks. Does nothing for a null bar
    /// or the second time.
    void buildMenu(QMenuBar *bar);

    /// One new action for each tool, owned by `parent`, with the tool's name as its text.
    [[nodiscard]] QList<ToolAction> contextActions(QObject *parent) const;

    /// The tool that Enter starts for an entry: one that is made for its type, or else the first
    /// that accepts it; null if there is none.
    [[nodiscard]] const ToolInfo *firstAllowed(const QString &path, bool local) const;

    /// The first tool that is made for an entry's type and accepts it; null if there is none.
    [[nodiscard]] const ToolInfo *firstMadeFor(const QString &path, bool local) const;

    /// The tool that tells an entry's properties; null if there is none.
    [[nodiscard]] const ToolInfo *propertiesOf(const QString &path, bool local) const;

    /// All tools that accept an entry, in order.
    [[nodiscard]] QList<const ToolInfo *> allAllowed(const QString &path, bool local) const;

    /// Starts a tool of this registry with a path and shows its window. False if the tool can't
    /// start; logged.
    bool start(const ToolInfo &tool, const QString &path);

    /// Starts the tool that Enter would start for a local file.
    void open(const QString &path);

    /// Starts, with a folder, each tool that has work to offer which a crash has left.
    void offerLeftWork(const QString &folder);

    /// The dialog of a tool of this registry, made now if there was none. Owned by the registry.
    [[nodiscard]] DlgBase &dialog(const ToolInfo &tool);

    /// The selection of a pane has changed: enables the entries of the menu bar accordingly.
    void setSelection(const QString &path, bool local);

    /// Lets the dialogs that were used save their groups; what stands in those of others stays.
    void writeAllSettings(QSettings &settings);

    /// Remembers the store, from which each dialog reads its group when it is made.
    void readAllSettings(QSettings &settings);
    void updateInstruments(const QList<InstrConfigEntry> &instruments);

    /// Tells all dialogs where a file would be sent to; empty for nowhere.
    void setSendTarget(const QString &instrument);

    void closeAll();

    /// Hides all tools; showAgain() brings those back that were visible.
    void hideAll();
    void showAgain();

private slots:
    void menuActionTriggered();

signals:
    /// A tool's user wants a waveform file on an instrument.
    void sendRequested(const QString &path);

    /// A tool can't open a file; says which and why.
    void refused(const QString &text);

private:
    struct Tool
    {
        ToolInfo info;
        std::unique_ptr<DlgBase> dialog; ///< null until it is used
    };

    std::deque<Tool> m_tools;  ///< their addresses stay
    QList<DlgBase *> m_hidden; ///< dialogs that hideAll() has hidden
    QString m_selection;
    QString m_settingsFile;
    QList<InstrConfigEntry> m_instruments;
    QString m_sendTarget;
    QList<ToolAction> m_menuActions;
};
