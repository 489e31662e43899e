// SPDX-License-Identifier: Apache-2.0
// What the panes show: the local file system or one of the instruments.
#include "MainWindow.h"

#include "GeneratorLine.h"
#include "LocalFileModel.h"
#include "PathBox.h"
#include "QCustomTreeView.h"
#include "RemotePaneFiles.h"
#include "devicechoice.h"
#include "instrument/ui/DlgInstrConfig.h"
#include "toolframe/WaitCursor.h"
#include "toolframe/questions.h"

#include <QComboBox>
#include <QMessageBox>
#include <QSignalBlocker>
#include <QStatusBar>

#include <algorithm>

void MainWindow::createDevices()
{
    QString failures;
    QString failure;
    for (std::size_t i = 0; i < m_panes.size(); ++i) {
        auto device = std::make_unique<VisaDevice>(m_noVisa);
        device->setQuestion([this](const QString &title, const QString &text) {
            return askYesNo(this, title, text);
        });
        // Both use the same library, of whose failure the first one tells.
        const QString reported = device->takeLastError();
        failure = reported.isEmpty() ? failure : reported;
        failures += QString("  Device %1 : %2\n").arg(i + 1).arg(failure);
        m_panes.at(i).instrument = std::move(device);
    }
    if (!failure.isEmpty()) {
        QMessageBox::critical(this, windowTitle(),
                              "The VISA interfaces failed to initialize:\n" + failures);
    }
}

void MainWindow::slot_remoteDefaultFolderSet(VisaDevice *pcVisaDevice,
                                             const QString &sDefaultFolder)
{
    Tracer::Trace(Tracer::Information,
                  QString("Set default folder '%1', Instrument %2, %3")
                      .arg(sDefaultFolder, pcVisaDevice->model(), pcVisaDevice->serial()));
    m_instrConfig->setDefaultFolder(pcVisaDevice->model(), pcVisaDevice->serial(), sDefaultFolder);
}

void MainWindow::slot_refresh()
{
    refresh(paneOf(sender()));
}

void MainWindow::goHome(Pane &pane)
{
    pane.tree->updateAndExpandTree(pane.tree->isLocal() ? m_locPath : defaultFolder(pane));
    markActive(pane);
}

/// What is current stays so.
void MainWindow::refresh(Pane &pane)
{
    const QString current = pane.tree->currentPath();
    if (pane.tree->isLocal()) {
        pane.tree->updateAndExpandTree(current.isEmpty() ? m_locPath : current);
        return;
    }
    const QString shown = current.isEmpty() ? defaultFolder(pane) : current;
    pane.tree->updateAndExpandTree(shown);
    if (!RemotePaneFiles::answers(*pane.remoteModel) && openInstrument(pane)) {
        pane.tree->updateAndExpandTree(shown);
    }
    pane.generator->showDevice(pane.instrument.get());
    announceSendTarget();
}

void MainWindow::newDeviceSelection(int /*iIndex*/)
{
    selectDevice(paneOf(sender()));
}

void MainWindow::selectDevice(Pane &pane)
{
    const bool isTaken = isSameInstrument(*pane.device, *otherPane(pane).device);
    if (isTaken) {
        Tracer::Trace(Tracer::Warning, "Warning: The same device cannot be selected twice.");
        const QSignalBlocker blocker(pane.device);
        pane.device->setCurrentIndex(0);
    }
    if (const QString path = pane.tree->currentPath(); !path.isEmpty()) {
        pane.visited.insert(pane.resource, path);
    }
    pane.resource = pane.device->currentData().toString();
    pane.tree->clearSelection();
    const bool isLocal = pane.resource.isEmpty();
    pane.path->restart(isLocal); // paths of another device lead nowhere
    if (isLocal) {
        showLocal(pane);
    } else {
        showInstrument(pane);
    }
    announceSendTarget();
    if (isTaken) {
        errMsg("The other pane shows this instrument already.");
    }
}

void MainWindow::showLocal(Pane &pane)
{
    pane.tree->setModel(pane.localModel.get());
    pane.generator->showDevice(nullptr);
    (void)pane.instrument->closeResource();
    pane.remoteModel->refresh();
    pane.tree->filterChanged(pane.filter->currentText());
    pane.tree->updateAndExpandTree(pane.visited.value({}, m_locPath));
}

void MainWindow::showInstrument(Pane &pane)
{
    // The folders that were open on another instrument are of no meaning here.
    pane.generator->showDevice(nullptr);
    (void)pane.instrument->closeResource();
    pane.remoteModel->refresh();
    pane.tree->setModel(pane.remoteModel.get());
    pane.tree->filterChanged(pane.filter->currentText());
    if (openInstrument(pane)) {
        Tracer::Trace(Tracer::Information,
                      QString("Device is '%1' , Serial is '%2'")
                          .arg(pane.instrument->model(), pane.instrument->serial()));
    }
    pane.tree->updateAndExpandTree(pane.visited.value(pane.resource, defaultFolder(pane)));
    pane.generator->showDevice(pane.instrument.get());
}

/// Those that are still in the list.
void MainWindow::showAgain(const QStringList &resources)
{
    for (std::size_t i = 0; i < m_panes.size(); ++i) {
        const QString resource = resources.value(static_cast<qsizetype>(i));
        const int index = resource.isEmpty() ? -1 : m_panes.at(i).device->findData(resource);
        if (index > 0) {
            m_panes.at(i).device->setCurrentIndex(index);
        }
    }
}

/// The pane with a generator: the one that isn't in use if both show one. Null if none does.
MainWindow::Pane *MainWindow::sendTarget()
{
    const auto takes = [](const Pane &pane) {
        return !pane.resource.isEmpty() && pane.instrument->isOpen() &&
               !pane.instrument->isAnalyzer();
    };
    Pane &active = m_activePane == &m_panes[1] ? m_panes[1] : m_panes[0];
    Pane &other = otherPane(active);
    return takes(other) ? &other : takes(active) ? &active : nullptr;
}

void MainWindow::announceSendTarget()
{
    const Pane *target = sendTarget();
    m_modules.setSendTarget(target == nullptr ? QString()
                                              : target->instrument->model() + ", " +
                                                    target->instrument->serial());
}

void MainWindow::sendToInstrument(const QString &path)
{
    Pane *target = sendTarget();
    if (target == nullptr) {
        announceSendTarget();
        slot_infoTextAvailable("No pane shows a generator.\n"
                               "Choose one in the list above a pane first.");
        return;
    }
    show();
    raise();
    activateWindow();
    target->tree->takeFile(path, defaultFolder(*target));
}

bool MainWindow::openInstrument(Pane &pane)
{
    const WaitCursor cursor;
    (void)pane.instrument->closeResource();
    const bool opened = pane.instrument->openResource(pane.device->currentData().toString());
    const QString reported = pane.instrument->takeLastError().trimmed();
    if (!opened) {
        if (!reported.isEmpty()) {
            Tracer::Trace(Tracer::Error, reported);
        }
        errMsg(QString("'%1' cannot be opened; see the log.").arg(pane.device->currentText()));
    } else {
        statusBar()->clearMessage(); // what it says of another one is over
    }
    return opened;
}

QString MainWindow::defaultFolder(const Pane &pane) const
{
    const QString resource = pane.device->currentData().toString();
    const QList<InstrConfigEntry> instruments = m_instrConfig->instruments();
    const auto found =
        std::find_if(instruments.cbegin(), instruments.cend(),
                     [&](const InstrConfigEntry &entry) { return entry.resource == resource; });
    return found == instruments.cend() ? QString() : found->folder;
}

void MainWindow::instrListUpdated()
{
    Tracer::Trace(Tracer::Information, "Instruments updated");
    const QList<InstrConfigEntry> instruments =
        m_noVisa ? QList<InstrConfigEntry>() : m_instrConfig->instruments();
    for (Pane &pane : m_panes) {
        const QString resource = pane.device->currentData().toString();
        int index = 0;
        {
            const QSignalBlocker blocker(pane.device);
            fillDeviceChoice(*pane.device, instruments);
            index = pane.device->findData(resource);
            pane.device->setCurrentIndex(std::max(index, 0));
        }
        if (index < 0) {
            Tracer::Trace(Tracer::Information,
                          "The previously selected instrument is not available anymore.");
            selectDevice(pane);
        }
    }
    m_modules.updateInstruments(instruments);
}
