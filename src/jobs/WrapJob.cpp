// SPDX-License-Identifier: Apache-2.0
#include "WrapJob.h"

#include "base/EngineeringNumber.h"
#include "base/ProgressClock.h"
#include "log/Tracer.h"
#include "streams/samplestream.h"

#include <algorithm>
#include <cmath>
#include <utility>
#include <vector>

namespace {

/// Keeps the offsets of silence finite.
constexpr double OffsetFloor = 1e-32;

bool readHalf(BufferedIO &data, qint64 first, std::vector<float> &values, const char *failure)
{
    if (!data.restartAtPosition(BufferedIO::HeaderSize + first * BufferedIO::RecordSize)) {
        return Tracer::fail("Reading from temporary waveform file failed.");
    }
    values.resize(floatsOf(JointHalf));
    return readSamples(data, values) == JointHalf || Tracer::fail(QLatin1String(failure));
}

void append(Joint &joint, const std::vector<float> &values)
{
    for (std::size_t i = 0; i + 1 < values.size(); i += 2) {
        joint.emplace_back(values[i], values[i + 1]);
    }
}

} // namespace

QString wrapProblem(const WrapSettings &settings, qint64 samples, double clockHz)
{
    const qint64 end = settings.endOf(samples);
    if (samples < JointHalf) {
        return QString("Waveform is too short. Use at least %1 samples.").arg(JointHalf);
    }
    if (settings.start < 0 || settings.start + JointHalf > samples) {
        return "Check start sample setting.";
    }
    if (end < JointHalf || end >= samples) {
        return "Check end sample setting.";
    }
    if (settings.range < 1) {
        return "Incorrect range set for waveform correction.";
    }
    if (settings.range > WrapSettings::MaxRange) {
        return QString("The correction range of %1 samples is out of range; permitted: %2 to %3.")
            .arg(settings.range)
            .arg(WrapSettings::MinRange)
            .arg(WrapSettings::MaxRange);
    }
    if (end - settings.start < 2LL * settings.range) {
        return QString("The samples from %1 to %2 are too few for a correction of %3 samples on "
                       "each side.")
            .arg(settings.start + 1)
            .arg(end + 1)
            .arg(settings.range);
    }
    const double cutoff = settings.cutoffHz.value_or(0.25 * clockHz);
    if (!(cutoff >= 0.01 * clockHz && cutoff <= 0.5 * clockHz)) {
        return QString("The cutoff frequency of %1 is out of range; permitted: %2 to %3.")
            .arg(engineeringText(cutoff, "Hz"), engineeringText(0.01 * clockHz, "Hz"),
                 engineeringText(0.5 * clockHz, "Hz"));
    }
    return {};
}

std::optional<Joint> readJoint(BufferedIO &data, const WrapSettings &settings, qint64 samples)
{
    std::vector<float> head;
    std::vector<float> tail;
    if (!readHalf(data, settings.start, head, "Cannot read waveform head.") ||
        !readHalf(data, settings.endOf(samples) - JointHalf, tail, "Cannot read waveform tail.")) {
        return std::nullopt;
    }
    Joint joint;
    append(joint, tail);
    append(joint, head);
    return joint;
}

WrapJob::WrapJob(WrapRequest request, QObject *parent)
    : EditJob(request.inputFile, request.output, Reading::Quiet, parent)
    , m_request(std::move(request))
{
    setEnding({"Wrap around removal complete.", "Processing failed. See Log for details."});
}

bool WrapJob::edit()
{
    const WvFileInfo &info = source().info();
    const std::optional<double> clock = clockOr(m_request.clockHz);
    if (!clock) {
        return false;
    }
    const double sourceClock = info.clock > 0 ? info.clock : *clock;
    const WrapSettings &settings = m_request.settings;
    if (const QString problem = wrapProblem(settings, info.samples, sourceClock);
        !problem.isEmpty()) {
        return Tracer::fail(problem);
    }
    Tracer::Trace(Tracer::Information, "Creating corrected data...");
    const std::optional<Joint> joint = readJoint(*source().data(), settings, info.samples);
    if (!joint) {
        return false;
    }
    const double cutoff = settings.cutoffHz.value_or(0.25 * sourceClock) / sourceClock;
    if (!build(smoothedJoint(*joint, cutoff, settings.range)) || !mayProceed()) {
        return false;
    }
    const auto count = static_cast<int>(settings.endOf(info.samples) - settings.start);
    WvWriteJob &record = output().record();
    emit report(ReportLine::plain("Uncorrected Waveform"));
    reportRow("Peak/RMS", info.rmsOffsetTag - info.peakOffsetTag);
    reportRow("Peak Offset", info.peakOffsetTag);
    record.peakOffset = levelOffset(m_levels.peakLevel(), OffsetFloor);
    record.rmsOffset = levelOffset(m_levels.rmsLevel(count), OffsetFloor);
    emit report(ReportLine::plain("Corrected Waveform"));
    reportRow("Peak/RMS", record.rmsOffset - record.peakOffset);
    reportRow("Peak Offset", record.peakOffset);
    if (const double change = -levelOffset(jointGain(cutoff)); std::abs(change) > 1) {
        emit report(ReportLine::warning(
            QString("The correction changes the level at the loop point by %1 dB. A lower cutoff "
                    "frequency and a smaller correction range change less.")
                .arg(change, 0, 'f', 1)));
    }
    emit report(ReportLine::plain("Creating waveform..."));
    emit report(ReportLine::heading("Saving"));
    output().reportFile();
    output().setLength(*clock, count);
    if (count != info.samples) {
        source().dropTags();
    }
    const WvStreams streams{m_data.stream(), m_markers.stream(), source().tags()};
    if (!output().save(streams, "Saving...")) {
        setFailureText("Waveform creation FAILED.");
        return Tracer::fail("Waveform creation failed.");
    }
    return true;
}

void WrapJob::reportRow(const QString &label, double decibels)
{
    emit report(ReportLine::row(label, QString("%1 dB").arg(decibels)));
}

bool WrapJob::build(const Joint &joint)
{
    const WrapSettings &settings = m_request.settings;
    const qint64 range = settings.range;
    const qint64 samples = source().info().samples;
    if (!m_data.openFor(samples) || !m_data->writeHeader(BufferedIO::DataHeader)) {
        return Tracer::fail("Cannot create temporary data buffer.");
    }
    if (!m_markers.open()) {
        return Tracer::fail("Cannot create temporary marker buffer.");
    }
    if (!source().data()->restartAtPosition(BufferedIO::HeaderSize +
                                            (settings.start + range) * BufferedIO::RecordSize)) {
        return Tracer::fail("Cannot initialize data buffer for read.");
    }
    if (!source().markers()->restartAtPosition(settings.start)) {
        return Tracer::fail("Cannot initialize marker buffer for read.");
    }
    const auto edge = static_cast<std::size_t>(range);
    const auto middle = std::span(joint).subspan(JointHalf - edge, 2 * edge);
    Tracer::Trace(Tracer::Information, "Copying head section...");
    if (!writeCorrected(middle.last(edge)) || !copyMarkers(range)) {
        return false;
    }
    Tracer::Trace(Tracer::Information, "Copying body...");
    if (!copyBody(settings.endOf(samples) - settings.start - 2 * range)) {
        return false;
    }
    Tracer::Trace(Tracer::Information, "Copying tail section...");
    return writeCorrected(middle.first(edge)) && copyMarkers(range);
}

bool WrapJob::writeCorrected(std::span<const std::complex<double>> samples)
{
    std::vector<float> values;
    for (const std::complex<double> &sample : samples) {
        values.push_back(static_cast<float>(sample.real()));
        values.push_back(static_cast<float>(sample.imag()));
    }
    addLevels(values, m_levels);
    return writeSamples(*m_data.stream(), values) ||
           Tracer::fail("Cannot write to temporary data buffer.");
}

bool WrapJob::copyBody(qint64 samples)
{
    emit stepStarted("Copying waveform body");
    ProgressClock progress([this](int percent) { emit ProgressUpdate(percent); }, cancelFlag());
    const BlockLoop loop = forEachBlock(
        *source().data(), samples, [&](qint64 done) { return progress.shouldStop(done, samples); },
        [this](std::span<const float> iq, qint64) {
            addLevels(iq, m_levels);
            return (writeSamples(*m_data.stream(), iq) ||
                    Tracer::fail("Cannot write to temporary data buffer.")) &&
                   copyMarkers(static_cast<qint64>(iq.size() / 2));
        });
    switch (loop.end) {
    case BlockLoop::Stopped:
        return Tracer::fail("Action aborted by user.");
    case BlockLoop::ReadFailed:
        return Tracer::fail("Cannot read from data buffer.");
    case BlockLoop::WorkFailed:
    case BlockLoop::Done:
        break;
    }
    return loop.end == BlockLoop::Done;
}

bool WrapJob::copyMarkers(qint64 count)
{
    std::vector<quint8> bytes(static_cast<std::size_t>(count));
    if (source().markers()->readBlock(static_cast<int>(count), bytes.data()) != count) {
        return Tracer::fail("Cannot read from marker buffer.");
    }
    return count == 0 || m_markers->writeBytes(static_cast<int>(count), bytes.data()) ||
           Tracer::fail("Cannot write to temporary marker buffer.");
}
