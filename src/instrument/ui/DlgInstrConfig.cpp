// SPDX-License-Identifier: Apache-2.0
#include "DlgInstrConfig.h"

#include "appearance/lineicon.h"
#include "instrument/InstrumentSummary.h"
#include "instrument/VisaDevice.h"
#include "instrument/remotepaths.h"
#include "jobs/instrument/LanScanJob.h"
#include "jobs/instrument/ScanJob.h"
#include "log/Tracer.h"
#include "toolframe/runjob.h"
#include "toolframe/windowplace.h"
#include "ui_DlgInstrConfig.h"

#include <QAction>
#include <QHeaderView>
#include <QInputDialog>
#include <QLabel>
#include <QMessageBox>
#include <QScopedValueRollback>
#include <QSet>
#include <QSettings>
#include <QSignalBlocker>

#include <algorithm>

namespace {

enum Column { DeviceColumn, ValueColumn, CommentColumn };

/// The VISA resource of a top item, by which its entry is found.
constexpr int ResourceRole = Qt::UserRole;
constexpr int BusyRole = Qt::UserRole + 1;
constexpr const char *BusyIcon = "device_busy";
constexpr const char *BusyText = "A pane works with the instrument.";
constexpr const char *OnlineIcon = "device_online";
constexpr const char *OnlineText = "The instrument answers.";

QString itemResource(const QTreeWidgetItem &item)
{
    return item.data(DeviceColumn, ResourceRole).toString();
}

QTreeWidgetItem *topItem(QTreeWidgetItem *item)
{
    return item != nullptr && item->parent() != nullptr ? item->parent() : item;
}

} // namespace

DlgInstrConfig::DlgInstrConfig(bool noVisa, QWidget *parent)
    : QDialog(parent)
    , m_ui(std::make_unique<Ui::DlgInstrConfig>())
    , m_noVisa(noVisa)
{
    m_ui->setupUi(this);
    const std::pair<QPushButton *, const char *> icons[] = {
        {m_ui->pb_add, "add"},       {m_ui->pb_scan_usb, "scan"},   {m_ui->pb_scan_gpib, "scan"},
        {m_ui->pb_scan_lan, "scan"}, {m_ui->pb_refresh, "refresh"}, {m_ui->pb_delete, "delete"},
        {m_ui->pb_clear, "clear"},   {m_ui->pb_close, "close"},
    };
    for (const auto &[button, icon] : icons) {
        button->setIcon(lineIcon(icon));
    }
    m_ui->tw_instruments->setAccessibleName("Instruments");
    m_hint = new QLabel(noVisa ? "No instruments.\n\nThe program was started without VISA and "
                                 "cannot reach any."
                               : "No instruments yet.\n\nAdd one by its address above, or scan the "
                                 "interfaces below.");
    m_hint->setObjectName("l_hint");
    m_hint->setAlignment(Qt::AlignCenter);
    m_hint->setWordWrap(true);
    m_hint->setForegroundRole(QPalette::PlaceholderText);
    m_hint->setAttribute(Qt::WA_TransparentForMouseEvents);
    (new QVBoxLayout(m_ui->tw_instruments->viewport()))->addWidget(m_hint);
    m_ui->tw_instruments->setHeaderLabels({"Device", "Interface", "Comment"});
    QHeaderView *header = m_ui->tw_instruments->header();
    header->setStretchLastSection(true);
    header->setSectionsMovable(false);

    connect(m_ui->pb_add, &QPushButton::clicked, this, &DlgInstrConfig::instr_add_manual);
    connect(m_ui->pb_scan_usb, &QPushButton::clicked, this, &DlgInstrConfig::instr_scan_usb);
    connect(m_ui->pb_scan_gpib, &QPushButton::clicked, this, &DlgInstrConfig::instr_scan_gpib);
    connect(m_ui->pb_scan_lan, &QPushButton::clicked, this, &DlgInstrConfig::instr_scan_lan);
    connect(m_ui->pb_refresh, &QPushButton::clicked, this, &DlgInstrConfig::instr_refresh);
    connect(m_ui->pb_delete, &QPushButton::clicked, this, &DlgInstrConfig::instr_removedevice);
    connect(m_ui->pb_clear, &QPushButton::clicked, this, &DlgInstrConfig::askToClear);
    connect(m_ui->pb_close, &QPushButton::clicked, this, &DlgInstrConfig::reject);
    const QTreeWidget *tree = m_ui->tw_instruments;
    connect(tree, &QTreeWidget::itemChanged, this, &DlgInstrConfig::instr_itemChanged);
    connect(tree, &QTreeWidget::itemDoubleClicked, this, &DlgInstrConfig::widgetItemDoubleClicked);
    connect(tree, &QTreeWidget::currentItemChanged, this, &DlgInstrConfig::updateView);
    connect(tree, &QTreeWidget::itemExpanded, this, &DlgInstrConfig::fitColumns);
    addActions();
    fitColumns();
    updateView();
}

DlgInstrConfig::~DlgInstrConfig() = default;

/// The keys and the context menu of the tree.
void DlgInstrConfig::addActions()
{
    QTreeWidget *tree = m_ui->tw_instruments;
    const auto add = [tree](const QString &text, const QList<QKeySequence> &keys) {
        auto *action = new QAction(text, tree);
        action->setShortcuts(keys);
        // The input line has a use of its own for these keys.
        action->setShortcutContext(Qt::WidgetShortcut);
        tree->addAction(action);
        return action;
    };
    connect(add("&Comment...", {Qt::Key_F2, Qt::Key_Return, Qt::Key_Enter}), &QAction::triggered,
            this,
            [this, tree] { widgetItemDoubleClicked(topItem(tree->currentItem()), CommentColumn); });
    // The view's own key works in the first column alone.
    connect(add("&Enable or Disable", {Qt::Key_Space}), &QAction::triggered, this, [tree] {
        if (QTreeWidgetItem *item = topItem(tree->currentItem())) {
            const bool isChecked = item->checkState(DeviceColumn) == Qt::Checked;
            item->setCheckState(DeviceColumn, isChecked ? Qt::Unchecked : Qt::Checked);
        }
    });
    QAction *remove = add("&Delete", {QKeySequence::Delete});
    remove->setIcon(lineIcon("delete"));
    connect(remove, &QAction::triggered, this, &DlgInstrConfig::instr_removedevice);
}

void DlgInstrConfig::setDefaultFolder(const QString &model, const QString &serial,
                                      const QString &folder)
{
    m_list.setFolder(model, serial, folder);
}

void DlgInstrConfig::readSettings(QSettings &settings)
{
    settings.beginGroup("InstrConfig");
    readWindowPlace(settings, *this, {200, 200}, {520, 580});
    m_ui->le_manual->setText(settings.value("manualrsc").toString());
    m_list.read(settings);
    settings.endGroup();
    instr_refresh();
}

void DlgInstrConfig::writeSettings(QSettings &settings)
{
    settings.beginGroup("InstrConfig");
    writeWindowPlace(settings, *this);
    settings.setValue("manualrsc", m_ui->le_manual->text());
    m_list.write(settings);
    settings.endGroup();
}

void DlgInstrConfig::instr_refresh()
{
    if (m_busy) {
        return;
    }
    rebuildTree();
    say({});
    emit updateInstruments();
}

void DlgInstrConfig::rebuildTree()
{
    const QScopedValueRollback<bool> busy(m_busy, true);
    QTreeWidget *tree = m_ui->tw_instruments;
    QSet<QString> expanded;
    for (int row = 0; row < tree->topLevelItemCount(); ++row) {
        const QTreeWidgetItem *item = tree->topLevelItem(row);
        if (item->isExpanded()) {
            expanded.insert(itemResource(*item));
        }
    }
    const QTreeWidgetItem *currentItem = topItem(tree->currentItem());
    const QString current = currentItem != nullptr ? itemResource(*currentItem) : QString();

    tree->clear();
    const QList<InstrConfigEntry> entries = m_list.entries();
    if (m_noVisa) {
        for (const InstrConfigEntry &entry : entries) {
            showOffline(entry, false);
        }
    } else if (!entries.isEmpty()) {
        LookJob job(entries, m_noVisa);
        (void)runJob(job, this, nullptr);
        for (qsizetype i = 0; i < entries.size(); ++i) {
            const LookJob::State &state = job.states().at(i);
            if (state.summary) {
                m_list.identify(i, entryOf(*state.summary, {}));
                showOnline(entries.at(i), *state.summary);
            } else {
                showOffline(entries.at(i), state.isBusy);
            }
        }
    }
    for (const QString &resource : std::as_const(expanded)) {
        if (QTreeWidgetItem *item = itemOf(resource)) {
            item->setExpanded(true);
        }
    }
    tree->setCurrentItem(itemOf(current));
    fitColumns();
    updateView();
}

void DlgInstrConfig::instr_add_manual()
{
    const QString resource = resourceOf(m_ui->le_manual->text());
    if (m_busy || resource.isEmpty()) {
        return;
    }
    const QString trying = QString("Trying to open device '%1'...").arg(resource);
    Tracer::Trace(Tracer::Information, trying);
    say(trying);
    const InstrConfigEntry present = m_list.entries().value(m_list.indexOf(resource));
    if (VisaDevice(m_noVisa).isOpenElsewhere(present.model, present.serial)) {
        // A second session might disturb the pane that works with it.
        reportKnownInstrument(present);
        say("The instrument was already added and is in use.");
        return;
    }
    IdentifyJob job({.resource = resource, .noVisa = m_noVisa});
    bool isKnown = false;
    {
        const QScopedValueRollback<bool> busy(m_busy, true);
        isKnown = runJob(job, this, nullptr) == JobOutcome::Finished;
    }
    if (!isKnown) {
        const QString reason = QString("The device '%1' was not added.").arg(resource);
        Tracer::Trace(Tracer::Error, reason);
        say(reason + " See the log.");
        return;
    }
    const bool isNew = addOnline(job.summary(), "Manually Added");
    say(QString(isNew ? "The instrument '%1' was added." : "The instrument '%1' was already added.")
            .arg(instrumentName(job.summary().model, job.summary().serial)));
    m_ui->le_manual->selectAll();
    emit updateInstruments();
}

void DlgInstrConfig::instr_scan_gpib()
{
    scan(VisaDevice::ScanGpib, "GPIB Scan");
}

void DlgInstrConfig::instr_scan_usb()
{
    scan(VisaDevice::ScanUsb, "USB Scan");
}

void DlgInstrConfig::scan(int kind, const QString &origin)
{
    if (m_busy) {
        return;
    }
    ScanJob job(kind, m_noVisa);
    JobOutcome outcome = JobOutcome::Failed;
    {
        const QScopedValueRollback<bool> busy(m_busy, true);
        outcome = runJob(job, this, nullptr);
    }
    addFound(job.found(), outcome, origin);
}

void DlgInstrConfig::instr_scan_lan()
{
    if (m_busy) {
        return;
    }
    LanScanJob job(LanScanJob::DefaultSeconds, m_noVisa);
    JobOutcome outcome = JobOutcome::Failed;
    {
        const QScopedValueRollback<bool> busy(m_busy, true);
        outcome = runJob(job, this, nullptr);
    }
    QList<InstrumentSummary> found;
    for (const LanInstrument &instrument : job.found()) {
        found.append(instrument.summary);
    }
    addFound(found, outcome, "LAN Scan");
}

void DlgInstrConfig::addFound(const QList<InstrumentSummary> &found, JobOutcome outcome,
                              const QString &origin)
{
    const auto added =
        std::count_if(found.cbegin(), found.cend(),
                      [&](const InstrumentSummary &summary) { return addOnline(summary, origin); });
    if (found.isEmpty()) {
        say(outcome == JobOutcome::Failed ? "The scan could not be made. See the log."
                                          : "The scan found no instrument.");
        return;
    }
    say(added == 0   ? QString("The scan found no new instrument.")
        : added == 1 ? QString("The scan found 1 new instrument.")
                     : QString("The scan found %1 new instruments.").arg(added));
    emit updateInstruments();
}

void DlgInstrConfig::askToClear()
{
    // Comments and folders of the whole list go with it.
    const auto answer = QMessageBox::question(
        this, "Delete All",
        QString("Delete all %1 instruments from the list?").arg(m_list.entries().size()));
    if (answer == QMessageBox::Yes) {
        instr_clearlist();
    }
}

void DlgInstrConfig::instr_clearlist()
{
    if (m_busy) {
        return;
    }
    m_list.clear();
    m_ui->tw_instruments->clear();
    updateView();
    say({});
    emit updateInstruments();
}

void DlgInstrConfig::instr_removedevice()
{
    QTreeWidget *tree = m_ui->tw_instruments;
    QTreeWidgetItem *item = topItem(tree->currentItem());
    if (m_busy || item == nullptr) {
        return;
    }
    m_list.remove(m_list.indexOf(itemResource(*item)));
    // The next one is current then, so that several can be removed by one key.
    const int row = tree->indexOfTopLevelItem(item);
    const bool isLast = row + 1 == tree->topLevelItemCount();
    tree->setCurrentItem(tree->topLevelItem(isLast ? row - 1 : row + 1));
    instr_refresh();
}

void DlgInstrConfig::instr_itemChanged(QTreeWidgetItem *item, int column)
{
    if (item == nullptr || item->parent() != nullptr || column != DeviceColumn) {
        return;
    }
    const bool isChecked = item->checkState(DeviceColumn) == Qt::Checked;
    if (m_list.setEnabled(m_list.indexOf(itemResource(*item)), isChecked)) {
        emit updateInstruments();
    }
}

void DlgInstrConfig::widgetItemDoubleClicked(QTreeWidgetItem *item, int /*column*/)
{
    if (m_busy || item == nullptr || item->parent() != nullptr) {
        return;
    }
    const QString resource = itemResource(*item);
    bool isAccepted = false;
    const QString comment =
        QInputDialog::getText(this, "Enter Comment", "Enter optional comment", QLineEdit::Normal,
                              item->text(CommentColumn), &isAccepted);
    if (!isAccepted || !m_list.setComment(m_list.indexOf(resource), comment)) {
        return;
    }
    // The tree may have been built anew meanwhile.
    if (QTreeWidgetItem *present = itemOf(resource)) {
        present->setText(CommentColumn, comment);
    }
    emit updateInstruments();
}

bool DlgInstrConfig::addOnline(const InstrumentSummary &summary, const QString &origin)
{
    const qsizetype index = m_list.add(entryOf(summary, origin));
    if (index < 0) {
        return false;
    }
    showOnline(m_list.entries().at(index), summary);
    QTreeWidget *tree = m_ui->tw_instruments;
    tree->setCurrentItem(itemOf(summary.resource));
    fitColumns();
    updateView();
    return true;
}

void DlgInstrConfig::showOnline(const InstrConfigEntry &entry, const InstrumentSummary &summary)
{
    InstrConfigEntry shown = entry;
    shown.model = summary.model;
    shown.serial = summary.serial;
    shown.interface = summary.interfaceName;
    QTreeWidgetItem *item = showItem(shown, OnlineIcon, OnlineText);
    const auto rows = summaryRows(summary);
    for (const auto &[label, value] : rows) {
        new QTreeWidgetItem(item, QStringList{label, value});
    }
}

void DlgInstrConfig::showOffline(const InstrConfigEntry &entry, bool busy)
{
    if (!isComplete(entry)) {
        return;
    }
    const QString state = busy            ? QString(BusyText)
                          : entry.enabled ? "The instrument does not answer."
                                          : "The instrument is not checked and was not asked.";
    QTreeWidgetItem *item = showItem(entry, busy ? BusyIcon : "device_offline", state);
    new QTreeWidgetItem(item, QStringList{"VISA resource", entry.resource});
}

/// Makes the top item of an entry, or makes it anew if it is there.
QTreeWidgetItem *DlgInstrConfig::showItem(const InstrConfigEntry &entry, const QString &icon,
                                          const QString &state)
{
    QTreeWidget *tree = m_ui->tw_instruments;
    // Only what the user changes is to reach instr_itemChanged.
    const QSignalBlocker blocker(tree);
    QTreeWidgetItem *item = itemOf(entry.resource);
    if (item == nullptr) {
        item = new QTreeWidgetItem(tree);
    }
    qDeleteAll(item->takeChildren());
    item->setData(DeviceColumn, ResourceRole, entry.resource);
    item->setText(DeviceColumn, instrumentName(entry.model, entry.serial));
    item->setText(ValueColumn, entry.interface);
    item->setText(CommentColumn, entry.comment);
    setState(*item, icon, state);
    item->setFlags(Qt::ItemIsEnabled | Qt::ItemIsSelectable | Qt::ItemIsUserCheckable);
    item->setCheckState(DeviceColumn, entry.enabled ? Qt::Checked : Qt::Unchecked);
    return item;
}

QTreeWidgetItem *DlgInstrConfig::itemOf(const QString &resource) const
{
    const QTreeWidget *tree = m_ui->tw_instruments;
    for (int row = 0; row < tree->topLevelItemCount(); ++row) {
        QTreeWidgetItem *item = tree->topLevelItem(row);
        if (itemResource(*item).compare(resource, Qt::CaseInsensitive) == 0) {
            return item;
        }
    }
    return nullptr;
}

void DlgInstrConfig::setState(QTreeWidgetItem &item, const QString &icon, const QString &state)
{
    // Only what the user changes is to reach instr_itemChanged.
    const QSignalBlocker blocker(m_ui->tw_instruments);
    item.setIcon(DeviceColumn, lineIcon(icon));
    item.setToolTip(DeviceColumn, state);
    item.setData(DeviceColumn, BusyRole, icon == BusyIcon);
}

/// Panes open and close instruments while the list is out of sight.
void DlgInstrConfig::showEvent(QShowEvent *event)
{
    QDialog::showEvent(event);
    const QList<InstrConfigEntry> entries = m_busy ? QList<InstrConfigEntry>() : m_list.entries();
    for (const InstrConfigEntry &entry : entries) {
        QTreeWidgetItem *item = itemOf(entry.resource);
        if (item == nullptr) {
            continue;
        }
        if (VisaDevice(m_noVisa).isOpenElsewhere(entry.model, entry.serial)) {
            setState(*item, BusyIcon, BusyText);
        } else if (item->data(DeviceColumn, BusyRole).toBool()) {
            setState(*item, OnlineIcon, OnlineText);
        }
    }
}

void DlgInstrConfig::updateView()
{
    QTreeWidget *tree = m_ui->tw_instruments;
    m_hint->setVisible(tree->topLevelItemCount() == 0);
    const bool hasCurrent = tree->currentItem() != nullptr;
    m_ui->pb_delete->setEnabled(hasCurrent);
    const QList<QAction *> actions = tree->actions();
    for (QAction *action : actions) {
        action->setEnabled(hasCurrent);
    }
    m_ui->pb_clear->setEnabled(!m_list.entries().isEmpty());
}

void DlgInstrConfig::fitColumns()
{
    constexpr int Gap = 12;
    QTreeWidget *tree = m_ui->tw_instruments;
    for (const int column : {DeviceColumn, ValueColumn}) {
        tree->resizeColumnToContents(column);
        tree->setColumnWidth(column, tree->columnWidth(column) + Gap);
    }
}

/// Tells the outcome of the last action, which has its full words in the log.
void DlgInstrConfig::say(const QString &text)
{
    m_ui->l_status->setText(text);
    // At once, as asking an instrument blocks.
    m_ui->l_status->repaint();
}
