// SPDX-License-Identifier: Apache-2.0
#include "MainWindow.h"

#include "ui_MainWindow.h"

#include "AboutBox.h"
#include "GuideWindow.h"
#include "PathBox.h"
#include "QCustomTreeView.h"
#include "mnemonics.h"

#include "appearance/lineicon.h"
#include "appearance/ui/DlgColors.h"
#include "instrument/ui/DlgInstrConfig.h"

#include <QApplication>
#include <QMenu>
#include <QMenuBar>
#include <QShortcut>

#include <utility>

void MainWindow::buildMenus()
{
    QMenu *file = menuBar()->addMenu("File");
    m_modules.buildMenu(menuBar());
    if (!file->isEmpty()) {
        file->addSeparator();
    }
    addEntryMenu(*file);
    file->addSeparator();
    file->addAction(m_ui->actionExit);
    QMenu *instrument = menuBar()->addMenu("Instrument");
    instrument->addAction(lineIcon("run"), "Run!\tF9", this,
                          [this] { paneOf(m_activePane->tree).tree->slot_runwaveform(); });
    instrument->addAction(m_ui->actionInstrConfigure);
    menuBar()->addMenu("Program")->addAction(m_ui->actionColors);
    QMenu *help = menuBar()->addMenu("Help");
    help->addAction(m_ui->actionGuide);
    help->addAction(m_ui->actionAbout);

    const std::pair<QAction *, const char *> icons[] = {
        {m_ui->actionExit, "exit"},     {m_ui->actionInstrConfigure, "instrument"},
        {m_ui->actionColors, "colors"}, {m_ui->actionGuide, "guide"},
        {m_ui->actionAbout, "about"},
    };
    for (const auto &[action, icon] : icons) {
        action->setIcon(lineIcon(icon));
    }
    assignMnemonics(menuBar()->actions());
    const QList<QAction *> menus = menuBar()->actions();
    for (const QAction *menu : menus) {
        assignMnemonics(menu->menu()->actions());
    }
    connect(m_ui->actionExit, &QAction::triggered, this, &MainWindow::close);
    connect(m_ui->actionInstrConfigure, &QAction::triggered, this,
            &MainWindow::menu_showinstrconfig);
    m_ui->actionGuide->setShortcutContext(Qt::ApplicationShortcut); // in the tools, too
    connect(m_ui->actionGuide, &QAction::triggered, this, &MainWindow::menu_showguide);
    connect(m_ui->actionColors, &QAction::triggered, this, &MainWindow::menu_showcolors);
    connect(m_ui->actionAbout, &QAction::triggered, this, &MainWindow::menu_about);
    auto *refreshKey = new QShortcut(QKeySequence("Ctrl+R"), this);
    connect(refreshKey, &QShortcut::activated, this,
            [this] { refresh(paneOf(m_activePane->tree)); });
}

/// What the panes do at a key, for those who look into the menus first. The keys themselves belong
/// to the trees, so that a text field keeps its own.
void MainWindow::addEntryMenu(QMenu &menu)
{
    struct Entry
    {
        const char *icon;
        const char *text;
        void (QCustomTreeView::*slot)();
    };
    constexpr Entry Entries[] = {
        {"open", "Open\tEnter", &QCustomTreeView::openCurrent},
        {"copy_to", "Copy to Other Pane\tF5", &QCustomTreeView::copyToPeer},
        {"folder_new", "Create Folder\tF7", &QCustomTreeView::slot_create},
        {"rename", "Rename\tF2", &QCustomTreeView::slot_rename},
        {"delete", "Delete\tDel", &QCustomTreeView::slot_remove},
        {"delete_forever", "Delete for Good\tShift+Del", &QCustomTreeView::removeForGood},
        {"home", "Set As Default Folder", &QCustomTreeView::slot_default},
    };
    for (const Entry &entry : Entries) {
        menu.addAction(lineIcon(entry.icon), entry.text, this,
                       [this, slot = entry.slot] { (paneOf(m_activePane->tree).tree->*slot)(); });
    }
    menu.addAction(lineIcon("refresh"), "Refresh\tCtrl+R", this,
                   [this] { refresh(paneOf(m_activePane->tree)); });
}

void MainWindow::menu_about()
{
    AboutBox(this).exec();
}

void MainWindow::menu_showinstrconfig()
{
    m_instrConfig->show();
    m_instrConfig->raise();
    m_instrConfig->activateWindow();
}

void MainWindow::menu_showcolors()
{
    m_colors->show();
    m_colors->raise();
    m_colors->activateWindow();
}

void MainWindow::menu_showguide()
{
    if (!m_guide) {
        m_guide = std::make_unique<GuideWindow>(this);
    }
    const QString page = guidePageOf(QApplication::activeWindow());
    m_guide->show();
    m_guide->showPage(page); // its place depends on the width
    m_guide->raise();
    m_guide->activateWindow();
}
