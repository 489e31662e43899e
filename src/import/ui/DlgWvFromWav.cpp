// SPDX-License-Identifier: Apache-2.0
#include "DlgWvFromWav.h"

#include "display/QtNumericEdit.h"
#include "jobs/WavImportJob.h"

#include <QGridLayout>
#include <QGroupBox>
#include <QLabel>
#include <QVBoxLayout>

namespace {

constexpr double MostSeconds = 1e9;
constexpr double MostSamples = 1e9;

} // namespace

DlgWvFromWav::DlgWvFromWav(QWidget *parent)
    : ImportWizard("Wav2Wv", "Create Waveform From WAV File", parent)
    , m_error(new QLabel)
{
    QVBoxLayout *column = addInputPage("Select Import File", "WAV File (*.wav)");
    auto *header = new QGroupBox("   File Header Information");
    auto *grid = new QGridLayout(header);
    m_dataClock = addFact(*grid, "le_dataclock", "Data Clockrate", "Hz", ImportTarget::MinClockHz,
                          ImportTarget::MaxClockHz);
    m_dataClock->setVal(ImportTarget().clockHz);
    m_samples = addFact(*grid, "le_samples", "Number of Samples", {}, 0, MostSamples);
    m_playTime = addFact(*grid, "le_playtime", "Play Time", "s", 0, MostSeconds);
    column->addWidget(header);
    m_error->setObjectName("l_error");
    m_error->setWordWrap(true);
    column->addWidget(m_error);
    column->addStretch(1);
    addSharedPages();
    setUpWizard();
}

void DlgWvFromWav::inputChanged()
{
    WavFileAccess file;
    m_headerValid = false;
    m_error->clear();
    m_samples->setVal(0);
    m_playTime->setVal(0);
    if (!file.open(inputFile())) {
        m_error->setText("Cannot open .wav file.");
        return;
    }
    file.close();
    const std::optional<WavHeader> header = WavImportJob::readHeader(file, inputFile());
    if (!header) {
        m_error->setText("Cannot evaluate .wav file header.\nRead are files of one or two "
                         "channels: PCM of 8, 16, 24 or 32 bits, or 32-bit float. I is the left "
                         "or the only channel, Q the right one.");
        return;
    }
    m_headerValid = true;
    m_dataClock->setVal(header->sampleRate);
    m_samples->setVal(header->samples());
    m_playTime->setVal(header->playTime());
}

bool DlgWvFromWav::isComplete(int page) const
{
    return page > 0 || m_headerValid;
}

void DlgWvFromWav::previewMade(const ImportJob & /*job*/)
{
    if (isNewSource(inputFile())) {
        proposeClock(m_dataClock->getVal());
    }
}

std::unique_ptr<ImportJob> DlgWvFromWav::makeImportJob() const
{
    return std::make_unique<WavImportJob>(
        WavImportRequest{.inputFile = inputFile(), .target = target(), .clockFromFile = false});
}
