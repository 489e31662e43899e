// SPDX-License-Identifier: Apache-2.0
#include "SignalSketch.h"

#include "base/EngineeringNumber.h"
#include "display/CWidgetIQTrace.h"
#include "display/CWidgetSpectrum.h"
#include "jobs/CreateJob.h"
#include "log/Tracer.h"

#include <QHBoxLayout>
#include <QLabel>
#include <QScopedValueRollback>

#include <cmath>
#include <utility>

namespace {

constexpr int DelayMs = 200; // while a value is typed or turned
constexpr int LeastHeight = 130;

QString factsText(const SignalFacts &facts)
{
    const double crest = facts.rms > 0 ? 20 * std::log10(facts.peak / facts.rms) : 0.0;
    return QString("%1 samples at %2, peak / RMS %3 dB")
        .arg(facts.samples)
        .arg(engineeringText(facts.clockHz, "Hz"))
        .arg(crest, 0, 'f', 2);
}

} // namespace

SignalSketch::SignalSketch(std::function<CreateRequest()> makeRequest, QWidget *parent)
    : QWidget(parent)
    , m_makeRequest(std::move(makeRequest))
    , m_runner([this] { draw(); }, [this] { cancel(); })
    , m_content(new QWidget(this))
    , m_trace(new CWidgetIQTrace)
    , m_spectrum(new CWidgetSpectrum)
    , m_facts(new QLabel)
{
    setObjectName("w_sketch");
    setSizePolicy(QSizePolicy::Ignored, QSizePolicy::Ignored);
    m_trace->setObjectName("w_sketch_iq");
    m_trace->setAccessibleName("Trace of the signal");
    m_trace->setView(0);
    m_spectrum->setObjectName("w_sketch_spectrum");
    m_spectrum->setAccessibleName("Spectrum of the signal");
    m_spectrum->setView(0);
    m_facts->setObjectName("l_sketch");
    m_facts->setTextFormat(Qt::PlainText);
    auto *plots = new QHBoxLayout;
    plots->addWidget(m_trace, 1);
    plots->addWidget(m_spectrum, 1);
    auto *layout = new QVBoxLayout(m_content);
    layout->setContentsMargins(0, 0, 0, 0);
    layout->addLayout(plots, 1);
    layout->addWidget(m_facts);
    m_delay.setSingleShot(true);
    m_delay.setInterval(DelayMs);
    connect(&m_delay, &QTimer::timeout, this, [this] { m_runner.request(); });
}

void SignalSketch::cancel()
{
    m_delay.stop();
    if (m_job != nullptr) {
        m_job->cancel();
    }
}

bool SignalSketch::hasRoom() const
{
    return height() >= LeastHeight;
}

void SignalSketch::resizeEvent(QResizeEvent * /*event*/)
{
    m_content->setGeometry(rect());
    const bool wasShown = m_content->isVisibleTo(this);
    m_content->setVisible(hasRoom());
    if (hasRoom() && !wasShown) {
        request();
    }
}

void SignalSketch::hideEvent(QHideEvent * /*event*/)
{
    cancel();
}

void SignalSketch::draw()
{
    if (!isVisible() || !hasRoom()) {
        return;
    }
    const Tracer::ErrorWatch watch;
    SignalPreviewJob job(m_makeRequest());
    const QScopedValueRollback<SignalPreviewJob *> running(m_job, &job);
    const JobOutcome outcome = job.run();
    if (outcome == JobOutcome::Cancelled) {
        return;
    }
    m_trace->clear();
    m_spectrum->clear();
    if (outcome == JobOutcome::Failed) {
        m_facts->setText(watch.text());
        return;
    }
    const std::vector<double> &values = job.samples();
    IqList samples;
    samples.reserve(static_cast<qsizetype>(values.size() / 2));
    for (size_t i = 0; i + 1 < values.size(); i += 2) {
        samples.append({values[i], values[i + 1]});
    }
    m_trace->setClock(job.facts().clockHz);
    m_trace->setData(samples);
    m_spectrum->setClock(job.facts().clockHz);
    m_spectrum->setData(samples);
    m_facts->setText(factsText(job.facts()));
}
