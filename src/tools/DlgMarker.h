// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "RangeTool.h"

#include "dsp/markeredit.h"
#include "streams/TempStream.h"

#include <QList>

class QLineEdit;
class QListWidget;
class QRadioButton;

/// Sets, clears, toggles or patterns marker traces between two cursors, shows the result at once,
/// and writes it into a copy.
class DlgMarker : public RangeTool
{
    Q_OBJECT

public:
    explicit DlgMarker(QWidget *parent = nullptr);
    ~DlgMarker() override;

public slots:
    void slot_apply();
    /// Takes the last change back.
    void slot_undo();

protected:
    void sourceChanged() override;
    [[nodiscard]] std::unique_ptr<EditJob> makeJob(const QString &inputFile,
                                                   const OutputOptions &output) const override;

private:
    [[nodiscard]] QWidget *makeControls();
    [[nodiscard]] bool preview(const QList<MarkerEdit> &edits);
    void showMarkers();
    void refresh();

    QComboBox *cb_markers;
    QComboBox *cb_maction;
    QLineEdit *le_pattern;
    QPushButton *pb_apply;
    QPushButton *pb_undo;
    QRadioButton *rb_before;
    QRadioButton *rb_after;
    QListWidget *lw_edits;
    QList<MarkerEdit> m_edits;
    std::unique_ptr<TempStream> m_edited; ///< markers with the edits; null without any
};
