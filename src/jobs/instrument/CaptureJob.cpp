// SPDX-License-Identifier: Apache-2.0
#include "CaptureJob.h"

#include "base/EngineeringNumber.h"
#include "dsp/Resample.h"
#include "instrument/VisaDevice.h"
#include "log/Tracer.h"
#include "streams/levels.h"

#include <QCoreApplication>
#include <QThread>

#include <array>
#include <cmath>
#include <utility>

namespace {

constexpr qint64 SampleBytes = 8;
/// Execution error: what an analyzer without the input answers.
constexpr int MissingInput = -200;
/// Bit of the event status register that the end of the sweep sets.
constexpr unsigned SweepDone = 1;
constexpr unsigned long TickMs = 10;
constexpr int TicksPerQuery = 25;
constexpr int TicksPerProgress = 10;

template <typename Choice, std::size_t Count>
QString wordOf(Choice choice, const std::array<const char *, Count> &words)
{
    return words.at(static_cast<std::size_t>(choice));
}

} // namespace

CaptureJob::CaptureJob(CaptureRequest request, QObject *parent)
    : ToolJob(parent)
    , m_request(std::move(request))
{
    setEnding({"Reading I/Q Data Complete.", "Reading I/Q Data Failed.",
               "User Break. No Data Captured."});
}

void CaptureJob::say(const QString &text)
{
    emit report(ReportLine::plain(text));
    QCoreApplication::processEvents();
}

bool CaptureJob::work()
{
    m_capture = std::make_unique<Capture>();
    if (!m_capture->data.openFor(m_request.samples)) {
        m_capture.reset();
        return Tracer::fail("Cannot create temporary data buffer.");
    }
    emit report(ReportLine::heading("Capturing IQ Trace from Analyzer"));
    emit stepStarted("Capturing...");
    VisaDevice device;
    if (const QString problem = device.takeLastError(); !problem.isEmpty()) {
        Tracer::Trace(Tracer::Error, problem);
    }
    say(QString("Opening instrument '%1'").arg(m_request.resource));
    bool done = false;
    if (!device.openResource(m_request.resource)) {
        setFailureText("Cannot Open Device");
        Tracer::Trace(Tracer::Error,
                      QString("The analyzer '%1' cannot be opened.").arg(m_request.resource));
    } else if (!device.isAnalyzer()) {
        setFailureText("The Selected Device is not a Spectrum Analyzer.");
        Tracer::Trace(Tracer::Error, QString("The device '%1, %2' is no spectrum analyzer.")
                                         .arg(device.model(), device.serial()));
    } else {
        done = record(device) && !isCancelled();
    }
    device.closeResource();
    if (!done) {
        m_capture.reset();
    }
    return done;
}

bool CaptureJob::record(VisaDevice &device)
{
    device.checkErrorQueue();
    say("Configuring instrument");
    const bool done = !isCancelled() && device.sendCommand("INST:SEL SAN; *OPC?") &&
                      device.sendCommand("TRAC:IQ:STAT ON; *OPC?") && device.checkErrorQueue() &&
                      selectInput(device) && configure(device) && !isCancelled() && sweep(device) &&
                      readSamples(device) && measure();
    if (!done) {
        const QString reported = device.takeLastError().trimmed().replace('\n', "; ");
        if (!reported.isEmpty()) {
            Tracer::Trace(Tracer::Error, "The instrument reports: " + reported);
        }
        return false;
    }
    device.checkErrorQueue();
    m_capture->comment = commentText();
    return device.sendCommand("TRAC:IQ:STAT OFF; *OPC?") &&
           device.sendCommand("INIT:CONT ON; *OPC?");
}

bool CaptureJob::selectInput(VisaDevice &device)
{
    const QString word = wordOf(m_request.input, std::array<const char *, 3>{"RF", "AIQ", "DIQ"});
    QString answer;
    if (!device.sendCommand("INP:SEL " + word + "; *OPC?") ||
        !device.queryText("SYST:ERR?", answer)) {
        return false;
    }
    const int number = answer.section(',', 0, 0).toInt();
    if (number == MissingInput) {
        emit report(ReportLine::warning("Instrument only supports RF Input."));
        m_request.input = CaptureRequest::Input::Rf;
    } else if (number != 0) {
        return Tracer::fail("The instrument reports: " + answer);
    }
    return device.checkErrorQueue();
}

bool CaptureJob::configure(VisaDevice &device)
{
    const QString trigger =
        wordOf(m_request.trigger, std::array<const char *, 3>{"IMM", "EXT", "IFP"});
    const QString slope = wordOf(m_request.slope, std::array<const char *, 2>{"POS", "NEG"});
    const QString command = QString("TRAC:IQ:SET NORM,%1Hz,%2,%3,%4,%5,%6; *OPC?")
                                .arg(m_request.rbwHz)
                                .arg(m_request.sampleRateHz)
                                .arg(trigger, slope)
                                .arg(m_request.pretriggerSamples)
                                .arg(m_request.samples);
    QString answer;
    if (!device.sendCommand(command) || !device.checkErrorQueue() ||
        !device.queryText("TRACE:IQ:SRATE?", answer)) {
        return false;
    }
    m_capture->samples = m_request.samples;
    m_capture->clockHz = answer.toDouble();
    if (!(m_capture->clockHz > 0)) {
        return Tracer::fail(
            QString("The analyzer reports the sample rate '%1', which is none.").arg(answer));
    }
    // What stands before the recorder on the RF input alone.
    const bool isRf = m_request.input == CaptureRequest::Input::Rf;
    if (isRf && !readReference(device)) {
        return false;
    }
    say("  Center Frequency:     \t" + (isRf ? engineeringText(m_centerHz, "Hz") : QString("-")));
    say("  Resolution Bandwidth: \t" + engineeringText(m_request.rbwHz, "Hz"));
    say("  Sample Rate:          \t" + engineeringText(m_capture->clockHz, "Hz"));
    say(QString("  Samples:              \t%1").arg(m_request.samples));
    say("  Attenuation:          \t" + (isRf ? QString("%1 dB").arg(m_attenuationDb) : "-"));
    say("  Ref. Level:           \t" + (isRf ? QString("%1 dB").arg(m_referenceDbm) : "-"));
    return true;
}

bool CaptureJob::readReference(VisaDevice &device)
{
    const auto read = [&](const char *query, double &value) {
        QString answer;
        const bool answered = device.queryText(query, answer);
        value = answer.toDouble();
        return answered;
    };
    const bool done =
        device.sendCommand("UNIT:POW DBM; *OPC?") &&
        device.sendCommand(QString("TRIG:LEV:IFP %1; *OPC?").arg(m_request.triggerLevelDbm)) &&
        read("FREQ:CENT?", m_centerHz) && read("INP:ATT?", m_attenuationDb) &&
        read("DISP:TRAC:Y:RLEV?", m_referenceDbm);
    if (done) {
        device.checkErrorQueue();
    }
    return done;
}

bool CaptureJob::sweep(VisaDevice &device)
{
    say("Starting Sweep");
    for (const char *command : {"*CLS", "*ESE 1", "INIT:IMM", "*OPC"}) {
        if (!device.sendCommand(command)) {
            return false;
        }
    }
    return waitForSweep(device);
}

bool CaptureJob::waitForSweep(VisaDevice &device)
{
    for (;;) {
        QString answer;
        if (!device.queryText("*ESR?", answer)) {
            return false;
        }
        if ((answer.toUInt() & SweepDone) != 0) {
            return true;
        }
        for (int tick = 0; tick < TicksPerQuery && !isCancelled(); ++tick) {
            QThread::msleep(TickMs);
            if (tick % TicksPerProgress == 0) {
                // Nobody knows when a trigger comes.
                emit ProgressUpdate(-1);
            }
            QCoreApplication::processEvents();
        }
        if (isCancelled()) {
            (void)device.sendCommand("ABORT");
            return false;
        }
    }
}

bool CaptureJob::readSamples(VisaDevice &device)
{
    say("Reading Data");
    if (!device.sendCommand("FORM REAL,32; *OPC?") ||
        !device.sendCommand("TRAC:IQ:DATA:FORM IQP; *OPC?") ||
        !device.sendCommand("TRAC:IQ:DATA:MEMORY?")) {
        return false;
    }
    const auto progress = connect(&device, &VisaDevice::ProgressUpdate, this, [this](int percent) {
        emit ProgressUpdate(percent);
        QCoreApplication::processEvents();
    });
    const bool done =
        device.readBinaryBlock(m_capture->data.stream(), m_request.samples * SampleBytes);
    disconnect(progress);
    return done && !isCancelled();
}

bool CaptureJob::measure()
{
    say("Analyzing Data");
    Resample levels;
    const JobStep step(*this, "Analyzing Data", levels);
    if (!levels.statistics(m_capture->samples, m_capture->data.stream(), &m_capture->peak,
                           &m_capture->rms)) {
        return Tracer::fail(QString("The analyzer sent fewer than the %1 samples asked for.")
                                .arg(m_capture->samples));
    }
    if (!std::isfinite(m_capture->peak) || !std::isfinite(m_capture->rms)) {
        return Tracer::fail("The analyzer sent samples that are no numbers.");
    }
    constexpr double Silence = 1e-15;
    say(QString("  Peak Level Offset:    \t%1 dB").arg(levelOffset(m_capture->peak, Silence)));
    return true;
}

QString CaptureJob::commentText() const
{
    const QString rbw = engineeringText(m_request.rbwHz, "Hz");
    switch (m_request.input) {
    case CaptureRequest::Input::AnalogIq:
        return "Analog Input, RBW=" + rbw;
    case CaptureRequest::Input::DigitalIq:
        return "Digital Input";
    case CaptureRequest::Input::Rf:
        break;
    }
    return QString("Center=%1, RBW=%2, Ref Level=%3 dBm, Atten=%4 dB")
        .arg(engineeringText(m_centerHz, "Hz"), rbw)
        .arg(m_referenceDbm)
        .arg(m_attenuationDb);
}
