// SPDX-License-Identifier: Apache-2.0
#include "ModulesDb.h"

#include "DlgInfo.h"
#include "GuideWindow.h"
#include "appearance/lineicon.h"
#include "composer/ui/DlgComposer.h"
#include "import/ui/DlgWvFromData.h"
#include "import/ui/DlgWvFromMat.h"
#include "import/ui/DlgWvFromRiq.h"
#include "import/ui/DlgWvFromSigmf.h"
#include "import/ui/DlgWvFromWav.h"
#include "instrument/remotepaths.h"
#include "instrument/ui/DlgSpaImport.h"
#include "log/Tracer.h"
#include "mnemonics.h"
#include "toolframe/DlgBase.h"
#include "tools/DlgExport.h"
#include "tools/DlgFilter.h"
#include "tools/DlgMarker.h"
#include "tools/DlgPolar.h"
#include "tools/DlgResample.h"
#include "tools/DlgRescale.h"
#include "tools/DlgView.h"
#include "tools/DlgWrapAround.h"
#include "tools/DlgWvCreate.h"
#include "wvfile/foreignfile.h"

#include <QAction>
#include <QFileInfo>
#include <QMenu>
#include <QMenuBar>
#include <QSettings>

#include <algorithm>
#include <utility>

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

QIcon iconOf(const ToolInfo &tool)
{
    return tool.icon.isEmpty() ? QIcon() : lineIcon(tool.icon);
}

/// The tools, in the order of the menus.
QList<ToolInfo> toolTable()
{
    using enum ToolInfo::Selection;
    ToolInfo importData = toolInfo<DlgWvFromData>("Import Data", "/Import/From Data", File, {},
                                                  "import_data", "imports");
    importData.preferredFor = {"TXT", "CSV", "DAT", "BIN", "WFM", "I", "Q"};
    ToolInfo info = toolInfo<DlgInfo>("Waveform Info", "/Analyze/File Info", File, {"WV"}, "info",
                                      "waveform-info");
    info.tellsProperties = true;
    ToolInfo view =
        toolInfo<DlgView>("View", "/Analyze/View Content", File, {"WV"}, "view", "view");
    view.preferredFor = {"WV"};
    ToolInfo composer = toolInfo<DlgComposer>("Composer", "/Edit/Composer", FileOrFolder, {"CMS"},
                                              "composer", "composer");
    composer.hasLeftWork = &DlgComposer::hasLeftWork;
    return {
        info,
        view,
        toolInfo<DlgWvCreate>("Create Signal", "/File/Create", FileOrFolder, {}, "create",
                              "create-signal"),
        toolInfo<DlgExport>("Export", "/File/Export", File, {"WV"}, "export",
                            "export-waveforms-for-other-programs"),
        importData,
        toolInfo<DlgWvFromMat>("Import MATLAB", "/Import/From MATLAB", File, {"MAT"},
                               "import_matlab", "imports"),
        toolInfo<DlgWvFromRiq>("Import RIQ", "/Import/From RIQ", File, {"RIQ"}, "import_riq",
                               "imports"),
        toolInfo<DlgWvFromSigmf>("Import SigMF", "/Import/From SigMF", File,
                                 {"SIGMF-META", "SIGMF-DATA", "SIGMF"}, "import_sigmf", "imports"),
        toolInfo<DlgWvFromWav>("Import WAV", "/Import/From WAV", File, {"WAV"}, "import_wav",
                               "imports"),
        toolInfo<DlgSpaImport>("Import From Analyzer", "/Import/From Analyzer", FileOrFolder, {},
                               "import_analyzer",
                               "import-from-analyzer-capture-view-trim-play-it-back"),
        toolInfo<DlgResample>("Resample", "/Edit/Resample", File, {"WV"}, "resample", "resample"),
        toolInfo<DlgFilter>("Filter", "/Edit/Filter", File, {"WV"}, "filter", "filter"),
        toolInfo<DlgRescale>("Level", "/Edit/Level", File, {"WV"}, "level", "level"),
        toolInfo<DlgMarker>("Edit Markers", "/Edit/Markers", File, {"WV"}, "markers", "markers"),
        toolInfo<DlgPolar>("To Polar", "/Edit/To Polar", File, {"WV"}, "polar", "to-polar"),
        composer,
        toolInfo<DlgWrapAround>("Analyze Wraparound", "/Analyze/Wrap Around", File, {"WV"}, "wrap",
                                "analyze-wraparound"),
    };
}

/// Why a tool doesn't open a file, for its user; empty where that was the user's own wish.
QString refusalText(const ToolInfo &tool, const QString &path, const QString &reason)
{
    if (reason.endsWith("aborted by user.")) {
        return {};
    }
    const QString kind = tool.extensions.contains("WV") ? foreignKind(path) : QString();
    return QString("'%1' cannot be opened in %2.\n%3")
        .arg(QFileInfo(path).fileName(), tool.name,
             kind.isEmpty() ? reason : QString("This is no waveform file: it is %1.").arg(kind))
        .trimmed();
}

} // namespace

ModulesDb::ModulesDb()
{
    for (ToolInfo &info : toolTable()) {
        addTool(std::move(info));
    }
}

ModulesDb::~ModulesDb() = default;

void ModulesDb::addTool(ToolInfo info)
{
    m_tools.push_back({std::move(info), nullptr});
}

void ModulesDb::buildMenu(QMenuBar *bar)
{
    if (!bar || !m_menuActions.isEmpty()) {
        return;
    }
    for (const Tool &tool : m_tools) {
        QString path = tool.info.menuPath;
        if (path.startsWith('/')) {
            path.remove(0, 1);
        }
        const QString title = path.section('/', 0, 0);
        const QString entry = path.section('/', 1, 1);
        if (title.isEmpty() || entry.isEmpty()) {
            continue;
        }
        QAction *action = findOrAddMenu(*bar, title)->addAction(iconOf(tool.info), entry);
        action->setEnabled(false);
        connect(action, &QAction::triggered, this, &ModulesDb::menuActionTriggered);
        m_menuActions.append({action, &tool.info});
    }
}

QList<ModulesDb::ToolAction> ModulesDb::contextActions(QObject *parent) const
{
    QList<ToolAction> actions;
    for (const Tool &tool : m_tools) {
        actions.append({new QAction(iconOf(tool.info), tool.info.name, parent), &tool.info});
    }
    return actions;
}

QList<const ToolInfo *> ModulesDb::allAllowed(const QString &path, bool local) const
{
    QList<const ToolInfo *> tools;
    for (const Tool &tool : m_tools) {
        if (tool.info.accepts(path, local)) {
            tools.append(&tool.info);
        }
    }
    return tools;
}

const ToolInfo *ModulesDb::firstAllowed(const QString &path, bool local) const
{
    const ToolInfo *made = firstMadeFor(path, local);
    return made ? made : allAllowed(path, local).value(0, nullptr);
}

const ToolInfo *ModulesDb::firstMadeFor(const QString &path, bool local) const
{
    const QList<const ToolInfo *> tools = allAllowed(path, local);
    auto tool = std::find_if(tools.begin(), tools.end(),
                             [&path](const ToolInfo *one) { return one->isPreferredFor(path); });
    if (tool == tools.end()) {
        tool = std::find_if(tools.begin(), tools.end(),
                            [&path](const ToolInfo *one) { return one->isMadeFor(path); });
    }
    return tool != tools.end() ? *tool : nullptr;
}

const ToolInfo *ModulesDb::propertiesOf(const QString &path, bool local) const
{
    const QList<const ToolInfo *> tools = allAllowed(path, local);
    const auto tool = std::find_if(tools.begin(), tools.end(),
                                   [](const ToolInfo *one) { return one->tellsProperties; });
    return tool != tools.end() ? *tool : nullptr;
}

DlgBase &ModulesDb::dialog(const ToolInfo &info)
{
    const auto tool = std::find_if(m_tools.begin(), m_tools.end(),
                                   [&info](const Tool &entry) { return &entry.info == &info; });
    Q_ASSERT(tool != m_tools.end());
    if (!tool->dialog) {
        tool->dialog = info.make();
        setGuidePage(*tool->dialog, info.guidePage);
        tool->dialog->instrumentsUpdated(m_instruments);
        tool->dialog->sendTargetChanged(m_sendTarget);
        connect(tool->dialog.get(), &DlgBase::openRequested, this, &ModulesDb::open);
        connect(tool->dialog.get(), &DlgBase::sendRequested, this, &ModulesDb::sendRequested);
        if (!m_settingsFile.isEmpty()) {
            QSettings settings(m_settingsFile, QSettings::IniFormat);
            tool->dialog->readSettings(settings);
        }
    }
    return *tool->dialog;
}

bool ModulesDb::start(const ToolInfo &tool, const QString &path)
{
    Tracer::Trace(Tracer::Debug, QString("Invoking %1.").arg(tool.name));
    DlgBase &window = dialog(tool);
    const Tracer::ErrorWatch watch;
    if (!window.startModule(path)) {
        if (const QString text = refusalText(tool, path, watch.text()); !text.isEmpty()) {
            emit refused(text);
        }
        return Tracer::fail("Cannot initialize module.");
    }
    window.setWindowState(window.windowState() & ~Qt::WindowMinimized);
    window.show();
    window.raise();
    window.activateWindow();
    return true;
}

void ModulesDb::open(const QString &path)
{
    if (const ToolInfo *tool = firstAllowed(path, true)) {
        start(*tool, path);
    }
}

void ModulesDb::offerLeftWork(const QString &folder)
{
    for (const Tool &tool : m_tools) {
        if (tool.info.hasLeftWork && tool.info.hasLeftWork()) {
            start(tool.info, folder);
        }
    }
}

void ModulesDb::setSelection(const QString &path, bool local)
{
    Tracer::Trace(Tracer::Debug,
                  QString("Selecting %1: %2.").arg(local ? "LOCAL" : "REMOTE", path));
    m_selection = path;
    for (const auto &[action, tool] : std::as_const(m_menuActions)) {
        action->setEnabled(tool->accepts(path, local));
    }
}

void ModulesDb::writeAllSettings(QSettings &settings)
{
    for (const Tool &tool : m_tools) {
        if (tool.dialog) {
            tool.dialog->writeSettings(settings);
        }
    }
}

void ModulesDb::readAllSettings(QSettings &settings)
{
    m_settingsFile = settings.fileName();
}

void ModulesDb::updateInstruments(const QList<InstrConfigEntry> &instruments)
{
    m_instruments = instruments;
    for (const Tool &tool : m_tools) {
        if (tool.dialog) {
            tool.dialog->instrumentsUpdated(instruments);
        }
    }
}

void ModulesDb::setSendTarget(const QString &instrument)
{
    m_sendTarget = instrument;
    for (const Tool &tool : m_tools) {
        if (tool.dialog) {
            tool.dialog->sendTargetChanged(instrument);
        }
    }
}

void ModulesDb::closeAll()
{
    for (const Tool &tool : m_tools) {
        if (tool.dialog) {
            tool.dialog->close();
        }
    }
}

void ModulesDb::hideAll()
{
    m_hidden.clear();
    for (const Tool &tool : m_tools) {
        if (tool.dialog && tool.dialog->isVisible()) {
            m_hidden.append(tool.dialog.get());
            tool.dialog->hide();
        }
    }
}

void ModulesDb::showAgain()
{
    for (DlgBase *dialog : std::as_const(m_hidden)) {
        dialog->show();
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
