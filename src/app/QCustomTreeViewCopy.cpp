// SPDX-License-Identifier: Apache-2.0
// Copies between the panes: by drag and drop, by the clipboard, by a key.
#include "QCustomTreeView.h"

#include "ModulesDb.h"
#include "PaneFiles.h"
#include "appearance/lineicon.h"
#include "deviceactions.h"
#include "instrument/VisaDevice.h"
#include "instrument/remotepaths.h"
#include "jobs/instrument/CopyJob.h"
#include "toolframe/QtProgressDialog.h"
#include "toolframe/questions.h"

#include <QApplication>
#include <QClipboard>
#include <QDrag>
#include <QDragEnterEvent>
#include <QGuiApplication>
#include <QMenu>
#include <QMimeData>
#include <QMouseEvent>
#include <QUrl>

namespace {

/// Between the paths of a drag; no name on any side holds it.
constexpr QChar PathSeparator = '\n';

/// Marks paths in the clipboard as copied from a pane of this process.
const QString clipboardFormat = "application/x-corvane-pane";

QByteArray clipboardTag(const QCustomTreeView &pane)
{
    return QByteArray::number(QCoreApplication::applicationPid()) + ' ' +
           pane.objectName().toUtf8() + ' ' +
           (pane.device() ? pane.device()->resource().toUtf8() : QByteArray());
}

} // namespace

void QCustomTreeView::mouseMoveEvent(QMouseEvent *event)
{
    if (!event->buttons().testFlag(Qt::LeftButton)) {
        QTreeView::mouseMoveEvent(event);
        return;
    }
    // Not left to the base class, which drags only what its model offers, and an instrument's
    // doesn't.
    const QPoint way = event->position().toPoint() - m_dragStart;
    if (m_pressedEntry.isValid() && way.manhattanLength() >= QApplication::startDragDistance()) {
        m_pressedEntry = QModelIndex(); // once
        startDrag(Qt::CopyAction);
        setState(NoState);
    }
}

void QCustomTreeView::startDrag(Qt::DropActions /*supportedActions*/)
{
    const QStringList paths = selectedPaths();
    if (paths.isEmpty()) {
        return;
    }
    auto *mime = new QMimeData;
    mime->setText(paths.join(PathSeparator));
    auto *drag = new QDrag(this);
    drag->setMimeData(mime);
    drag->setPixmap(lineIcon("file_waveform").pixmap(32, 32));
    drag->exec(Qt::CopyAction);
}

void QCustomTreeView::dragEnterEvent(QDragEnterEvent *event)
{
    dragMoveEvent(event);
}

/// The file that a drag from another program carries, if a tool is made for its type.
QString QCustomTreeView::toolFile(const QDropEvent &event) const
{
    const QList<QUrl> urls = event.source() ? QList<QUrl>() : event.mimeData()->urls();
    const QString path = urls.size() == 1 ? urls.first().toLocalFile() : QString();
    return m_modules && m_modules->firstMadeFor(path, true) ? path : QString();
}

void QCustomTreeView::dragMoveEvent(QDragMoveEvent *event)
{
    if (!toolFile(*event).isEmpty()) {
        event->acceptProposedAction();
        return;
    }
    if (!comesFromOtherPane(*event)) {
        event->ignore();
        return;
    }
    const QPoint position = event->position().toPoint();
    const int margin = autoScrollMargin();
    if (!viewport()->rect().adjusted(0, margin, 0, -margin).contains(position)) {
        startAutoScroll();
    }
    const QModelIndex target = indexAt(position);
    if (target.isValid()) {
        selectionModel()->setCurrentIndex(target, QItemSelectionModel::ClearAndSelect |
                                                      QItemSelectionModel::Rows);
    }
    event->acceptProposedAction();
}

void QCustomTreeView::dropEvent(QDropEvent *event)
{
    if (const QString path = toolFile(*event); !path.isEmpty()) {
        event->acceptProposedAction();
        m_modules->start(*m_modules->firstMadeFor(path, true), path);
        return;
    }
    if (!comesFromOtherPane(*event)) {
        event->ignore();
        return;
    }
    stopAutoScroll();
    event->acceptProposedAction();
    offerCopy(*static_cast<const QCustomTreeView *>(event->source()),
              event->mimeData()->text().split(PathSeparator), event->position().toPoint());
}

void QCustomTreeView::offerCopy(const QCustomTreeView &source, const QStringList &paths,
                                const QPoint &position)
{
    setCopy(source, paths, m_files ? m_files->pathOf(indexAt(position)) : QString());
    const bool isOneFile = m_dropSources.size() == 1;
    m_copyRunAction->setVisible(isOneFile && isRunnable(m_dropSources.first().first, device()) &&
                                !device()->isAnalyzer());
    m_copyMenu->popup(viewport()->mapToGlobal(position));
}

void QCustomTreeView::setCopy(const QCustomTreeView &source, const QStringList &paths,
                              const QString &target)
{
    m_dropSources.clear();
    for (const QString &path : paths) {
        const PaneFiles *files = source.m_files.get();
        m_dropSources.append({path, files ? files->sizeOf(files->indexOf(path)) : 0});
    }
    m_dropSourceDevice = source.device();
    m_dropTarget = folderOf(target);
}

void QCustomTreeView::copyToPeer()
{
    const QStringList paths = selectedPaths();
    if (m_peer && !paths.isEmpty()) {
        m_peer->setCopy(*this, paths, m_peer->currentPath());
        m_peer->slot_copy();
    }
}

void QCustomTreeView::copyToClipboard()
{
    const QStringList paths = selectedPaths();
    if (paths.isEmpty()) {
        return;
    }
    auto *mime = new QMimeData;
    mime->setText(paths.join(PathSeparator));
    mime->setData(clipboardFormat, clipboardTag(*this));
    QGuiApplication::clipboard()->setMimeData(mime);
    emit errMsg(
        (paths.size() == 1
             ? QString("'%1' can be pasted in the other pane.").arg(entryName(paths.first()))
             : QString("%1 entries can be pasted in the other pane.").arg(paths.size())));
}

void QCustomTreeView::pasteFromClipboard()
{
    const QMimeData *mime = QGuiApplication::clipboard()->mimeData();
    if (!m_peer || !mime || mime->data(clipboardFormat) != clipboardTag(*m_peer)) {
        emit errMsg("Nothing was copied in the other pane.");
        return;
    }
    setCopy(*m_peer, mime->text().split(PathSeparator), currentPath());
    slot_copy();
}

bool QCustomTreeView::comesFromOtherPane(const QDropEvent &event) const
{
    const auto *source = qobject_cast<const QCustomTreeView *>(event.source());
    return source && source != this && !event.mimeData()->text().isEmpty();
}

void QCustomTreeView::slot_copy()
{
    (void)copyHere();
}

bool QCustomTreeView::copyHere()
{
    if (isBusy()) {
        return false;
    }
    if (!isFolderPath(m_dropTarget)) {
        emit infoTextAvailable("The target location for the copy operation must be a folder.");
    } else if (!m_dropSourceDevice && isLocal()) {
        emit infoTextAvailable("Copy operations between local file systems are not supported.");
    } else {
        const CopyOutcome outcome = copySources();
        updateAndExpandTree(m_dropTarget);
        emit errMsg(outcome.words);
        if (device() && !device()->isOpen()) {
            emit generatorChanged(); // it has fallen silent
        }
        return outcome.isComplete;
    }
    return false;
}

void QCustomTreeView::copyAndRun()
{
    const QString copied = m_dropTarget + entryName(m_dropSources.first().first);
    // Not what was there before, when the copy has failed.
    if (copyHere()) {
        updateAndExpandTree(copied);
        slot_runwaveform();
    }
}

bool QCustomTreeView::takeFile(const QString &localPath, const QString &defaultFolder)
{
    if (isBusy() || isLocal()) {
        return false;
    }
    const QString current = currentPath();
    m_dropSources = {{localPath, 0}};
    m_dropSourceDevice = nullptr;
    m_dropTarget = folderOf(current.isEmpty() ? defaultFolder : current);
    const CopyOutcome outcome = copySources();
    const QString sent = m_dropTarget + entryName(localPath);
    updateAndExpandTree(sent);
    emit errMsg(outcome.words);
    if (!outcome.isComplete || currentPath() != sent) {
        return false;
    }
    if (!device()->isAnalyzer() && isRunnable(sent, device()) &&
        askYesNo(this, "Run!",
                 QString("'%1' is on %2, %3.\nDo you want to start it?")
                     .arg(entryName(sent), device()->model(), device()->serial()))) {
        slot_runwaveform();
    }
    return true;
}

/// One after the other; after one that fails the user is asked.
CopyOutcome QCustomTreeView::copySources()
{
    CopyOutcome all;
    for (const auto &[path, bytes] : std::as_const(m_dropSources)) {
        if (!all.isComplete &&
            !askYesNo(this, "Copy",
                      "An error occured during copying. Do you want to proceed with "
                      "the next file?")) {
            break;
        }
        const CopyOutcome one = copyEntry(this, {.sourceDevice = m_dropSourceDevice,
                                                 .source = path,
                                                 .sourceBytes = bytes,
                                                 .targetDevice = device(),
                                                 .targetFolder = m_dropTarget});
        all.files += one.files;
        all.isComplete = one.isComplete;
        all.words = one.words;
    }
    if (all.isComplete && m_dropSources.size() > 1) {
        all.words = QString("%1 files copied.").arg(all.files);
    }
    return all;
}

void QCustomTreeView::slot_move() {}

bool QCustomTreeView::isBusy()
{
    // It lives as long as its operation, hidden or not.
    return QtProgressDialog::running() != nullptr;
}
