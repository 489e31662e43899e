// SPDX-License-Identifier: Apache-2.0
#include "DlgWvFromSigmf.h"

#include "display/QtNumericEdit.h"
#include "jobs/SigmfImportJob.h"

#include <QGridLayout>
#include <QGroupBox>
#include <QLabel>
#include <QLineEdit>
#include <QPlainTextEdit>
#include <QVBoxLayout>

namespace {

constexpr double MostSeconds = 1e9;
constexpr double MostSamples = 1e12;
constexpr double HighestRate = 1e12;

} // namespace

DlgWvFromSigmf::DlgWvFromSigmf(QWidget *parent)
    : ImportWizard("Sigmf2Wv", "Create Waveform From SigMF Recording", parent)
    , m_channel(new QtNumericEdit)
    , m_type(new QLabel)
    , m_error(new QLabel)
{
    QVBoxLayout *column =
        addInputPage("Select Import File", "SigMF Recording (*.sigmf-meta *.sigmf-data *.sigmf)");
    m_channel->setObjectName("le_channel");
    m_channel->setName("Channel");
    m_channel->setMax(1);
    m_channel->setMin(1);
    m_channel->setVal(1);
    m_channel->setStep(1);
    auto *metadata = new QGroupBox("Recording");
    auto *grid = new QGridLayout(metadata);
    m_type->setObjectName("l_type");
    addRow(*grid, "Channel", m_channel, "Channel that becomes the waveform, counted from 1");
    addRow(*grid, "Datatype", m_type);
    m_sampleRate = addFact(*grid, "le_samplerate", "Sample Rate", "Hz", 0, HighestRate);
    m_samples = addFact(*grid, "le_samples", "Number of Samples", {}, 0, MostSamples);
    m_playTime = addFact(*grid, "le_playtime", "Play Time", "s", 0, MostSeconds);
    column->addWidget(metadata);
    m_error->setObjectName("l_error");
    m_error->setWordWrap(true);
    column->addWidget(m_error);
    column->addStretch(1);
    addSharedPages();
    setUpWizard();
}

void DlgWvFromSigmf::inputChanged()
{
    SigmfFileAccess file;
    m_isReadable = file.open(inputFile());
    const SigmfMetadata metadata = m_isReadable ? file.metadata() : SigmfMetadata();
    m_error->setText(m_isReadable ? QString()
                                  : QString("The recording cannot be read; the log tells why. "
                                            "Choose its .sigmf-meta or .sigmf-data, which lie "
                                            "beside each other, or the archive of both."));
    const qint64 samples = m_isReadable ? file.samples() : 0;
    m_type->setText(metadata.type.name);
    m_sampleRate->setVal(metadata.sampleRate);
    m_samples->setVal(samples);
    m_playTime->setVal(metadata.sampleRate > 0 ? static_cast<double>(samples) / metadata.sampleRate
                                               : 0);
    m_channel->setMax(metadata.channels);
    m_channel->setEnabled(metadata.channels > 1);
    m_description = metadata.description;
    m_copyrightNote = metadata.copyright;
}

bool DlgWvFromSigmf::isComplete(int page) const
{
    return page > 0 || m_isReadable;
}

void DlgWvFromSigmf::previewMade(const ImportJob & /*job*/)
{
    if (!isNewSource(inputFile())) {
        return;
    }
    if (m_sampleRate->getVal() > 0) {
        proposeClock(m_sampleRate->getVal());
    }
    commentEdit().setPlainText(m_description);
    copyrightEdit().setText(m_copyrightNote);
}

std::unique_ptr<ImportJob> DlgWvFromSigmf::makeImportJob() const
{
    return std::make_unique<SigmfImportJob>(
        SigmfImportRequest{.inputFile = inputFile(),
                           .target = target(),
                           .channel = static_cast<int>(m_channel->getValInt()),
                           .clockFromFile = false});
}
