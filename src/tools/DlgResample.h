// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "toolframe/DlgBase.h"

#include "jobs/ResampleJob.h"

#include <memory>

namespace Ui {
class DlgResample;
}

/// Converts a waveform file to another clock rate or number of samples: source file, target,
/// output file, status, a page each.
class DlgResample : public DlgBase
{
    Q_OBJECT

public:
    explicit DlgResample(QWidget *parent = nullptr);
    ~DlgResample() override;

    [[nodiscard]] bool startModule(const QString &path) override;
    [[nodiscard]] QString moduleName() const override;
    [[nodiscard]] QString menuPath() const override;
    [[nodiscard]] bool extensionAllowed(const QString &upperCaseExtension) const override;
    void writeSettings(QSettings &settings) override;
    void readSettings(QSettings &settings) override;

    /// What the fields ask for.
    [[nodiscard]] ResampleRequest options() const;

private slots:
    void slot_infile();
    void slot_outfile();
    void slot_mode();
    void slot_updatesettings();
    void slot_create();
    void slot_next();
    void slot_prev();

private:
    [[nodiscard]] bool loadSource(const QString &fileName);
    [[nodiscard]] ResampleTarget target() const;
    void updateButtons();

    std::unique_ptr<Ui::DlgResample> m_ui;
    double m_sourceClockHz = 0;
    qint64 m_sourceSamples = 0;
};
