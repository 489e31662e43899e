// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "jobs/OutputOptions.h"
#include "toolframe/DlgBase.h"

#include <array>
#include <memory>
#include <utility>

class EditJob;
class QComboBox;
class QGroupBox;
class QLabel;
class QPushButton;
class QtNumericEdit;
class QTextEdit;
class QVBoxLayout;
class SourceWaveform;
class ViewFrame;

/// Base of the tools that look at a waveform, work on the samples between two cursors, and write a
/// copy. The cursors are the fields "le_mkrpos_1" and "le_mkrpos_2", in samples counted from 1, and
/// "le_mkrpostime_1" and "le_mkrpostime_2", in seconds. Reads the file once.
class RangeTool : public DlgBase
{
    Q_OBJECT

public:
    ~RangeTool() override;

    [[nodiscard]] bool startModule(const QString &path) override;
    void writeSettings(QSettings &settings) override;
    void readSettings(QSettings &settings) override;

public slots:
    void slot_view_mode(int row);
    void slot_mkr_pos_time_user_1(double seconds);
    void slot_mkr_pos_time_user_2(double seconds);
    /// Writes the copy.
    void slot_run();

protected:
    /// Title of the window, which is the group of its settings too, and the suffix of the copy's
    /// name.
    RangeTool(QString title, QString settingsGroup, QString suffix, QWidget *parent);

    /// Adds the tool's own controls beside those of the cursors.
    void addControls(QWidget *controls);

    [[nodiscard]] ViewFrame &view() { return *m_view; }

    /// Null until a file was read, and after the window was closed.
    [[nodiscard]] SourceWaveform *source() const { return m_source.get(); }

    /// First and last sample between the cursors, counted from 0 and in order.
    [[nodiscard]] std::pair<qint64, qint64> range() const;

    /// Another waveform is shown, or none.
    virtual void sourceChanged() = 0;

    /// The job that writes the copy.
    [[nodiscard]] virtual std::unique_ptr<EditJob> makeJob(const QString &inputFile,
                                                           const OutputOptions &output) const = 0;

    /// Says in the log and in the window why something can't be done.
    void refuse(const QString &problem);

    [[nodiscard]] QPushButton &runButton() { return *m_run; }

    void done(int result) override;

private:
    struct Cursor
    {
        QtNumericEdit *position = nullptr;
        QtNumericEdit *time = nullptr;
    };

    [[nodiscard]] QGroupBox *makeCursorBox();
    void moveCursor(int which, qint64 position);
    void showRange();
    void unload();

    QString m_title;
    QString m_settingsGroup;
    QString m_suffix;
    QString m_file;
    std::unique_ptr<SourceWaveform> m_source;
    ViewFrame *m_view;
    QComboBox *m_mode;
    QVBoxLayout *m_controls;
    QLabel *m_target;
    QTextEdit *m_report;
    QPushButton *m_run;
    std::array<Cursor, 2> m_cursors;
};
