// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "toolframe/DlgBase.h"

#include "wvfile/WvTypes.h"

#include <memory>

class CheckJob;
struct SampleCheck;

namespace Ui {
class DlgInfo;
}

/// Shows what the tags of a waveform file say, at once, and what its samples are measured to be
/// when they have been read.
class DlgInfo : public DlgBase
{
    Q_OBJECT

public:
    explicit DlgInfo(QWidget *parent = nullptr);
    ~DlgInfo() override;

    [[nodiscard]] bool startModule(const QString &path) override;

protected:
    void changeEvent(QEvent *event) override;

private slots:
    void slot_dialog_rejected();

private:
    void showReport(const SampleCheck *check);
    void checkSamples();
    void cancelCheck();

    std::unique_ptr<Ui::DlgInfo> m_ui;
    std::shared_ptr<CheckJob> m_check; ///< the running one, if any
    QString m_path;                    ///< empty: nothing is shown
    WvFileSummary m_summary;
    std::shared_ptr<const SampleCheck> m_result; ///< of the samples, once they were checked
};
