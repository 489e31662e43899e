// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "ImportWizard.h"

class ContentTree;

/// The wizard that imports a variable of a MATLAB file: file with its content, preview, output
/// file, status.
class DlgWvFromMat : public ImportWizard
{
    Q_OBJECT

public:
    explicit DlgWvFromMat(QWidget *parent = nullptr);

protected:
    [[nodiscard]] std::unique_ptr<ImportJob> makeImportJob() const override;
    void inputChanged() override;
    [[nodiscard]] bool isComplete(int page) const override;

private:
    ContentTree *m_tree = nullptr;
};
