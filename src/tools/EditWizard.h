// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "toolframe/ToolWizard.h"

#include <QString>

/// Base of the tools that make one waveform out of another. Its first page shows the source in
/// "le_infile", "l_src_clock" and "l_src_samples", with "pb_infile" to choose another one; a new
/// source fills the output page: its name with a suffix, its comment, its copyright.
class EditWizard : public ToolWizard
{
    Q_OBJECT

public:
    [[nodiscard]] bool startModule(const QString &path) override;

protected:
    /// "_resample" as a suffix makes "/data/noise_resample.wv" out of "/data/noise.wv".
    EditWizard(Frame frame, QString suffix, QWidget *parent);

    /// Calls setUpWizard() and wires the two Browse buttons; the title is that of the question for
    /// the file to be written.
    void setUpEditWizard(const QString &targetTitle = {});

    /// The fields were filled for another source, whose clock and length are known.
    virtual void sourceChanged() = 0;

    [[nodiscard]] QString sourceFile() const;
    [[nodiscard]] bool hasSource() const { return m_sourceSamples > 0; }
    [[nodiscard]] double sourceClockHz() const { return m_sourceClockHz; }
    [[nodiscard]] qint64 sourceSamples() const { return m_sourceSamples; }

    /// Without a source there is nothing to go on with.
    [[nodiscard]] bool isComplete(int page) const override;

    /// Write and read "infile".
    void writeFields(QSettings &settings) const override;
    void readFields(const QSettings &settings) override;

private:
    [[nodiscard]] bool loadSource(const QString &fileName);
    void chooseSource();

    QString m_suffix;
    double m_sourceClockHz = 0;
    qint64 m_sourceSamples = 0;
};
