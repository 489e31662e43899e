// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "instrument/ui/DlgInstrConfig.h"
#include "simulator/SimulatorProcess.h"
#include "support/files.h"

#include <QLabel>
#include <QSignalSpy>
#include <QTreeWidget>

#include <memory>

class QLineEdit;

inline const QString generator = "GPIB0::28::INSTR";
inline const QString otherGenerator = "GPIB0::5::INSTR";
inline const QString silent = "GPIB0::9::INSTR";

[[nodiscard]] InstrConfigEntry entry(const QString &model, const QString &serial,
                                     const QString &resource);

/// "online", "busy" or "offline", by the picture that is shown.
[[nodiscard]] QString stateOf(const QTreeWidgetItem *item);

/// What the tests of the instrument list's window share: two simulated instruments behind a
/// gateway, at whose third address nothing answers, and a window that is open.
class InstrListTest : public QObject
{
    Q_OBJECT

private slots:
    void init();
    void cleanup();

protected:
    /// Brings a list in by the settings, as at the start of the program.
    void fill(const QList<InstrConfigEntry> &entries);

    /// Types into the input line, with Return.
    void type(const QString &text);
    void click(const char *button);

    /// The top rows, "state|device|interface|comment".
    [[nodiscard]] QStringList rows() const;
    [[nodiscard]] QStringList childRows(int row = 0) const;
    [[nodiscard]] QTreeWidget *tree() const { return m_dialog->findChild<QTreeWidget *>(); }
    [[nodiscard]] QTreeWidgetItem *item(int row) const { return tree()->topLevelItem(row); }
    [[nodiscard]] QLineEdit *inputLine() const;
    [[nodiscard]] QString status() const
    {
        return m_dialog->findChild<QLabel *>("l_status")->text();
    }
    [[nodiscard]] bool hintIsVisible() const
    {
        return m_dialog->findChild<QLabel *>("l_hint")->isVisible();
    }
    [[nodiscard]] QString iniFile() const { return m_folder.path("corvane.ini"); }

    TestFolder m_folder;
    std::unique_ptr<SimulatorProcess> m_simulator;
    std::unique_ptr<DlgInstrConfig> m_dialog;
    std::unique_ptr<QSignalSpy> m_changes;
};
