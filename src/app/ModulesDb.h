// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <QList>
#include <QObject>
#include <QPair>
#include <QString>

#include <memory>
#include <vector>

class DlgBase;
class QAction;
class QMenuBar;
class QSettings;
struct InstrConfigEntry;

/// All tools of the program: creates them, enters them in the menus, enables them according to the
/// selected entry, starts them, and passes settings on to them.
class ModulesDb : public QObject
{
    Q_OBJECT

public:
    using ToolAction = QPair<QAction *, DlgBase *>;

    /// Creates all tools. The order here is that of the menus.
    ModulesDb();
    ~ModulesDb() override;

    /// Appends a tool; to be called before the menus are built.
    void addTool(std::unique_ptr<DlgBase> tool);

    /// Enters the tools in a menu bar, adding the menus that it lacks. Does nothing for a null bar
    /// or the second time.
    void buildMenu(QMenuBar *bar);

    /// One new action for each tool, owned by `parent`, with the tool's name as its text.
    [[nodiscard]] QList<ToolAction> contextActions(QObject *parent) const;

    /// Whether a tool accepts this entry: its side, its kind and, for a file, its type.
    [[nodiscard]] static bool isAllowed(const DlgBase &tool, const QString &path, bool local);

    /// The first tool that accepts an entry; null if there is none.
    [[nodiscard]] DlgBase *firstAllowed(const QString &path, bool local) const;

    /// All tools that accept an entry, in order.
    [[nodiscard]] QList<DlgBase *> allAllowed(const QString &path, bool local) const;

    /// Starts a tool with a path and shows its window. False if the tool can't start; logged.
    bool start(DlgBase &tool, const QString &path);

    /// The selection of a pane has changed: enables the entries of the menu bar accordingly.
    void setSelection(const QString &path, bool local);

    void writeAllSettings(QSettings &settings);
    void readAllSettings(QSettings &settings);
    void updateInstruments(const QList<InstrConfigEntry> &instruments);

    void closeAll();

    /// Hides all tools; showAgain() brings those back that were visible.
    void hideAll();
    void showAgain();

private slots:
    void menuActionTriggered();

private:
    std::vector<std::unique_ptr<DlgBase>> m_tools;
    std::vector<DlgBase *> m_hidden; ///< tools that hideAll() has hidden
    QString m_selection;
    QList<ToolAction> m_menuActions;
};
