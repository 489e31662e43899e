// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "RangeTool.h"

class QLabel;
class QPushButton;
class QtNumericEdit;

/// Compares the level tags of a waveform with its samples, and writes a copy with new ones. The
/// samples aren't changed.
class DlgRescale : public RangeTool
{
    Q_OBJECT

public:
    explicit DlgRescale(QWidget *parent = nullptr);

public slots:
    /// Measures between the cursors and fills the level fields from that and from the tags.
    void slot_update();
    /// Fills the level fields with what the whole of the samples measures.
    void slot_measured();

protected:
    void sourceChanged() override;
    [[nodiscard]] std::unique_ptr<EditJob> makeJob(const QString &inputFile,
                                                   const OutputOptions &output) const override;

private:
    [[nodiscard]] QWidget *makeTagBox();
    [[nodiscard]] QWidget *makeTargetBox();
    void checkCrest();

    QLabel *l_PkOfsTag;
    QLabel *l_RmsOfsTag;
    QLabel *l_PkOfsData;
    QLabel *l_RmsOfsData;
    QLabel *l_peak; ///< level of the tag against that of the samples
    QLabel *l_rms;
    QLabel *l_crest;
    QLabel *l_warn;
    QtNumericEdit *le_peak;
    QtNumericEdit *le_pkrms;
    QPushButton *pb_update;
    QPushButton *pb_measured;
};
