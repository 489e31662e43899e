// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "composer/Composition.h"

#include <QDialog>

class QCheckBox;
class QComboBox;
class QLineEdit;
class QRadioButton;
class QTabWidget;
class QtNumericEdit;

/// The settings of one segment. Works on a copy; what it has become is taken when accepted.
class DlgWvEdit : public QDialog
{
    Q_OBJECT

public:
    /// `starts` are the target samples at which the segment may start. The composition gives the
    /// clock and outlives the dialog.
    DlgWvEdit(const ComposerSegment &segment, const SegmentBorders &starts,
              const Composition &composition, QWidget *parent = nullptr);

    [[nodiscard]] const ComposerSegment &segment() const { return m_segment; }

public slots:
    void accept() override;

private:
    [[nodiscard]] QWidget *generalPage();
    [[nodiscard]] QWidget *truncationPage();
    [[nodiscard]] QWidget *positionPage();
    [[nodiscard]] QWidget *fadingPage();
    [[nodiscard]] QWidget *flagsPage();
    void showSegment();
    void browse();
    void takeFile(const QString &name);
    void limitUsedSamples();

    ComposerSegment m_segment;
    SegmentBorders m_starts;
    const Composition &m_composition;
    QLineEdit *le_file;
    QtNumericEdit *le_levoffset;
    QtNumericEdit *le_freqoffset;
    QtNumericEdit *le_fofsdev;
    QCheckBox *cb_fofsdev;
    QtNumericEdit *le_startsample;
    QtNumericEdit *le_usedsamples;
    QtNumericEdit *le_pos_sample;
    QtNumericEdit *le_pos_time;
    QtNumericEdit *le_fadein;
    QtNumericEdit *le_fadeout;
    QComboBox *cb_fadein;
    QComboBox *cb_fadeout;
    QRadioButton *rb_truncate;
    QRadioButton *rb_wraparound;
    QCheckBox *cb_markers;
};
