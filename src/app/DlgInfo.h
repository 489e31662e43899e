// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "toolframe/DlgBase.h"

#include <memory>

namespace Ui {
class DlgInfo;
}

/// Shows what the tags of a waveform file say, without reading its samples.
class DlgInfo : public DlgBase
{
    Q_OBJECT

public:
    explicit DlgInfo(QWidget *parent = nullptr);
    ~DlgInfo() override;

    [[nodiscard]] bool startModule(const QString &path) override;

private slots:
    void slot_dialog_rejected();

private:
    std::unique_ptr<Ui::DlgInfo> m_ui;
};
