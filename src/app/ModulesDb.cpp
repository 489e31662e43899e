// SPDX-License-Identifier: Apache-2.0
#include "ModulesDb.h"

#include "DlgInfo.h"
#include "instrument/remotepaths.h"
#include "log/Tracer.h"
#include "mnemonics.h"
#include "toolframe/DlgBase.h"
#include "tools/DlgResample.h"
#include "tools/DlgView.h"
#include "tools/DlgWvCreate.h"

#include <QAction>
#include <QMenu>
#include <QMenuBar>

#include <algorithm>

namespace {

QMenu *findOrAddMenu(QMenuBar &bar, const QString &title)
{
    const QList<QMenu *> menus = bar.findChildren<QMenu *>(Qt::FindDirectChildrenOnly);
    for (QMenu *menu : menus) {
        if (withoutMnemonic(menu->title()) == title) {
            return menu;
        }
    }
    return bar.addMenu(title);
}

} // namespace

ModulesDb::ModulesDb()
{
    addTool(std::make_unique<DlgInfo>());
    addTool(std::make_unique<DlgView>());
    addTool(std::make_unique<DlgWvCreate>());
    addTool(std::make_unique<DlgResample>());
}

ModulesDb::~ModulesDb() = default;

void ModulesDb::addTool(std::unique_ptr<DlgBase> tool)
{
    m_tools.push_back(std::move(tool));
}

void ModulesDb::buildMenu(QMenuBar *bar)
{
    if (!bar || !m_menuActions.isEmpty()) {
        return;
    }
    for (const auto &tool : m_tools) {
        QString path = tool->menuPath();
        if (path.startsWith('/')) {
            path.remove(0, 1);
        }
        const QString title = path.section('/', 0, 0);
        const QString entry = path.section('/', 1, 1);
        if (title.isEmpty() || entry.isEmpty()) {
            continue;
        }
        QAction *action = findOrAddMenu(*bar, title)->addAction(entry);
        action->setEnabled(false);
        connect(action, &QAction::triggered, this, &ModulesDb::menuActionTriggered);
        m_menuActions.append({action, tool.get()});
    }
}

QList<ModulesDb::ToolAction> ModulesDb::contextActions(QObject *parent) const
{
    QList<ToolAction> actions;
    for (const auto &tool : m_tools) {
        actions.append({new QAction(tool->moduleName(), parent), tool.get()});
    }
    return actions;
}

bool ModulesDb::isAllowed(const DlgBase &tool, const QString &path, bool local)
{
    const bool isFile = !isFolderPath(path);
    // A file without a dot has the whole path as its type, which no tool takes that wants one.
    const QString extension = path.toUpper().section('.', -1);
    return tool.sourceAllowed(local) && tool.selectionAllowed(isFile) &&
           (!isFile || tool.extensionAllowed(extension));
}

QList<DlgBase *> ModulesDb::allAllowed(const QString &path, bool local) const
{
    QList<DlgBase *> tools;
    for (const auto &tool : m_tools) {
        if (isAllowed(*tool, path, local)) {
            tools.append(tool.get());
        }
    }
    return tools;
}

DlgBase *ModulesDb::firstAllowed(const QString &path, bool local) const
{
    return allAllowed(path, local).value(0, nullptr);
}

bool ModulesDb::start(DlgBase &tool, const QString &path)
{
    Tracer::Trace(Tracer::Debug, QString("Invoking %1.").arg(tool.moduleName()));
    if (!tool.startModule(path)) {
        return Tracer::fail("Cannot initialize module.");
    }
    tool.show();
    tool.raise();
    tool.activateWindow();
    return true;
}

void ModulesDb::setSelection(const QString &path, bool local)
{
    Tracer::Trace(Tracer::Debug,
                  QString("Selecting %1: %2.").arg(local ? "LOCAL" : "REMOTE", path));
    m_selection = path;
    for (const auto &[action, tool] : std::as_const(m_menuActions)) {
        action->setEnabled(isAllowed(*tool, path, local));
    }
}

void ModulesDb::writeAllSettings(QSettings &settings)
{
    for (const auto &tool : m_tools) {
        tool->writeSettings(settings);
    }
}

void ModulesDb::readAllSettings(QSettings &settings)
{
    for (const auto &tool : m_tools) {
        tool->readSettings(settings);
    }
}

void ModulesDb::updateInstruments(const QList<InstrConfigEntry> &instruments)
{
    for (const auto &tool : m_tools) {
        tool->instrumentsUpdated(instruments);
    }
}

void ModulesDb::closeAll()
{
    for (const auto &tool : m_tools) {
        tool->close();
    }
}

void ModulesDb::hideAll()
{
    m_hidden.clear();
    for (const auto &tool : m_tools) {
        if (tool->isVisible()) {
            m_hidden.push_back(tool.get());
            tool->hide();
        }
    }
}

void ModulesDb::showAgain()
{
    for (DlgBase *tool : m_hidden) {
        tool->show();
    }
    m_hidden.clear();
}

void ModulesDb::menuActionTriggered()
{
    for (const auto &[action, tool] : std::as_const(m_menuActions)) {
        if (action == sender()) {
            start(*tool, m_selection);
            return;
        }
    }
}
