// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "FirstPaint.h"

#include <QFile>
#include <QObject>
#include <QPair>
#include <QSet>
#include <QString>

struct ToolInfo;
class MainWindow;
class QCustomTreeView;
class QPixmap;

/// Shows a file in the main window, leaves pictures of the window and of the tools in a folder,
/// says on standard output how long the window took to appear, and ends the program.
class ScreenshotRun : public QObject
{
    Q_OBJECT

public:
    /// Writes "main-window.png", "colors.png" and, if `file` isn't empty, pictures of all tools
    /// that take it, such as "waveform-info.png", into `folder`, which is made when missing. With
    /// instruments in the list also "instruments.png", "two-instruments.png" and "transfer.png".
    /// The window must live longer than the run.
    ScreenshotRun(MainWindow &window, QString folder, const QString &file);

    /// Makes the windows use settings of no user but the instrument list, and keep none, so that
    /// pictures look the same everywhere. To be called before the main window exists.
    static void detachSettings();

    /// Starts, once the event loop runs; ends it with 0, or with 1 and a line on standard error.
    void start();

private:
    void awaitFolders(const QCustomTreeView &tree, const QString &path);
    void folderArrived(const QCustomTreeView *tree, const QString &folder);
    void takePictures();
    [[nodiscard]] bool saveInstruments();
    [[nodiscard]] bool offersInstruments() const;
    [[nodiscard]] bool makeTransferFile();
    [[nodiscard]] bool saveTransfer();
    [[nodiscard]] bool saveTool(const ToolInfo &info) const;
    [[nodiscard]] bool save(QWidget &window, const QString &name) const;
    [[nodiscard]] bool savePicture(const QPixmap &picture, const QString &name) const;
    void finish(int status);

    MainWindow &m_window;
    FirstPaint m_firstPaint;
    QString m_folder;
    QString m_file;                                          ///< absolute, empty for none
    QSet<QPair<const QCustomTreeView *, QString>> m_arrived; ///< folders that the panes know
    QSet<QPair<const QCustomTreeView *, QString>> m_awaited; ///< folders that the picture needs
    QFile m_transferFile;
    bool m_started = false;
    bool m_finished = false;
};
