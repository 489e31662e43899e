// SPDX-License-Identifier: Apache-2.0
#include "QCustomTreeView.h"

#include "PaneFiles.h"
#include "appearance/lineicon.h"
#include "deviceactions.h"
#include "instrument/remotepaths.h"
#include "mnemonics.h"
#include "toolframe/WaitCursor.h"

#include <QAction>
#include <QContextMenuEvent>
#include <QHeaderView>
#include <QMenu>
#include <QRegularExpression>
#include <QScrollBar>
#include <QShortcut>

#include <algorithm>

QCustomTreeView::QCustomTreeView(QWidget *parent)
    : QTreeView(parent)
    , m_contextMenu(new QMenu(this))
    , m_copyMenu(new QMenu(this))
{
    setEditTriggers(NoEditTriggers);
    setDragDropMode(DragDrop);
    setSelectionBehavior(SelectRows);
    setSelectionMode(ExtendedSelection);
    // Without this a folder of thousands of files is measured row by row.
    setUniformRowHeights(true);
    setAlternatingRowColors(true);
    setSortingEnabled(true);
    sortByColumn(0, Qt::AscendingOrder);

    addOperation("Set As Default Folder", "home", {}, &QCustomTreeView::slot_default);
    m_runAction = addOperation("Run!", "run", Qt::Key_F9, &QCustomTreeView::slot_runwaveform);
    addOperation("Create Folder", "folder_new", Qt::Key_F7, &QCustomTreeView::slot_create);
    addOperation("Rename", "rename", Qt::Key_F2, &QCustomTreeView::slot_rename);
    addOperation("Delete", "delete", QKeySequence::Delete, &QCustomTreeView::slot_remove);
    m_copyMenu->addAction(lineIcon("copy"), "Copy to", this, &QCustomTreeView::slot_copy);
    m_copyRunAction =
        m_copyMenu->addAction(lineIcon("run"), "Copy and Run!", this, &QCustomTreeView::copyAndRun);
    m_copyMenu->addSeparator();
    m_copyMenu->addAction(lineIcon("close"), "Cancel\tEsc");
    addKeys(Qt::Key_F5, &QCustomTreeView::copyToPeer);
    addKeys(Qt::ShiftModifier | Qt::Key_Delete, &QCustomTreeView::removeForGood);
    addKeys(QKeySequence::Copy, &QCustomTreeView::copyToClipboard);
    addKeys(QKeySequence::Paste, &QCustomTreeView::pasteFromClipboard);

    // The model delivers and sorts folders later, which moves the revealed entry out of sight.
    m_revealTimer.setSingleShot(true);
    m_revealTimer.setInterval(0);
    connect(&m_revealTimer, &QTimer::timeout, this, &QCustomTreeView::revealCurrent);
    connect(verticalScrollBar(), &QScrollBar::actionTriggered, this,
            [this] { m_revealedPath.clear(); });
    // Not in the middle of a layout or of a change of the model.
    m_fitTimer.setSingleShot(true);
    m_fitTimer.setInterval(0);
    connect(&m_fitTimer, &QTimer::timeout, this, &QCustomTreeView::fitColumns);
    constexpr int RepaintMs = 2000;
    connect(&m_repaintTimer, &QTimer::timeout, this, [this] {
        if (isLocal() && isVisible()) {
            viewport()->update();
        }
    });
    m_repaintTimer.start(RepaintMs);
}

QCustomTreeView::~QCustomTreeView() = default;

QAction *QCustomTreeView::addOperation(const QString &text, const QString &picture,
                                       const QKeySequence &key, Slot slot)
{
    QAction *action = m_contextMenu->addAction(lineIcon(picture), text);
    action->setShortcut(key);
    action->setShortcutContext(Qt::WidgetShortcut);
    action->setShortcutVisibleInContextMenu(true);
    addAction(action);
    connect(action, &QAction::triggered, this, slot);
    return action;
}

void QCustomTreeView::addKeys(const QKeySequence &key, Slot slot)
{
    auto *shortcut = new QShortcut(key, this);
    shortcut->setContext(Qt::WidgetShortcut);
    connect(shortcut, &QShortcut::activated, this, slot);
}

void QCustomTreeView::setModules(ModulesDb *modules)
{
    if (m_modules) {
        return;
    }
    m_modules = modules;
    m_toolActions = modules->contextActions(this);
    m_contextMenu->addSeparator();
    for (int i = 0; i < m_toolActions.size(); ++i) {
        QAction *action = m_toolActions.at(i).first;
        m_contextMenu->addAction(action);
        connect(action, &QAction::triggered, this, [this, i] { slot_module(i); });
    }
    assignMnemonics(m_contextMenu->actions());
}

void QCustomTreeView::setModel(QAbstractItemModel *model)
{
    if (model == this->model()) {
        return;
    }
    keepColumnWidths();
    if (this->model()) {
        this->model()->disconnect(&m_revealTimer);
    }
    m_files.reset();
    QTreeView::setModel(model);
    m_files = PaneFiles::create(model);
    if (m_files) {
        m_files->follow(*this);
        connect(this, &QTreeView::expanded, m_files.get(), [this] { m_fitTimer.start(); });
        connect(m_files.get(), &PaneFiles::failed, this, &QCustomTreeView::errMsg);
        connect(m_files.get(), &PaneFiles::infoTextAvailable, this,
                &QCustomTreeView::infoTextAvailable);
        const auto reveal = qOverload<>(&QTimer::start);
        connect(model, &QAbstractItemModel::rowsInserted, &m_revealTimer, reveal);
        connect(model, &QAbstractItemModel::layoutChanged, &m_revealTimer, reveal);
        connect(m_files.get(), &PaneFiles::folderLoaded, this, &QCustomTreeView::folderLoaded);
        m_columnWidths.apply(m_files->settingsName(), *header());
        m_fitTimer.start();
    }
}

bool QCustomTreeView::isLocal() const
{
    return !m_files || m_files->isLocal();
}

VisaDevice *QCustomTreeView::device() const
{
    return m_files ? m_files->device() : nullptr;
}

QString QCustomTreeView::currentPath() const
{
    return m_files ? m_files->pathOf(currentIndex()) : QString();
}

void QCustomTreeView::writeSettings(QSettings &settings, int pane)
{
    keepColumnWidths();
    m_columnWidths.write(settings, pane);
}

void QCustomTreeView::readSettings(const QSettings &settings, int pane)
{
    m_columnWidths.read(settings, pane);
    if (m_files) {
        m_columnWidths.apply(m_files->settingsName(), *header());
    }
}

void QCustomTreeView::keepColumnWidths()
{
    if (m_files && !isFitted()) {
        m_columnWidths.keep(m_files->settingsName(), *header());
    }
    m_fittedWidths.clear();
}

void QCustomTreeView::updateAndExpandTree(const QString &sDir)
{
    if (!m_files || (sDir.isEmpty() && isLocal())) {
        return;
    }
    const QModelIndex target = isLocal() ? m_files->indexOf(sDir) : openAnew(sDir);
    if (!target.isValid()) {
        emit errMsg(QString("There is no entry '%1' any more.").arg(sDir));
        return;
    }
    for (QModelIndex level = target; level.isValid(); level = level.parent()) {
        // A file that counted as an open folder would be missed at the next reload.
        if (isLocal() || isFolderPath(m_files->pathOf(level))) {
            open(level);
        }
    }
    setCurrentIndex(target);
    m_revealedPath = m_files->pathOf(target);
    revealCurrent();
    m_fitTimer.start();
}

/// Until the user chooses widths, names get the room that the other columns leave.
void QCustomTreeView::fitColumns()
{
    QList<int> widths = m_files ? m_columnWidths.untouched(m_files->settingsName()) : QList<int>();
    if (widths.isEmpty() || header()->count() < widths.size() ||
        (!m_fittedWidths.isEmpty() && !isFitted())) {
        return;
    }
    int others = 0;
    for (int section = 1; section < widths.size(); ++section) {
        widths[section] = std::max(widths.at(section), sizeHintForColumn(section));
        others += widths.at(section);
    }
    widths[0] = std::max(widths.first(), viewport()->width() - others);
    m_fittedWidths = widths;
    for (int section = 0; section < widths.size(); ++section) {
        setColumnWidth(section, widths.at(section));
    }
}

bool QCustomTreeView::isFitted() const
{
    // The last one follows the width of the view by itself.
    for (int section = 0; section + 1 < m_fittedWidths.size(); ++section) {
        if (columnWidth(section) != m_fittedWidths.at(section)) {
            return false;
        }
    }
    return !m_fittedWidths.isEmpty();
}

void QCustomTreeView::resizeEvent(QResizeEvent *event)
{
    QTreeView::resizeEvent(event);
    m_fitTimer.start();
}

QModelIndex QCustomTreeView::openAnew(const QString &path)
{
    const WaitCursor cursor;
    const int sortColumn = header()->sortIndicatorSection();
    const Qt::SortOrder sortOrder = header()->sortIndicatorOrder();
    keepColumnWidths();
    const QStringList folders = m_files->reload(path);
    // The columns had vanished with the tree.
    m_columnWidths.apply(m_files->settingsName(), *header());
    header()->setSortIndicator(sortColumn, sortOrder);
    for (const QString &folder : folders) {
        open(m_files->indexOf(folder));
    }
    const QModelIndex target = m_files->indexOf(path);
    if (target.isValid()) {
        return target;
    }
    // A default folder that was never set leads nowhere.
    return model()->index(0, 0);
}

void QCustomTreeView::open(const QModelIndex &folder)
{
    if (folder.isValid()) {
        readBeforeOpening(folder);
        setExpanded(folder, true);
    }
}

void QCustomTreeView::readBeforeOpening(const QModelIndex &folder)
{
    // A folder of an instrument that was read in the middle of the view's layout would spoil it:
    // the layout walks over rows that have gone meanwhile, and may never end.
    if (!isLocal() && folder.isValid() && model()->canFetchMore(folder)) {
        model()->fetchMore(folder);
    }
}

void QCustomTreeView::updateAndExpandTree()
{
    updateAndExpandTree(currentPath());
}

void QCustomTreeView::revealCurrent()
{
    if (m_revealedPath.isEmpty()) {
        return;
    }
    // At the lower edge a folder would hide what it holds, and a file its neighbours.
    const QRect row = visualRect(currentIndex());
    if (row.top() < 0 || row.bottom() > viewport()->height() * 2 / 3) {
        scrollTo(currentIndex(), PositionAtCenter);
    }
}

void QCustomTreeView::filterChanged(const QString &sNewFilter)
{
    static const QRegularExpression separators("[\\s,;]+");
    QStringList wildcards = sNewFilter.split(separators, Qt::SkipEmptyParts);
    if (wildcards.contains("*.*")) {
        wildcards.clear();
    }
    if (m_files) {
        m_files->setNameFilters(wildcards);
    }
    if (!isLocal() && currentIndex().isValid()) {
        updateAndExpandTree();
    }
}

void QCustomTreeView::currentChanged(const QModelIndex &current, const QModelIndex &previous)
{
    QTreeView::currentChanged(current, previous);
    if (!m_files) {
        return;
    }
    if (!current.isValid()) {
        emit selectionLost();
        return;
    }
    const QString path = m_files->pathOf(current);
    if (path != m_revealedPath) {
        m_revealedPath.clear();
    }
    emit itemSelected(path);
}

void QCustomTreeView::contextMenuEvent(QContextMenuEvent *event)
{
    const bool byMouse = event->reason() == QContextMenuEvent::Mouse;
    const QModelIndex index = byMouse ? indexAt(event->pos()) : currentIndex();
    if (!m_files || !index.isValid()) {
        return;
    }
    // The menu of a marked entry is that of all of them.
    selectionModel()->setCurrentIndex(index, selectionModel()->isSelected(index)
                                                 ? QItemSelectionModel::NoUpdate
                                                 : QItemSelectionModel::ClearAndSelect |
                                                       QItemSelectionModel::Rows);
    const QString path = currentPath();
    if (path.isEmpty()) {
        return;
    }
    m_runAction->setVisible(isRunnable(path, device()));
    for (const auto &[action, tool] : std::as_const(m_toolActions)) {
        action->setVisible(tool->accepts(path, isLocal()));
    }
    const QPoint position = byMouse ? event->pos() : visualRect(index).bottomLeft();
    m_contextMenu->popup(viewport()->mapToGlobal(position));
}

void QCustomTreeView::mousePressEvent(QMouseEvent *event)
{
    const QPoint position = event->position().toPoint();
    const QModelIndex index = indexAt(position);
    const bool onBranchMark = index.column() == 0 && position.x() < visualRect(index).left();
    if (onBranchMark) {
        readBeforeOpening(index);
    }
    QTreeView::mousePressEvent(event);
    m_dragStart = position;
    m_pressedEntry = event->button() == Qt::LeftButton && !onBranchMark ? index : QModelIndex();
}

void QCustomTreeView::mouseDoubleClickEvent(QMouseEvent *event)
{
    readBeforeOpening(indexAt(event->position().toPoint()).siblingAtColumn(0));
    QTreeView::mouseDoubleClickEvent(event);
    if (event->button() == Qt::LeftButton && indexAt(event->position().toPoint()).isValid() &&
        !isFolderPath(currentPath())) {
        startFirstTool();
    }
}

void QCustomTreeView::keyPressEvent(QKeyEvent *event)
{
    switch (event->key()) {
    case Qt::Key_Return:
    case Qt::Key_Enter:
        if (event->modifiers().testFlag(Qt::AltModifier)) {
            startProperties();
        } else {
            openCurrent();
        }
        return;
    case Qt::Key_Backspace:
        goUp();
        return;
    case Qt::Key_Asterisk:
        // Whole trees are not opened at one press: an instrument would be read to its last folder.
        if (isLocal()) {
            QTreeView::keyPressEvent(event);
        }
        return;
    default:
        if (event->key() == Qt::Key_Right || event->key() == Qt::Key_Plus) {
            readBeforeOpening(currentIndex());
        }
        QTreeView::keyPressEvent(event);
    }
}

void QCustomTreeView::openCurrent()
{
    if (isFolderPath(currentPath())) {
        readBeforeOpening(currentIndex());
        setExpanded(currentIndex(), !isExpanded(currentIndex()));
    } else {
        startFirstTool();
    }
}

void QCustomTreeView::goUp()
{
    if (currentIndex().parent().isValid()) {
        setCurrentIndex(currentIndex().parent());
        scrollTo(currentIndex());
    }
}

void QCustomTreeView::focusInEvent(QFocusEvent *event)
{
    QTreeView::focusInEvent(event);
    if (m_files && currentIndex().isValid()) {
        emit itemSelected(currentPath());
    }
}

bool QCustomTreeView::focusNextPrevChild(bool next)
{
    if (next) {
        emit otherPaneRequested();
        return true;
    }
    return QTreeView::focusNextPrevChild(next);
}

void QCustomTreeView::startFirstTool()
{
    const QString path = currentPath();
    if (const ToolInfo *tool = m_modules ? m_modules->firstAllowed(path, isLocal()) : nullptr) {
        m_modules->start(*tool, path);
    } else if (!path.isEmpty()) {
        const QString words = isLocal() ? "No tool works on '%1'."
                                        : "Tools work on local files: copy '%1' to a local folder.";
        emit errMsg(words.arg(entryName(path)));
    }
}

void QCustomTreeView::startProperties()
{
    const QString path = currentPath();
    if (const ToolInfo *tool = m_modules ? m_modules->propertiesOf(path, isLocal()) : nullptr) {
        m_modules->start(*tool, path);
    }
}

QStringList QCustomTreeView::selectedPaths() const
{
    const QString current = currentPath();
    QStringList paths;
    if (m_files) {
        const QModelIndexList rows = selectionModel()->selectedRows();
        for (const QModelIndex &row : rows) {
            paths.append(m_files->pathOf(row));
        }
    }
    if (!paths.contains(current)) {
        return current.isEmpty() ? QStringList() : QStringList(current);
    }
    const auto liesInOther = [paths](const QString &path) {
        return std::any_of(paths.begin(), paths.end(), [&path](const QString &folder) {
            return isFolderPath(folder) && path != folder && path.startsWith(folder);
        });
    };
    paths.removeIf(liesInOther);
    return paths;
}

void QCustomTreeView::slot_module(int iModIndex)
{
    if (iModIndex < 0 || iModIndex >= m_toolActions.size()) {
        return;
    }
    const ToolInfo *tool = m_toolActions.at(iModIndex).second;
    const QString path = currentPath();
    if (tool->accepts(path, isLocal())) {
        m_modules->start(*tool, path);
    }
}
