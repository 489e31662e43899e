// SPDX-License-Identifier: Apache-2.0
#include "DlgWvFromRiq.h"

#include "ContentTree.h"

#include "jobs/DirectoryJob.h"
#include "jobs/RiqImportJob.h"

#include <QPlainTextEdit>

DlgWvFromRiq::DlgWvFromRiq(QWidget *parent)
    : ImportWizard("Riq2Wv", "Create Waveform From RIQ File", parent)
{
    m_tree = addContentTree(*addInputPage("Select Import File", "RIQ File (*.riq)"));
    addSharedPages();
    setUpWizard();
}

void DlgWvFromRiq::inputChanged()
{
    m_tree->clear();
    if (!m_file.open(inputFile())) {
        m_tree->addDeadItem("Cannot open file.");
        return;
    }
    DirectoryJob<RiqFileAccess> job(m_file, "Reading RIQ-Directory...");
    const bool read = runInPlace(job) == JobOutcome::Finished;
    m_file.close();
    if (!read) {
        m_tree->addDeadItem("Cannot read content.");
        return;
    }
    for (qsizetype i = 0; i < m_file.entries().size(); ++i) {
        const RiqEntry &entry = m_file.entries()[i];
        m_tree->addEntry(QString("Packet %1").arg(i + 1), i + 1, true,
                         {{"Samples", QString::number(entry.samples)},
                          {"Sample Rate", QString("%1 kHz").arg(entry.sampleRate / 1e3)},
                          {"IF Frequency", QString("%1 MHz").arg(entry.ifFrequency / 1e6)},
                          {"Play Time", QString("%1 s").arg(entry.playTime())},
                          {"UDP Blocks", QString::number(entry.blocks)}});
    }
    if (m_file.entries().isEmpty()) {
        m_tree->addDeadItem("The file holds no packets.");
    }
}

int DlgWvFromRiq::checkedPacket() const
{
    return m_tree->checkedKey().toInt();
}

bool DlgWvFromRiq::isComplete(int page) const
{
    return page > 0 || checkedPacket() > 0;
}

void DlgWvFromRiq::previewMade(const ImportJob & /*job*/)
{
    if (isNewSource(inputFile() + QString::number(checkedPacket()))) {
        const RiqEntry entry = m_file.entry(checkedPacket() - 1);
        proposeClock(entry.sampleRate);
        commentEdit().setPlainText(RiqImportJob::proposedComment(entry));
    }
}

std::unique_ptr<ImportJob> DlgWvFromRiq::makeImportJob() const
{
    return std::make_unique<RiqImportJob>(
        m_file,
        RiqImportRequest{.packet = checkedPacket(), .target = target(), .clockFromFile = false});
}
