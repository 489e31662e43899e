// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "toolframe/DlgBase.h"

#include <QTimer>

#include <memory>

class CWidgetTrackEdit;
class QLabel;
class QLineEdit;
class QLockFile;
class QPushButton;
class QtNumericEdit;

/// The Composer's window: the track editor and the controls around it.
///
/// Changes are written to an autosave file shortly after they were made. It goes with a save or a
/// close; one that is found at the first start was left by a crash and is offered.
class DlgComposer : public DlgBase
{
    Q_OBJECT

public:
    explicit DlgComposer(QWidget *parent = nullptr);
    ~DlgComposer() override;

    /// Loads a .cms file; a folder is where files are looked for first.
    [[nodiscard]] bool startModule(const QString &path) override;

    [[nodiscard]] CWidgetTrackEdit &tracks() { return *m_tracks; }

    /// Where unsaved changes are kept.
    [[nodiscard]] static QString autosaveFile();

    /// Whether a crash has left unsaved changes, which the next start of the tool offers.
    [[nodiscard]] static bool hasLeftWork();

public slots:
    void slot_set_xcsr(qlonglong sample, double seconds);
    void slot_bufsize(int states);
    void slot_wvselect();
    void slot_insert();
    void slot_overwrite();
    void slot_extract();
    void slot_lift();
    void slot_addtrack();
    void slot_deltrack();
    void slot_clearall();
    void slot_save();
    void slot_load();
    void slot_create();
    void slot_target_changed();
    void writeSettings(QSettings &settings) override;
    void readSettings(QSettings &settings) override;
    /// Escape closes the window as its button does, with the same question.
    void reject() override;

protected:
    void closeEvent(QCloseEvent *event) override;

private:
    void buildWindow();
    [[nodiscard]] QLayout *insertRow();
    [[nodiscard]] QLayout *viewRow();
    [[nodiscard]] QLayout *documentRow();
    QPushButton *addButton(QLayout *row, const char *objectName, const char *icon, const char *text,
                           const char *toolTip, const std::function<void()> &action);
    void addKeys();
    void refreshLabels();
    void setModified(bool modified);
    void setFile(const QString &fileName);
    /// Asks what is to become of unsaved changes. False if the user wants to go on with them.
    [[nodiscard]] bool mayDiscard();
    [[nodiscard]] bool save();
    [[nodiscard]] bool loadFile(const QString &fileName);
    void offerAutosave();
    void writeAutosave();
    void dropAutosave();
    [[nodiscard]] QString folder() const;

    CWidgetTrackEdit *m_tracks;
    QLineEdit *le_wvname;
    QtNumericEdit *le_csr_sample;
    QtNumericEdit *le_csr_time;
    QPushButton *pb_undo = nullptr;
    QLabel *l_duration;
    QLabel *l_rate;
    QString m_settingsFile; ///< last .cms file or folder
    QString m_shownFile;    ///< the .cms file in the title; empty for a new document
    bool m_running = false;
    bool m_autosaveOffered = false;
    std::unique_ptr<QLockFile> m_autosaveLock; ///< held while this process owns the autosave
    QTimer m_autosaveTimer;
};
