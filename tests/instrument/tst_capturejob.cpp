// SPDX-License-Identifier: Apache-2.0
#include "FakeInstrument.h"

#include "jobs/instrument/CaptureJob.h"
#include "jobs/instrument/CaptureSaveJob.h"
#include "support/files.h"
#include "support/logreader.h"
#include "support/rows.h"
#include "support/wvbytes.h"
#include "visa/visa.h"

#include <QTest>
#include <QTimer>

namespace {

constexpr int SampleCount = 100;

/// A block with that many samples, each I 0.5 and Q 0.
std::string block(int samples)
{
    QByteArray data;
    for (int i = 0; i < samples; ++i) {
        data += littleEndian(0.5F) + littleEndian(0.0F);
    }
    const std::string size = std::to_string(data.size());
    return '#' + std::to_string(size.size()) + size + data.toStdString();
}

/// What one capture shows and leaves.
struct Outcome
{
    JobOutcome outcome = JobOutcome::Failed;
    QStringList report;
    std::unique_ptr<Capture> capture;
};

} // namespace

class TestCaptureJob : public QObject
{
    Q_OBJECT
private slots:
    void init();
    void cleanup() { m_fake.reset(); }
    void asksInOrder();
    void inputs();
    void failures();
    void abortEndsTheSweep();
    void saves();

private:
    Outcome capture(CaptureRequest::Input input = CaptureRequest::Input::Rf);

    std::unique_ptr<FakeInstrument> m_fake;
    std::map<std::string, std::string> m_answers;
};

void TestCaptureJob::init()
{
    m_fake = std::make_unique<FakeInstrument>();
    FakeVisa *fake = m_fake->operator->();
    fake->identity = "Halvorn,PAX-630,100002/003,1.0";
    fake->options = "PAX600-A1";
    m_answers = {{"SYST:ERR?", "0,\"No error\"\n"},
                 {"TRACE:IQ:SRATE?", "2500000\n"},
                 {"FREQ:CENT?", "1E9\n"},
                 {"INP:ATT?", "10\n"},
                 {"DISP:TRAC:Y:RLEV?", "-10\n"},
                 {"*ESR?", "1\n"},
                 {"TRAC:IQ:DATA:MEMORY?", block(SampleCount) + '\n'}};
    fake->answer = [this](const std::string &message) {
        const auto found = m_answers.find(message);
        return found == m_answers.end() ? std::string() : found->second;
    };
    (void)takeLog();
}

Outcome TestCaptureJob::capture(CaptureRequest::Input input)
{
    CaptureJob job({.resource = "GPIB0::20::INSTR",
                    .input = input,
                    .sampleRateHz = 2e6,
                    .samples = SampleCount,
                    .pretriggerSamples = -3,
                    .trigger = CaptureRequest::Trigger::IfPower,
                    .slope = CaptureRequest::Slope::Negative});
    Outcome outcome;
    connect(&job, &ToolJob::report, this,
            [&](const ReportLine &line) { outcome.report.append(line.text); });
    connect(&job, &ToolJob::ProgressUpdate, this, [&](int percent) {
        if (percent < 0) {
            job.cancel(); // asked for a second time, the sweep has not ended
        }
    });
    outcome.outcome = job.run();
    outcome.capture = job.takeCapture();
    return outcome;
}

void TestCaptureJob::asksInOrder()
{
    const Outcome outcome = capture();
    QCOMPARE(outcome.outcome, JobOutcome::Finished);
    QCOMPARE(outcome.report.last(), "Reading I/Q Data Complete.");
    QCOMPARE(m_fake->takeMessages().mid(3),
             (QStringList{"INST:SEL SAN; *OPC?",
                          "TRAC:IQ:STAT ON; *OPC?",
                          "INP:SEL RF; *OPC?",
                          "SYST:ERR?",
                          "TRAC:IQ:SET NORM,1e+07Hz,2e+06,IFP,NEG,-3,100; *OPC?",
                          "TRACE:IQ:SRATE?",
                          "UNIT:POW DBM; *OPC?",
                          "TRIG:LEV:IFP -20; *OPC?",
                          "FREQ:CENT?",
                          "INP:ATT?",
                          "DISP:TRAC:Y:RLEV?",
                          "*CLS",
                          "*ESE 1",
                          "INIT:IMM",
                          "*OPC",
                          "*ESR?",
                          "FORM REAL,32; *OPC?",
                          "TRAC:IQ:DATA:FORM IQP; *OPC?",
                          "TRAC:IQ:DATA:MEMORY?",
                          "TRAC:IQ:STAT OFF; *OPC?",
                          "INIT:CONT ON; *OPC?"}));
    // The rate that the analyzer has, not the one that was asked for.
    QCOMPARE(outcome.capture->clockHz, 2.5e6);
    QCOMPARE(outcome.capture->peak, 0.5);
    QVERIFY2(outcome.report.contains("  Peak Level Offset:    \t6.0206 dB"),
             qPrintable(outcome.report.join('\n')));
    QCOMPARE((*m_fake)->openSessions, 0U);
}

void TestCaptureJob::inputs()
{
    using Input = CaptureRequest::Input;
    const std::string missing = "-200,\"Execution error\"\n";
    struct Row
    {
        const char *name;
        Input input;
        std::string error;
        QString comment;
    };
    const QString rf = "Center=1 GHz, RBW=10 MHz, Ref Level=-10 dBm, Atten=10 dB";
    forRows<Row>({{"RF", Input::Rf, "0\n", rf},
                  {"analog", Input::AnalogIq, "0\n", "Analog Input, RBW=10 MHz"},
                  {"digital", Input::DigitalIq, "0\n", "Digital Input"},
                  {"missing", Input::DigitalIq, missing, rf}},
                 [this, &missing](const Row &row) {
                     m_answers["SYST:ERR?"] = row.error;
                     const Outcome outcome = capture(row.input);
                     QCOMPARE(outcome.outcome, JobOutcome::Finished);
                     QCOMPARE(outcome.capture->comment, row.comment);
                     QCOMPARE(outcome.report.contains("Instrument only supports RF Input."),
                              row.error == missing);
                 });
}

void TestCaptureJob::failures()
{
    struct Row
    {
        const char *name;
        std::string query;
        std::string answer;
        QString shown;
        QString logged;
    };
    const QString failed = "Reading I/Q Data Failed.";
    forRows<Row>({{"no analyzer", "*IDN?", "Halvorn,TGX-870,TGX870/1/1,1.0\n",
                   "The Selected Device is not a Spectrum Analyzer.",
                   "4|The device 'TGX-870, 1' is no spectrum analyzer."},
                  {"other maker", "*IDN?", "Acme,PAX-630,1/1,1\n", "Cannot Open Device",
                   "4|This device is not a Halvorn instrument."},
                  {"input refused", "SYST:ERR?", "-113,\"Undefined header\"\n", failed,
                   "4|The instrument reports: -113,\"Undefined header\""},
                  {"no rate", "TRACE:IQ:SRATE?", "none\n", failed,
                   "4|The analyzer reports the sample rate 'none', which is none."},
                  {"short block", "TRAC:IQ:DATA:MEMORY?", block(SampleCount).substr(0, 500), failed,
                   "4|Cannot read terminating character."},
                  {"few samples", "TRAC:IQ:DATA:MEMORY?", block(50) + '\n', failed,
                   "4|The analyzer sent fewer than the 100 samples asked for."},
                  {"block too long", "TRAC:IQ:DATA:MEMORY?", block(SampleCount + 1) + '\n', failed,
                   "4|Data buffer too small."}},
                 [this](const Row &row) {
                     init();
                     m_answers[row.query] = row.answer;
                     const Outcome outcome = capture();
                     QCOMPARE(outcome.outcome, JobOutcome::Failed);
                     QCOMPARE(outcome.report.last(), row.shown);
                     const QStringList log = takeLog();
                     QVERIFY2(log.contains(row.logged), qPrintable(log.join('\n')));
                     QVERIFY(!outcome.capture);
                     QCOMPARE((*m_fake)->openSessions, 0U);
                 });
    init();
    (*m_fake)->status = [lost = false](const std::string &call) mutable {
        lost = lost || call.rfind("viWrite 20", 0) == 0; // TRAC:IQ:DATA:MEMORY?
        return lost && call != "viClose" ? VI_ERROR_CONN_LOST : VI_SUCCESS;
    };
    QCOMPARE(capture().report.last(), failed);
    QCOMPARE((*m_fake)->openSessions, 0U);
}

void TestCaptureJob::abortEndsTheSweep()
{
    m_answers["*ESR?"] = "0\n";
    const Outcome outcome = capture();
    QCOMPARE(outcome.outcome, JobOutcome::Cancelled);
    QCOMPARE(outcome.report.last(), "User Break. No Data Captured.");
    QCOMPARE(m_fake->takeMessages().last(), "ABORT");
    QVERIFY(!outcome.capture);
}

void TestCaptureJob::saves()
{
    struct Row
    {
        const char *name;
        ImportScaling scaling;
        QByteArray levels;
        int word;
    };
    const TestFolder folder;
    forRows<Row>({{"none", ImportScaling::None, "6.020600,6.020600", 16384},
                  // Neither does this one change a level.
                  {"down", ImportScaling::Down, "6.020600,6.020600", 16384},
                  {"auto", ImportScaling::Auto, "0.000000,0.000000", 32767}},
                 [&](const Row &row) {
                     const Outcome outcome = capture();
                     QVERIFY(outcome.capture);
                     CaptureSaveJob save(*outcome.capture, {folder.path("a.wv"), {}, {}},
                                         outcome.capture->clockHz, row.scaling);
                     QCOMPARE(save.run(), JobOutcome::Finished);
                     const QByteArray file = folder.load("a.wv");
                     QCOMPARE(tag(file, "CLOCK").toDouble(), 2.5e6);
                     QCOMPARE(tag(file, "LEVEL OFFS"), row.levels);
                     QVERIFY(tag(file, "COMMENT").startsWith("Center=1 GHz"));
                     QCOMPARE(sampleWords(file).left(4), words({row.word, 0}));
                 });
}

QTEST_GUILESS_MAIN(TestCaptureJob)
#include "tst_capturejob.moc"
