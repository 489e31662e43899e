// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "FileIcons.h"
#include "ModulesDb.h"
#include "instrument/RemoteDirModel.h"
#include "instrument/VisaDevice.h"
#include "log/Tracer.h"

#include <QHash>
#include <QMainWindow>
#include <QString>

#include <array>
#include <memory>

class DlgColors;
class DlgInstrConfig;
class GeneratorLine;
class GuideWindow;
class LocalFileModel;
class LogPanel;
class PathBox;
class QComboBox;
class QCustomTreeView;
class QLabel;
class QSplitter;
class QToolButton;
class QMenu;

namespace Ui {
class AppMainWindow;
}

/// The program's main window: two panes of files side by side, the log below them, and the menus
/// of the tools. Owns everything that lives as long as it; closing it saves the settings and closes
/// the tools. Deletes itself when closed.
class MainWindow : public QMainWindow
{
    Q_OBJECT

public:
    MainWindow();
    ~MainWindow() override;

    [[nodiscard]] ModulesDb &modules() { return m_modules; }

    /// Whether the list of instruments was read, which waits until the window is painted.
    [[nodiscard]] bool knowsInstruments() const { return m_knowsInstruments; }

    /// Opens files in the tools that Enter would start for them, and shows the folder of the first
    /// one in the first pane. What can't be opened is told in the log.
    void openFiles(const QStringList &files);

protected:
    bool event(QEvent *event) override;
    bool eventFilter(QObject *watched, QEvent *event) override;
    void closeEvent(QCloseEvent *event) override;
    void hideEvent(QHideEvent *event) override;
    void showEvent(QShowEvent *event) override;

private slots:
    void TraceDataAvailable();
    void errMsg(const QString &sTxt);
    void menu_about();
    void menu_showinstrconfig();
    void menu_showcolors();
    void menu_showguide();
    void slot_colors_updated();
    void slot_refresh();
    void instrListUpdated();
    void newDeviceSelection(int iIndex);
    void slot_infoTextAvailable(const QString &sInfoText);
    void slot_localDefaultFolderSet(const QString &sDefaultFolder);
    void slot_remoteDefaultFolderSet(VisaDevice *pcVisaDevice, const QString &sDefaultFolder);
    void slot_selectionLost();
    void slot_itemSelected(const QString &sItem);

private:
    /// The widgets of one pane and the models that it can show.
    struct Pane
    {
        QWidget *frame = nullptr;
        QComboBox *device = nullptr;
        QToolButton *instruments = nullptr;
        QComboBox *filter = nullptr;
        QToolButton *refresh = nullptr;
        QLabel *activeMark = nullptr;
        PathBox *path = nullptr;
        QCustomTreeView *tree = nullptr;
        GeneratorLine *generator = nullptr;
        std::unique_ptr<LocalFileModel> localModel;
        std::unique_ptr<VisaDevice> instrument;
        std::unique_ptr<RemoteDirModel> remoteModel; ///< the files of the instrument
        QString resource{};                ///< of the instrument that is shown; empty for the disk
        QHash<QString, QString> visited{}; ///< where the user was on each of them
    };

    void buildMenus();
    void addEntryMenu(QMenu &menu);
    void connectPane(Pane &pane);
    void goTo(Pane &pane, const QString &path);
    void readInstruments();
    void createDevices();
    void selectDevice(Pane &pane);
    void showLocal(Pane &pane);
    void showInstrument(Pane &pane);
    [[nodiscard]] bool openInstrument(Pane &pane);
    void showAgain(const QStringList &resources);
    void sendToInstrument(const QString &path);
    [[nodiscard]] Pane *sendTarget();
    void announceSendTarget();
    [[nodiscard]] QString defaultFolder(const Pane &pane) const;
    [[nodiscard]] bool mayClose();
    void markActive(const Pane &active);
    void goHome(Pane &pane);
    void refresh(Pane &pane);
    [[nodiscard]] Pane &paneOf(const QObject *widget);
    [[nodiscard]] Pane &otherPane(const Pane &pane);
    void loadSettings();
    void saveSettings();

    ModulesDb m_modules;
    Tracer m_tracer;
    std::unique_ptr<Ui::AppMainWindow> m_ui;
    FileIcons m_fileIcons;
    std::unique_ptr<DlgInstrConfig> m_instrConfig;
    LogPanel *m_log = nullptr;
    std::unique_ptr<DlgColors> m_colors;
    std::unique_ptr<GuideWindow> m_guide; ///< once it was asked for
    std::array<Pane, 2> m_panes;
    const Pane *m_activePane = nullptr;
    QStringList m_formerResources; ///< of the panes when the program was closed
    QString m_locPath;
    QString m_absentLocPath;         ///< the default folder while it isn't there
    bool m_showsInstrConfig = false; ///< again when the window comes back
    bool m_showsColors = false;
    bool m_noVisa = false;
    bool m_asksInstruments = false;  ///< or has asked them
    bool m_knowsInstruments = false; ///< the list was read from the settings
};
