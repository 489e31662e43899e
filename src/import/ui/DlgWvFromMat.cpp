// SPDX-License-Identifier: Apache-2.0
#include "DlgWvFromMat.h"

#include "ContentTree.h"

#include "import/MatFileAccess.h"
#include "jobs/DirectoryJob.h"
#include "jobs/MatImportJob.h"

DlgWvFromMat::DlgWvFromMat(QWidget *parent)
    : ImportWizard("Mat2Wv", "Create Waveform From MATLAB File", parent)
{
    m_tree =
        addContentTree(*addInputPage("Select import file 1", "Data File (*.txt *.bin *.wfm *.i)"));
    addSharedPages();
    setUpWizard();
}

void DlgWvFromMat::inputChanged()
{
    m_tree->clear();
    MatFileAccess file;
    if (!file.open(inputFile())) {
        m_tree->addDeadItem("Cannot open file.");
        return;
    }
    DirectoryJob<MatFileAccess> job(file, "Reading MATLAB File...");
    if (runInPlace(job) != JobOutcome::Finished) {
        m_tree->addDeadItem("Cannot read content.");
        return;
    }
    for (const MatEntry &entry : file.directory()) {
        if (!entry.isShown()) {
            continue;
        }
        ContentTree::Rows rows{
            {"Type", (entry.complex ? "Complex " : "") + entry.className()},
            {"Dimension", QString("%1 x %2").arg(entry.dimensions[0]).arg(entry.dimensions[1])}};
        if (!entry.obstacle().isEmpty()) {
            rows.append({"Import", entry.obstacle()});
        }
        m_tree->addEntry(entry.name.isEmpty() ? "(no name)" : entry.name, entry.name,
                         entry.isUsable(), rows);
    }
}

bool DlgWvFromMat::isComplete(int page) const
{
    return page > 0 || m_tree->checkedKey().isValid();
}

std::unique_ptr<ImportJob> DlgWvFromMat::makeImportJob() const
{
    return std::make_unique<MatImportJob>(
        MatImportRequest{inputFile(), m_tree->checkedKey().toString(), target()});
}
