// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "ImportWizard.h"

#include "import/RiqFileAccess.h"

class ContentTree;

/// The wizard that imports a packet of a recording: file with its packets, preview, output file,
/// status. It keeps the directory of the file.
class DlgWvFromRiq : public ImportWizard
{
    Q_OBJECT

public:
    explicit DlgWvFromRiq(QWidget *parent = nullptr);

protected:
    [[nodiscard]] std::unique_ptr<ImportJob> makeImportJob() const override;
    void inputChanged() override;
    void previewMade(const ImportJob &job) override;
    [[nodiscard]] bool isComplete(int page) const override;

private:
    [[nodiscard]] int checkedPacket() const;

    ContentTree *m_tree = nullptr;
    mutable RiqFileAccess m_file; ///< jobs read from it, which changes no field
};
