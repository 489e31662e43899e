// SPDX-License-Identifier: Apache-2.0
#include "MainWindow.h"

#include "GeneratorLine.h"
#include "GuideWindow.h"
#include "LocalFileModel.h"
#include "LogPanel.h"
#include "PathBox.h"
#include "QCustomTreeView.h"
#include "appearance/ColorSet.h"
#include "appearance/StyleSheet.h"
#include "appearance/lineicon.h"
#include "appearance/ui/DlgColors.h"
#include "devicechoice.h"
#include "display/CWidgetBase.h"
#include "display/CWidgetTimeline.h"
#include "instrument/ui/DlgInstrConfig.h"
#include "mnemonics.h"
#include "settingsstores.h"
#include "splittersettings.h"
#include "toolframe/QtProgressDialog.h"
#include "toolframe/questions.h"
#include "toolframe/windowplace.h"
#include "ui_MainWindow.h"

#include <QCloseEvent>
#include <QFileInfo>
#include <QMessageBox>
#include <QPainter>
#include <QPointer>
#include <QShortcut>
#include <QSignalBlocker>
#include <QStatusTipEvent>
#include <QTimer>
#include <QWindow>

namespace {

constexpr int FrameWidth = 2;

} // namespace

MainWindow::MainWindow()
    : m_ui(std::make_unique<Ui::AppMainWindow>())
{
    setAttribute(Qt::WA_DeleteOnClose);
    m_ui->setupUi(this);
    for (QToolButton *button : {m_ui->tb_refresh_1, m_ui->tb_refresh_2}) {
        button->setIcon(lineIcon("refresh"));
    }
    m_panes[0] = {m_ui->w_pane_1,
                  m_ui->cb_dev_1,
                  m_ui->tb_instruments_1,
                  m_ui->cb_flt_1,
                  m_ui->tb_refresh_1,
                  m_ui->l_win1,
                  new PathBox(m_ui->cb_entry1, m_ui->pathLayout_1),
                  m_ui->tv_dev_1,
                  new GeneratorLine(m_ui->w_pane_1),
                  nullptr,
                  nullptr,
                  nullptr};
    m_panes[1] = {m_ui->w_pane_2,
                  m_ui->cb_dev_2,
                  m_ui->tb_instruments_2,
                  m_ui->cb_flt_2,
                  m_ui->tb_refresh_2,
                  m_ui->l_win2,
                  new PathBox(m_ui->cb_entry2, m_ui->pathLayout_2),
                  m_ui->tv_dev_2,
                  new GeneratorLine(m_ui->w_pane_2),
                  nullptr,
                  nullptr,
                  nullptr};
    m_log = new LogPanel(m_ui->lw_log);
    connect(&m_modules, &ModulesDb::sendRequested, this, &MainWindow::sendToInstrument);
    // Not in the middle of a drop or of the start of the program.
    connect(&m_modules, &ModulesDb::refused, this, &MainWindow::slot_infoTextAvailable,
            Qt::QueuedConnection);
    buildMenus();
    for (Pane &pane : m_panes) {
        pane.frame->layout()->setContentsMargins(FrameWidth + 1, FrameWidth + 1, FrameWidth + 1,
                                                 FrameWidth + 1);
        pane.frame->layout()->addWidget(pane.generator);
        pane.frame->installEventFilter(this);
        pane.tree->setModules(&m_modules);
        pane.tree->setPeer(otherPane(pane).tree);
    }
    const QStringList arguments = QCoreApplication::arguments();
    m_noVisa = arguments.contains("--no-visa");
    m_instrConfig = std::make_unique<DlgInstrConfig>(m_noVisa, this);
    m_colors = std::make_unique<DlgColors>(openColorStore(), this);
    setGuidePage(*m_instrConfig, "connecting-an-instrument");
    setGuidePage(*m_colors, "colors");
    connect(m_colors.get(), &DlgColors::colorsChanged, this, &MainWindow::slot_colors_updated);

    Tracer::setMask(arguments.contains("--debug") ? Tracer::DebugMask : Tracer::DefaultMask);
    connect(&m_tracer, &Tracer::TraceDataAvailable, this, &MainWindow::TraceDataAvailable);

    createDevices();
    for (Pane &pane : m_panes) {
        pane.filter->addItems({"*.*", "*.wv"});
        connectPane(pane);
        pane.localModel = std::make_unique<LocalFileModel>(&m_fileIcons);
    }
    Tracer::Trace(Tracer::Debug,
                  "System root path is " + m_panes[0].localModel->rootDirectory().path());
    for (Pane &pane : m_panes) {
        pane.remoteModel = std::make_unique<RemoteDirModel>();
        pane.remoteModel->setDevice(pane.instrument.get());
        pane.remoteModel->setIconProvider(&lineIcon);
        fillDeviceChoice(*pane.device, {});
    }
    connect(m_instrConfig.get(), &DlgInstrConfig::updateInstruments, this,
            &MainWindow::instrListUpdated);

    Tracer::Trace(Tracer::Information, "Loading program settings...");
    loadSettings();
    for (Pane &pane : m_panes) {
        selectDevice(pane);
    }
    for (Pane &pane : m_panes) {
        connect(pane.filter, &QComboBox::currentTextChanged, pane.tree,
                &QCustomTreeView::filterChanged);
        connect(pane.device, &QComboBox::currentIndexChanged, this,
                &MainWindow::newDeviceSelection);
    }
    m_panes[0].tree->setFocus();
    markActive(m_panes[0]);
    Tracer::Trace(Tracer::Information, "Startup complete");
}

MainWindow::~MainWindow()
{
    for (Pane &pane : m_panes) {
        pane.tree->setModel(nullptr);
        pane.localModel.reset();
        pane.remoteModel.reset();
        pane.instrument.reset();
    }
}

void MainWindow::connectPane(Pane &pane)
{
    connect(pane.instruments, &QToolButton::clicked, this, &MainWindow::menu_showinstrconfig);
    connect(pane.refresh, &QToolButton::clicked, this, &MainWindow::slot_refresh);
    connect(pane.tree, &QCustomTreeView::errMsg, this, &MainWindow::errMsg);
    connect(pane.tree, &QCustomTreeView::infoTextAvailable, this,
            &MainWindow::slot_infoTextAvailable);
    connect(pane.tree, &QCustomTreeView::localDefaultFolderSet, this,
            &MainWindow::slot_localDefaultFolderSet);
    connect(pane.tree, &QCustomTreeView::remoteDefaultFolderSet, this,
            &MainWindow::slot_remoteDefaultFolderSet);
    connect(pane.tree, &QCustomTreeView::itemSelected, this, &MainWindow::slot_itemSelected);
    connect(pane.tree, &QCustomTreeView::selectionLost, this, &MainWindow::slot_selectionLost);
    connect(pane.tree, &QCustomTreeView::otherPaneRequested, this,
            [this, &pane] { otherPane(pane).tree->setFocus(Qt::TabFocusReason); });
    connect(pane.tree, &QCustomTreeView::generatorChanged, pane.generator, &GeneratorLine::refresh);
    connect(pane.generator, &GeneratorLine::said, this, &MainWindow::errMsg);
    connect(pane.path, &PathBox::pathChosen, this, [this, &pane](const QString &path) {
        goTo(pane, path);
        if (pane.tree->currentPath() == path) {
            // For the keys that come next; the list of completions gives the focus back to the
            // field when it goes.
            QTimer::singleShot(0, pane.tree, [&pane] { pane.tree->setFocus(); });
        }
    });
    connect(pane.path, &PathBox::upRequested, pane.tree, &QCustomTreeView::goUp);
    connect(pane.path, &PathBox::homeRequested, this, [this, &pane] { goHome(pane); });
}

void MainWindow::TraceDataAvailable()
{
    const QList<Tracer::Entry> entries = Tracer::takeEntries();
    if (entries.isEmpty()) {
        return;
    }
    m_log->append(entries);
}

void MainWindow::errMsg(const QString &sTxt)
{
    statusBar()->showMessage(sTxt);
}

bool MainWindow::event(QEvent *event)
{
    // An opened menu without a tip of its own leaves the last message.
    if (event->type() == QEvent::StatusTip &&
        static_cast<QStatusTipEvent *>(event)->tip().isEmpty()) {
        return true;
    }
    return QMainWindow::event(event);
}

/// A frame in the colour of the selection tells the active pane from afar.
bool MainWindow::eventFilter(QObject *watched, QEvent *event)
{
    if (event->type() == QEvent::Paint && m_activePane != nullptr &&
        watched == m_activePane->frame) {
        QPainter painter(m_activePane->frame);
        painter.setPen(QPen(palette().color(QPalette::Highlight), FrameWidth));
        constexpr double Half = FrameWidth / 2.0;
        painter.drawRect(QRectF(m_activePane->frame->rect()).adjusted(Half, Half, -Half, -Half));
    }
    return QMainWindow::eventFilter(watched, event);
}

void MainWindow::slot_colors_updated()
{
    applyColors();
    markActive(*m_activePane); // its picture is none of the style
    const QWidgetList widgets = QApplication::allWidgets();
    for (QWidget *widget : widgets) {
        if (auto *plot = qobject_cast<CWidgetBase *>(widget)) {
            plot->setColors(static_cast<int>(colorPreset()));
        } else if (auto *timeline = qobject_cast<CWidgetTimeline *>(widget)) {
            timeline->setColors(static_cast<int>(colorPreset()));
        }
    }
}

void MainWindow::slot_infoTextAvailable(const QString &sInfoText)
{
    QMessageBox box(QMessageBox::Information, windowTitle(), sInfoText, QMessageBox::Ok, this);
    box.setTextFormat(Qt::PlainText);
    box.exec();
}

void MainWindow::slot_localDefaultFolderSet(const QString &sDefaultFolder)
{
    m_locPath = sDefaultFolder;
    m_absentLocPath.clear();
    Tracer::Trace(Tracer::Information,
                  QString("Set local default folder '%1'").arg(sDefaultFolder));
}

void MainWindow::slot_itemSelected(const QString &sItem)
{
    const Pane &pane = paneOf(sender());
    if (!sItem.isEmpty()) { // as that of a row that says why there are no entries
        pane.path->show(sItem);
    }
    m_modules.setSelection(sItem, pane.tree->isLocal());
    markActive(pane);
}

/// The filter has hidden what was selected: no tool may run on it unseen.
void MainWindow::slot_selectionLost()
{
    const Pane &pane = paneOf(sender());
    if (m_activePane == &pane) {
        m_modules.setSelection({}, pane.tree->isLocal());
    }
}

void MainWindow::goTo(Pane &pane, const QString &path)
{
    pane.tree->updateAndExpandTree(path);
    if (const QString shown = pane.tree->currentPath(); shown != path) {
        // What is gone leaves the list, which names again what the tree shows.
        pane.path->forget(path, shown);
    }
    markActive(pane);
}

void MainWindow::openFiles(const QStringList &files)
{
    for (const QString &file : files) {
        const QString path = QFileInfo(file).absoluteFilePath();
        if (!QFileInfo::exists(path)) {
            Tracer::Trace(Tracer::Error, QString("There is no file '%1'.").arg(path));
        } else if (QFileInfo(path).isDir()) {
            goTo(m_panes[0], path);
        } else {
            m_modules.open(path);
        }
    }
    if (!files.isEmpty() && QFileInfo::exists(files.first())) {
        goTo(m_panes[0], QFileInfo(files.first()).absoluteFilePath());
    }
}

void MainWindow::markActive(const Pane &active)
{
    constexpr int MarkSize = 16;
    m_activePane = &active;
    active.activeMark->setPixmap(
        lineIcon("attach").pixmap(QSize(MarkSize, MarkSize), devicePixelRatioF()));
    otherPane(active).activeMark->clear();
    for (const Pane &pane : m_panes) {
        pane.frame->update();
    }
    announceSendTarget();
}

MainWindow::Pane &MainWindow::paneOf(const QObject *widget)
{
    const Pane &second = m_panes[1];
    const bool isSecond = widget == second.device || widget == second.filter ||
                          widget == second.refresh || widget == second.tree;
    return m_panes[isSecond ? 1 : 0];
}

MainWindow::Pane &MainWindow::otherPane(const Pane &pane)
{
    return m_panes[&pane == &m_panes[0] ? 1 : 0];
}

void MainWindow::loadSettings()
{
    const auto settings = openMainStore();
    if (settings->status() == QSettings::FormatError) {
        Tracer::Trace(Tracer::Warning, QString("The settings file '%1' is damaged. What can't be "
                                               "read of it takes its first value again.")
                                           .arg(settings->fileName()));
    }
    readWindowPlace(*settings, *this, {50, 50}, {700, 500});
    readSplitter(*settings, "v", *m_ui->sp_dev);
    readSplitter(*settings, "h", *m_ui->sp_h);
    m_locPath = settings->value("locpath", QDir::homePath()).toString();
    if (!QFileInfo::exists(m_locPath)) {
        // It may lie on a share or a stick that will be there the next time.
        m_absentLocPath = m_locPath;
        Tracer::Trace(Tracer::Warning,
                      QString("The local default folder '%1' is not there.").arg(m_locPath));
        m_locPath = QDir::homePath();
    }
    for (int pane = 0; pane < 2; ++pane) {
        m_panes.at(static_cast<std::size_t>(pane)).tree->readSettings(*settings, pane + 1);
    }
    m_formerResources = settings->value("pane_resources").toStringList();
    m_modules.readAllSettings(*settings);
}

void MainWindow::saveSettings()
{
    const auto settings = openMainStore();
    writeWindowPlace(*settings, *this);
    writeSplitter(*settings, "v", *m_ui->sp_dev);
    writeSplitter(*settings, "h", *m_ui->sp_h);
    settings->setValue("locpath", m_absentLocPath.isEmpty() ? m_locPath : m_absentLocPath);
    for (int pane = 0; pane < 2; ++pane) {
        m_panes.at(static_cast<std::size_t>(pane)).tree->writeSettings(*settings, pane + 1);
    }
    if (m_knowsInstruments) {
        settings->setValue("pane_resources", QStringList{m_panes[0].resource, m_panes[1].resource});
        m_instrConfig->writeSettings(*settings);
    }
    m_modules.writeAllSettings(*settings);
    settings->sync();
    // A damaged file was told of when it was read, and is a sound one by now.
    if (settings->status() == QSettings::AccessError) {
        QMessageBox box(QMessageBox::Critical, windowTitle(),
                        "The settings file cannot be written.\n", QMessageBox::Ok);
        box.setInformativeText(QString("No access to '%1'.").arg(settings->fileName()));
        box.exec();
    }
}

void MainWindow::readInstruments()
{
    constexpr int PollMs = 10;
    if (m_knowsInstruments || m_asksInstruments || !isVisible()) {
        return;
    }
    if (windowHandle() != nullptr && !windowHandle()->isExposed()) {
        QTimer::singleShot(PollMs, this, &MainWindow::readInstruments);
        return;
    }
    m_asksInstruments = true; // with the events of the window going on
    m_instrConfig->readSettings(*openMainStore());
    m_knowsInstruments = true;
    showAgain(m_formerResources);
}

void MainWindow::closeEvent(QCloseEvent *event)
{
    if (!mayClose()) {
        event->ignore();
        return;
    }
    hide();
    saveSettings();
    m_instrConfig->close();
    m_colors->close();
    if (m_guide) {
        m_guide->close();
    }
    m_modules.closeAll();
    event->accept();
}

bool MainWindow::mayClose()
{
    QPointer<QtProgressDialog> running = QtProgressDialog::running();
    if (!running) {
        return true;
    }
    running->suspend();
    const bool agreed =
        askYesNo(this, windowTitle(),
                 "An operation is still running.\nDo you want to stop it and close the program?");
    if (!running) {
        return agreed;
    }
    running->resume();
    if (agreed) {
        // The operation ends at its next tick; the window can't go before.
        connect(running, &QObject::destroyed, this, &MainWindow::close, Qt::QueuedConnection);
        running->reject();
    }
    return false;
}

void MainWindow::hideEvent(QHideEvent *event)
{
    m_showsInstrConfig = m_instrConfig->isVisible();
    m_instrConfig->hide();
    m_showsColors = m_colors->isVisible();
    m_colors->hide();
    m_modules.hideAll();
    QMainWindow::hideEvent(event);
}

void MainWindow::showEvent(QShowEvent *event)
{
    QMainWindow::showEvent(event);
    m_modules.showAgain();
    if (!m_knowsInstruments) {
        // Instruments may take their time to answer: the window is there before they are asked.
        QTimer::singleShot(0, this, &MainWindow::readInstruments);
    }
    if (m_showsInstrConfig) {
        m_instrConfig->show();
    }
    if (m_showsColors) {
        m_colors->show();
    }
}
