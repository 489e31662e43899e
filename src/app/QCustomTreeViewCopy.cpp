// SPDX-License-Identifier: Apache-2.0
// Copies between the panes: by drag and drop, by the clipboard, by a key.
#include "QCustomTreeView.h"

#include "ModulesDb.h"
#include "PaneFiles.h"
#include "deviceactions.h"
#include "instrument/VisaDevice.h"
#include "instrument/remotepaths.h"
#include "jobs/instrument/CopyJob.h"
#include "toolframe/QtProgressDialog.h"

#include <QApplication>
#include <QClipboard>
#include <QDrag>
#include <QDragEnterEvent>
#include <QGuiApplication>
#include <QIcon>
#include <QMenu>
#include <QMimeData>
#include <QMouseEvent>
#include <QUrl>

namespace {

/// Marks a path in the clipboard as copied from a pane of this process.
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
    const QString path = currentPath();
    if (path.isEmpty()) {
        return;
    }
    auto *mime = new QMimeData;
    mime->setText(path);
    auto *drag = new QDrag(this);
    drag->setMimeData(mime);
    drag->setPixmap(QIcon(":/icons32/file_waveform.png").pixmap(32, 32));
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
    offerCopy(*static_cast<const QCustomTreeView *>(event->source()), event->mimeData()->text(),
              event->position().toPoint());
}

void QCustomTreeView::offerCopy(const QCustomTreeView &source, const QString &path,
                                const QPoint &position)
{
    setCopy(source, path, m_files ? m_files->pathOf(indexAt(position)) : QString());
    m_copyMenu->popup(viewport()->mapToGlobal(position));
}

void QCustomTreeView::setCopy(const QCustomTreeView &source, const QString &path,
                              const QString &target)
{
    m_dropSource = path;
    m_dropSourceDevice = source.device();
    m_dropSourceBytes = source.m_files ? source.m_files->sizeOf(source.m_files->indexOf(path)) : 0;
    m_dropTarget = folderOf(target);
}

void QCustomTreeView::copyToPeer()
{
    const QString path = currentPath();
    if (m_peer && !path.isEmpty()) {
        m_peer->setCopy(*this, path, m_peer->currentPath());
        m_peer->slot_copy();
    }
}

void QCustomTreeView::copyToClipboard()
{
    const QString path = currentPath();
    if (path.isEmpty()) {
        return;
    }
    auto *mime = new QMimeData;
    mime->setText(path);
    mime->setData(clipboardFormat, clipboardTag(*this));
    QGuiApplication::clipboard()->setMimeData(mime);
    emit errMsg(QString("'%1' can be pasted in the other pane.").arg(entryName(path)));
}

void QCustomTreeView::pasteFromClipboard()
{
    const QMimeData *mime = QGuiApplication::clipboard()->mimeData();
    if (!m_peer || !mime || mime->data(clipboardFormat) != clipboardTag(*m_peer)) {
        emit errMsg("Nothing was copied in the other pane.");
        return;
    }
    setCopy(*m_peer, mime->text(), currentPath());
    slot_copy();
}

bool QCustomTreeView::comesFromOtherPane(const QDropEvent &event) const
{
    const auto *source = qobject_cast<const QCustomTreeView *>(event.source());
    return source && source != this && !event.mimeData()->text().isEmpty();
}

void QCustomTreeView::slot_copy()
{
    if (isBusy()) {
        return;
    }
    if (!isFolderPath(m_dropTarget)) {
        emit infoTextAvailable("The target location for the copy operation must be a folder.");
    } else if (!m_dropSourceDevice && isLocal()) {
        emit infoTextAvailable("Copy operations between local file systems are not supported.");
    } else {
        const QString outcome = copyEntry(this, {.sourceDevice = m_dropSourceDevice,
                                                 .source = m_dropSource,
                                                 .sourceBytes = m_dropSourceBytes,
                                                 .targetDevice = device(),
                                                 .targetFolder = m_dropTarget});
        updateAndExpandTree(m_dropTarget);
        emit errMsg(outcome);
    }
}

void QCustomTreeView::slot_move() {}

bool QCustomTreeView::isBusy()
{
    // It lives as long as its operation, hidden or not.
    return QtProgressDialog::running() != nullptr;
}
