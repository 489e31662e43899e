// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "instrument/InstrumentList.h"

#include <QDialog>

#include <memory>

class QLabel;
class QSettings;
class QTreeWidgetItem;
enum class JobOutcome;
struct InstrumentSummary;

namespace Ui {
class DlgInstrConfig;
}

/// The user's list of instruments: adds them by hand or by a scan, shows which of them answer and
/// what they can do. Modeless.
///
/// Asking an instrument blocks until it answers or its time-out is over; a progress dialog with a
/// cancel button stands over all windows when that takes long, and lets the event loop run between
/// two instruments. An instrument that a pane has open is shown as busy and left alone.
class DlgInstrConfig : public QDialog
{
    Q_OBJECT

public:
    /// With `noVisa` no VISA library is loaded, and no instrument answers.
    explicit DlgInstrConfig(bool noVisa = false, QWidget *parent = nullptr);
    ~DlgInstrConfig() override;

    /// A copy of the list, disabled instruments included.
    [[nodiscard]] QList<InstrConfigEntry> instruments() const { return m_list.entries(); }

    /// Sets the folder that a pane opens first on this instrument. The window doesn't show it, and
    /// the signal isn't given.
    void setDefaultFolder(const QString &model, const QString &serial, const QString &folder);

    /// Restores the group "InstrConfig" and refreshes the list.
    void readSettings(QSettings &settings);
    void writeSettings(QSettings &settings);

public slots:
    /// Asks all enabled instruments anew.
    void instr_refresh();

    /// Adds the instrument that the input line names.
    void instr_add_manual();
    void instr_scan_gpib();
    void instr_scan_usb();
    /// Looks for instruments on all networks of this machine.
    void instr_scan_lan();

    void instr_clearlist();

    /// Removes the instrument of the current row.
    void instr_removedevice();

    /// The user has checked or unchecked an instrument.
    void instr_itemChanged(QTreeWidgetItem *item, int column);

    /// Asks for the comment of an instrument.
    void widgetItemDoubleClicked(QTreeWidgetItem *item, int column);

signals:
    /// The list has changed, or what is known of its instruments.
    void updateInstruments();

protected:
    void showEvent(QShowEvent *event) override;

private:
    void addActions();
    void scan(int kind, const QString &origin);
    void addFound(const QList<InstrumentSummary> &found, JobOutcome outcome, const QString &origin);
    void askToClear();
    void rebuildTree();
    /// True when the instrument is new.
    bool addOnline(const InstrumentSummary &summary, const QString &origin);
    void showOnline(const InstrConfigEntry &entry, const InstrumentSummary &summary);
    void showOffline(const InstrConfigEntry &entry, bool busy);
    QTreeWidgetItem *showItem(const InstrConfigEntry &entry, const QString &icon,
                              const QString &state);
    void setState(QTreeWidgetItem &item, const QString &icon, const QString &state);
    [[nodiscard]] QTreeWidgetItem *itemOf(const QString &resource) const;
    void updateView();
    void fitColumns();
    void say(const QString &text);

    std::unique_ptr<Ui::DlgInstrConfig> m_ui;
    QLabel *m_hint = nullptr; ///< in the empty tree
    InstrumentList m_list;
    bool m_noVisa = false;
    bool m_busy = false; ///< instruments are being asked
};
