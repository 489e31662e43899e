// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <QDialog>
#include <QList>
#include <QString>

class QSettings;
struct InstrConfigEntry;

/// Base of all tool dialogs: modeless windows that are made at their first use and then kept. Where
/// a tool appears and what it works on stands in its ToolInfo.
class DlgBase : public QDialog
{
    Q_OBJECT

public:
    explicit DlgBase(QWidget *parent = nullptr);

    /// Prepares the dialog for a file, or a folder (its path ends in "/"). False means that it
    /// can't start; the reason has been logged, and the dialog stays as it was.
    [[nodiscard]] virtual bool startModule(const QString &path) = 0;

    /// The list of configured instruments has changed, or the dialog was just made.
    virtual void instrumentsUpdated(const QList<InstrConfigEntry> &instruments);

    /// The instrument that sendRequested() would send to, as text for the user; empty for none.
    virtual void sendTargetChanged(const QString &instrument);

signals:
    /// The user wants to look at a file in the tool for its type.
    void openRequested(const QString &path);

    /// The user wants a waveform file on the instrument that a pane shows.
    void sendRequested(const QString &path);

public slots:
    /// Saves the tool's group of settings.
    virtual void writeSettings(QSettings &settings);

    /// Restores the tool's group of settings; called once, before the first start.
    virtual void readSettings(QSettings &settings);
};
