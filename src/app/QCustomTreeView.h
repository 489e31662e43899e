// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "ColumnWidths.h"
#include "ModulesDb.h"
#include "deviceactions.h"

#include <QPersistentModelIndex>
#include <QPoint>
#include <QTimer>
#include <QTreeView>

#include <memory>
#include <optional>

class PaneFiles;
class QMenu;
class QSettings;
class VisaDevice;

/// The tree of one pane: shows the entries of its model, and turns menus, keys and drops into the
/// operations of PaneFiles and into starts of tools. Several entries can be marked: copies and
/// removals act on all of them, everything else on the current one.
///
/// Paths use "/", and a folder's path ends in it. Questions are asked here, in modal boxes.
class QCustomTreeView : public QTreeView
{
    Q_OBJECT

public:
    explicit QCustomTreeView(QWidget *parent = nullptr);
    ~QCustomTreeView() override;

    /// Hands over the tools, which must live longer; adds them to the context menu. Once.
    void setModules(ModulesDb *modules);

    /// The other pane, from which entries can be copied to this one.
    void setPeer(QCustomTreeView *peer) { m_peer = peer; }

    /// Takes over a model of one of the kinds that PaneFiles knows, or null. Each kind has column
    /// widths of its own.
    void setModel(QAbstractItemModel *model) override;

    /// Whether the pane shows the local file system; also without a model.
    [[nodiscard]] bool isLocal() const;

    /// The instrument that the pane shows; null for the local file system.
    [[nodiscard]] VisaDevice *device() const;

    /// Path of the current entry, empty if there is none.
    [[nodiscard]] QString currentPath() const;

    /// Paths of the marked entries, without those that lie in a marked folder; the current one if
    /// it isn't among them.
    [[nodiscard]] QStringList selectedPaths() const;

    /// Opens the menu that copies entries of another pane into the folder at a position of the
    /// viewport, or into that of the file there.
    void offerCopy(const QCustomTreeView &source, const QStringList &paths, const QPoint &position);

    /// Copies a file of the disk into the folder of the current entry, or the default one where
    /// there is none, and offers to start it where it is a waveform on a generator. False if it
    /// isn't there in the end.
    bool takeFile(const QString &localPath, const QString &defaultFolder);

    /// Saves and restores the column widths of pane 1 or 2.
    void writeSettings(QSettings &settings, int pane);
    void readSettings(const QSettings &settings, int pane);

public slots:
    /// Opens all folders on the way to a path and makes it current. An instrument is read anew.
    void updateAndExpandTree(const QString &sDir);

    /// As above with the current path.
    void updateAndExpandTree();

    /// Shows only files that match a mask, such as "*.wv"; "*.*" shows all, also those without a
    /// dot. Several patterns are separated by blanks, commas or semicolons.
    void filterChanged(const QString &sNewFilter);

    /// What Enter does: opens or closes a folder, starts the tool for a file.
    void openCurrent();

    /// Goes to the folder above.
    void goUp();

    /// Removes past the trash, where there is one.
    void removeForGood();

    /// Copies the marked entries to the folder of the current entry of the other pane.
    void copyToPeer();

    void slot_default();
    void slot_copy();
    void slot_move(); ///< does nothing: nothing is moved between the panes
    void slot_create();
    void slot_rename();
    void slot_remove();
    void slot_runwaveform();
    void slot_module(int iModIndex);

signals:
    /// A text for the status bar.
    void errMsg(const QString &sTxt);

    /// A text that the user must acknowledge.
    void infoTextAvailable(const QString &sInfoText);

    void localDefaultFolderSet(const QString &sDefaultFolder);
    void remoteDefaultFolderSet(VisaDevice *pcVisaDevice, const QString &sDefaultFolder);

    /// For those who start a tool on an entry by other ways; this view itself gives them never,
    /// since its menu goes by slot_module().
    void startFileConversion(const QString &sPathFile);
    void startResampler(const QString &sPathFile);
    void startFilter(const QString &sPathFile);
    void startCreateSignal(const QString &sPathFile);

    /// An entry has become current, or the pane has come into use again with this one.
    void itemSelected(const QString &sItem);

    /// All entries of a folder have arrived in the tree.
    void folderLoaded(const QString &sFolder);

    /// The user wants to go on in the other pane.
    void otherPaneRequested();

    /// A waveform was started on the instrument of the pane.
    void generatorChanged();

    /// No entry is the current one any more.
    void selectionLost();

protected:
    void currentChanged(const QModelIndex &current, const QModelIndex &previous) override;
    void contextMenuEvent(QContextMenuEvent *event) override;
    void mousePressEvent(QMouseEvent *event) override;
    void mouseMoveEvent(QMouseEvent *event) override;
    void mouseDoubleClickEvent(QMouseEvent *event) override;
    void keyPressEvent(QKeyEvent *event) override;
    void resizeEvent(QResizeEvent *event) override;
    void focusInEvent(QFocusEvent *event) override;
    bool focusNextPrevChild(bool next) override;
    void startDrag(Qt::DropActions supportedActions) override;
    void dragEnterEvent(QDragEnterEvent *event) override;
    void dragMoveEvent(QDragMoveEvent *event) override;
    void dropEvent(QDropEvent *event) override;

private:
    using Slot = void (QCustomTreeView::*)();
    QAction *addOperation(const QString &text, const QString &picture, const QKeySequence &key,
                          Slot slot);
    void addKeys(const QKeySequence &key, Slot slot);
    void copyToClipboard();
    void pasteFromClipboard();
    void setCopy(const QCustomTreeView &source, const QStringList &paths, const QString &target);
    void copyAndRun();
    [[nodiscard]] bool copyHere();
    [[nodiscard]] CopyOutcome copySources();
    void removeSelected(bool forGood);
    [[nodiscard]] bool confirmRemoval(const QStringList &paths);
    [[nodiscard]] bool removeEntry(const QString &path, bool forGood);
    [[nodiscard]] QString neighbourOf(const QStringList &paths) const;
    void startProperties();
    [[nodiscard]] static bool isBusy();
    void open(const QModelIndex &folder);
    void readBeforeOpening(const QModelIndex &folder);
    [[nodiscard]] QModelIndex openAnew(const QString &path);
    void keepColumnWidths();
    void revealCurrent();
    void fitColumns();
    [[nodiscard]] bool isFitted() const;
    void startFirstTool();
    [[nodiscard]] QString toolFile(const QDropEvent &event) const;
    [[nodiscard]] bool comesFromOtherPane(const QDropEvent &event) const;
    struct NameRequest
    {
        QString title;
        QString label;
        QString parent;        ///< folder of the entry that is named
        QString forbiddenText; ///< refuses a name with a forbidden character
    };
    [[nodiscard]] std::optional<QString> askName(const NameRequest &request, const QString &initial,
                                                 qsizetype marked = -1);
    [[nodiscard]] bool acceptsName(const QString &parent, const QString &name,
                                   const QString &forbiddenText);

    std::unique_ptr<PaneFiles> m_files; ///< null without a model
    ModulesDb *m_modules = nullptr;
    QCustomTreeView *m_peer = nullptr;
    QMenu *m_contextMenu;
    QMenu *m_copyMenu;
    QAction *m_runAction = nullptr;
    QAction *m_copyRunAction = nullptr;
    QList<ModulesDb::ToolAction> m_toolActions;
    ColumnWidths m_columnWidths;
    QList<int> m_fittedWidths;            ///< as fitColumns() has set them; empty for none
    QPoint m_dragStart;                   ///< in the viewport
    QPersistentModelIndex m_pressedEntry; ///< that may be dragged
    QString m_revealedPath; ///< kept in view while its folders load, until the user moves
    QTimer m_revealTimer;
    QTimer m_fitTimer;
    QTimer m_repaintTimer;                       ///< sizes of files change without a word
    QList<QPair<QString, qint64>> m_dropSources; ///< paths and sizes
    QString m_dropTarget;
    VisaDevice *m_dropSourceDevice = nullptr; ///< null for local
};
