// SPDX-License-Identifier: Apache-2.0
// The instr commands of corvane-cli against simulated instruments.
#include "simulator/SimulatorProcess.h"
#include "support/files.h"
#include "support/rows.h"

#include <QDir>
#include <QElapsedTimer>
#include <QFile>
#include <QJsonArray>
#include <QJsonDocument>
#include <QJsonObject>
#include <QProcess>
#include <QRegularExpression>
#include <QTemporaryDir>
#include <QTest>

#include <csignal>

namespace {

struct Outcome
{
    int exitCode = -1;
    QString output;
    QStringList log;

    [[nodiscard]] QJsonDocument json() const { return QJsonDocument::fromJson(output.toUtf8()); }
    [[nodiscard]] QString lastLine() const { return log.isEmpty() ? QString() : log.last(); }
};

QString program()
{
    return qEnvironmentVariable("CORVANE_BIN") + "/corvane-cli";
}

Outcome outcomeOf(QProcess &process)
{
    process.waitForFinished(60'000);
    return {process.exitStatus() == QProcess::NormalExit ? process.exitCode() : -1,
            QString::fromUtf8(process.readAllStandardOutput()),
            QString::fromUtf8(process.readAllStandardError()).split('\n', Qt::SkipEmptyParts)};
}

Outcome runProgram(const QStringList &arguments)
{
    QProcess process;
    process.start(program(), arguments);
    return outcomeOf(process);
}

Outcome run(const QStringList &arguments)
{
    return runProgram(QStringList{"instr"} + arguments);
}

const QString device = "GPIB0::28";

} // namespace

class TestInstrCommands : public QObject
{
    Q_OBJECT
private slots:
    void init();
    void cleanup() { m_simulator.reset(); }
    void wrongUsage();
    void info();
    void scan();
    void queryAndSend();
    void foldersAndFiles();
    void transfers();
    void getKeepsFiles();
    void failures();
    void play();
    void rfSide();
    void limitsOfTheInstrument();
    void capturedSignalPlaysBack();
    void interrupted();
    void withoutLibrary();

private:
    void interrupt(const QString &command, const QByteArray &sign);
    [[nodiscard]] QString local(const QString &name) const { return m_folder->filePath(name); }
    [[nodiscard]] QString remote(const QString &name) const
    {
        return m_simulator->root() + "/a/var/user/" + name;
    }

    std::unique_ptr<QTemporaryDir> m_folder;
    std::unique_ptr<SimulatorProcess> m_simulator;
};

void TestInstrCommands::init()
{
    m_folder = std::make_unique<QTemporaryDir>();
    m_simulator = std::make_unique<SimulatorProcess>();
    QVERIFY(m_simulator->startConfig("[a]\nmodel=TGX-870\nserial=100001\nroot=%ROOT%/a\n"
                                     "gateway=0\ngpib=28\n"
                                     "[b]\nmodel=PAX-690\nserial=200002\nroot=%ROOT%/b\n"
                                     "gateway=0\ngpib=5\n",
                                     2));
    QVERIFY(store(local("visa.ini"), QString("[GPIB0]\nhost=127.0.0.1\nport=%1\naddresses=5,28\n")
                                         .arg(m_simulator->gatewayPort())
                                         .toLatin1()));
    qputenv("CORVANE_VISA_CONFIG", local("visa.ini").toLocal8Bit());
}

void TestInstrCommands::wrongUsage()
{
    struct Row
    {
        const char *name;
        QStringList arguments;
        QString words;
    };
    forRows<Row>({{"unknown command", {"dance", "x"}, "dance"},
                  {"empty resource", {"info", " "}, "RES"},
                  {"other interface", {"scan", "tcpip"}, "gpib, usb"},
                  {"no waveform", {"run", "x", "/var/user/a.wv.txt"}, "a.wv.txt"},
                  {"drive alone", {"rmdir", "x", "D:", "--recursive"}, "'D:'"},
                  {"folder above", {"rmdir", "x", "/a/b/..", "--recursive"}, ".."},
                  {"other folder", {"mv", "x", "/d/a.wv", "/e/a.wv"}, "NEW"},
                  {"nothing to set", {"rf", "x"}, "--freq"},
                  {"on and off", {"rf", "x", "--on", "--off"}, "--o"},
                  {"several to a file", {"put", "x", "a.wv", "b.wv", "/c.wv"}, "'/c.wv'"},
                  {"few samples", {"capture", "x", "-o", "a.wv", "--samples", "99"}, "--samples"}},
                 [](const Row &row) {
                     const Outcome outcome = run(row.arguments);
                     QCOMPARE(outcome.exitCode, 2);
                     QVERIFY(outcome.output.isEmpty());
                     QVERIFY2(outcome.lastLine().startsWith("error: ") &&
                                  outcome.lastLine().contains(row.words),
                              qPrintable(outcome.log.join('\n')));
                 });
}

void TestInstrCommands::info()
{
    const Outcome outcome = run({"info", device, "--json"});
    QCOMPARE(outcome.exitCode, 0);
    QCOMPARE(outcome.log, QStringList{});
    const QJsonObject object = outcome.json().object();
    QCOMPARE(object.keys(),
             (QStringList{"analyzer", "baseband", "firmware", "interface", "model", "options",
                          "resource", "rf", "roots", "serial", "vendor"}));
    QCOMPARE(object["interface"].toString(), "GPIB0");
    QCOMPARE(object["roots"].toArray(), (QJsonArray{"/var/user/", "/hdd/"}));
    QCOMPARE(object["rf"].toArray(), (QJsonArray{QJsonObject{{"lower", 9e3}, {"upper", 6e9}}}));
    QCOMPARE(object["baseband"].toArray(),
             (QJsonArray{
                 QJsonObject{{"size", 268435456}, {"clock", 60000000}, {"bandwidth", 90000000}}}));
    QVERIFY(!object["analyzer"].toBool(true));
    const Outcome analyzer = run({"info", "--json", "GPIB::5::INSTR"});
    QCOMPARE(analyzer.json().object()["serial"].toString(), "200002");
    QVERIFY(analyzer.json().object()["analyzer"].toBool());
    QVERIFY(run({"info", device}).output.contains("\nBB1 size:       256 MS\n"));
}

void TestInstrCommands::scan()
{
    const Outcome outcome = run({"scan", "gpib", "--json"});
    QCOMPARE(outcome.exitCode, 0);
    const QJsonArray found = outcome.json().array();
    QCOMPARE(found.size(), 2);
    QCOMPARE(found.at(1).toObject(), (QJsonObject{{"resource", "GPIB0::28::INSTR"},
                                                  {"model", "TGX-870"},
                                                  {"serial", "100001"},
                                                  {"interface", "GPIB0"}}));
    QCOMPARE(run({"scan", "usb", "--json"}).output, "[\n]\n");
    QVERIFY(run({"scan", "gpib"}).output.contains("GPIB0::5::INSTR\tPAX-690\t200002\tGPIB0\n"));
}

void TestInstrCommands::queryAndSend()
{
    Outcome outcome = run({"query", device, "*IDN?"});
    QCOMPARE(outcome.exitCode, 0);
    QCOMPARE(outcome.output, "Halvorn,TGX-870,TGX870/100001/01,1.0\n");
    QCOMPARE(outcome.log, QStringList{});
    // An answer is worth having even when the instrument complains besides.
    outcome = run({"query", device, "FOO; *IDN?"});
    QCOMPARE(outcome.exitCode, 1);
    QVERIFY(outcome.output.startsWith("Halvorn,"));
    QCOMPARE(outcome.lastLine(), "error: The instrument reports: -113,\"Undefined header\"");
    QCOMPARE(run({"send", device, "*RST;*OPC?"}).exitCode, 0);
    outcome = run({"send", device, "FOO"});
    QCOMPARE(outcome.exitCode, 1);
    QCOMPARE(outcome.lastLine(), "error: The instrument reports: -113,\"Undefined header\"");
    QCOMPARE(run({"send", device, "*IDN?"}).exitCode, 0);
    // Nothing that could move the cursor reaches a terminal.
    const QString log =
        runProgram({"--verbose", "instr", "send", device, "\033[2J"}).log.join('\n');
    QVERIFY2(log.contains("'\\x1B[2J'") && !log.contains('\033'), qPrintable(log));
}

void TestInstrCommands::foldersAndFiles()
{
    QCOMPARE(run({"mkdir", device, "/var/user/w/"}).exitCode, 0);
    QVERIFY(QDir(remote("w")).exists());
    QCOMPARE(run({"mkdir", device, "/var/user/w"}).exitCode, 1);
    QVERIFY(store(remote("w/a.wv"), "12345"));
    QVERIFY(store(remote("b.txt"), "123"));
    Outcome outcome = run({"ls", device, "/var/user", "--json"});
    QCOMPARE(outcome.json().array(),
             (QJsonArray{QJsonObject{{"name", "b.txt"}, {"type", "ASC"}, {"size", 3}},
                         QJsonObject{{"name", "w"}, {"type", "DIR"}, {"size", 0}}}));
    outcome = run({"ls", device, "/var/user/", "--recursive"});
    QCOMPARE(outcome.output, "ASC            3  b.txt\nDIR            0  w\n"
                             "BIN            5  w/a.wv\n");
    QCOMPARE(run({"mv", device, "/var/user/w/a.wv", "c.wv"}).exitCode, 0);
    QCOMPARE(run({"mv", device, "/var/user/w/c.wv", "/var/user/w/d.wv"}).exitCode, 0);
    QCOMPARE(load(remote("w/d.wv")), "12345");
    QCOMPARE(run({"mv", device, "/var/user/w/", "v"}).exitCode, 0);
    QCOMPARE(run({"rmdir", device, "/var/user/v"}).exitCode, 1);
    QCOMPARE(run({"rm", device, "/var/user/b.txt"}).exitCode, 0);
    QVERIFY(!QFile::exists(remote("b.txt")));
    outcome = run({"rm", device, "/var/user/b.txt"});
    QCOMPARE(outcome.exitCode, 0);
    QCOMPARE(outcome.log, QStringList{"warning: *** File does not exist on instrument."});
    QCOMPARE(run({"rmdir", device, "/var/user/v", "--recursive"}).exitCode, 0);
    QVERIFY(!QDir(remote("v")).exists());
}

void TestInstrCommands::transfers()
{
    const QByteArray data = QByteArray("#1\n\0x", 5).repeated(100'001);
    QVERIFY(store(local("x.wv"), data));
    Outcome outcome = run({"put", device, local("x.wv"), "/var/user/x.wv"});
    QCOMPARE(outcome.exitCode, 0);
    QCOMPARE(outcome.log, QStringList{});
    QVERIFY(load(remote("x.wv")) == data);
    QCOMPARE(run({"get", device, "/var/user/x.wv", local("back.wv")}).exitCode, 0);
    QVERIFY(load(local("back.wv")) == data);
    QVERIFY(store(remote("it's empty"), ""));
    QCOMPARE(run({"get", device, "/var/user/it's empty", local("empty")}).exitCode, 0);
    QVERIFY(QFile::exists(local("empty")) && load(local("empty")).isEmpty());
    // On an instrument with drives, whose paths may be written either way.
    QCOMPARE(run({"mkdir", "GPIB0::5", "D:\\w"}).exitCode, 0);
    QCOMPARE(run({"put", "GPIB0::5", local("x.wv"), "D:\\w\\"}).exitCode, 0);
    QCOMPARE(run({"mv", "GPIB0::5", "D:\\w\\x.wv", "D:/w/y.wv"}).exitCode, 0);
    QCOMPARE(run({"get", "GPIB0::5", "D:\\w\\y.wv", m_folder->path()}).exitCode, 0);
    QVERIFY(load(local("y.wv")) == data);
    QCOMPARE(run({"rmdir", "GPIB0::5", "D:\\w", "--recursive"}).exitCode, 0);
    QVERIFY(!QDir(m_simulator->root() + "/b/D:/w").exists());
    // Sent again, a file is replaced.
    QVERIFY(store(local("x.wv"), "short"));
    QCOMPARE(run({"put", device, local("x.wv"), "/var/user/x.wv"}).exitCode, 0);
    QCOMPARE(load(remote("x.wv")), "short");
}

void TestInstrCommands::getKeepsFiles()
{
    QVERIFY(store(remote("x.wv"), "new"));
    QVERIFY(store(local("x.wv"), "old"));
    Outcome outcome = run({"get", device, "/var/user/x.wv", local("x.wv")});
    QCOMPARE(outcome.exitCode, 1);
    QVERIFY(outcome.lastLine().contains("--force"));
    QCOMPARE(load(local("x.wv")), "old");
    QCOMPARE(run({"get", device, "/var/user/x.wv", local("x.wv"), "--force"}).exitCode, 0);
    QCOMPARE(load(local("x.wv")), "new");
    QCOMPARE(QDir(m_folder->path()).entryList(QDir::Files), (QStringList{"visa.ini", "x.wv"}));
}

void TestInstrCommands::failures()
{
    struct Row
    {
        const char *name;
        QStringList arguments;
        QString words;
    };
    forRows<Row>({{"no such device", {"info", "GPIB0::9"}, "viOpen"},
                  {"dead host",
                   {"info", "127.0.0.99"},
                   "error: The instrument 'TCPIP::127.0.0.99::INSTR' cannot be reached."},
                  {"no folder", {"ls", device, "/var/user/gone"}, "The instrument reports: -256,"},
                  {"no local file",
                   {"put", device, "/nonexistent.wv", "/var/user/"},
                   "'/nonexistent.wv' does not exist"},
                  {"no analyzer",
                   {"capture", device, "-o", local("c.wv")},
                   "The Selected Device is not a Spectrum Analyzer."}},
                 [](const Row &row) {
                     const Outcome outcome = run(row.arguments);
                     QCOMPARE(outcome.exitCode, 1);
                     QVERIFY(outcome.output.isEmpty());
                     QVERIFY2(outcome.log.join('\n').contains(row.words),
                              qPrintable(outcome.log.join('\n')));
                     QVERIFY(outcome.lastLine().startsWith("error: "));
                 });
    QVERIFY(!QFile::exists(local("c.wv")));
    // Nobody is there, and the examination says where the way ends.
    const Outcome outcome = run({"doctor", "127.0.0.99", "--json"});
    QCOMPARE(outcome.exitCode, 1);
    QStringList failed;
    const QJsonArray steps = outcome.json().array();
    for (const QJsonValue &step : steps) {
        if (!step["ok"].toBool()) {
            failed.append(step["step"].toString());
            QVERIFY(!step["text"].toString().isEmpty() && !step["advice"].toString().isEmpty());
        }
    }
    failed.removeAll("usbtmc");
    QCOMPARE(failed, (QStringList{"tcp 111", "tcp 4880", "tcp 5025", "link"}));
}

void TestInstrCommands::play()
{
    QVERIFY(store(remote("x.WV"), "12345"));
    QCOMPARE(run({"send", device, ":SYST:FAUL 'busy',60"}).exitCode, 0);
    Outcome outcome = run({"run", device, "/var/user/x.WV", "--timeout", "2"});
    QCOMPARE(outcome.exitCode, 1);
    QCOMPARE(outcome.lastLine(), "error: ARB did not get ready in time.");
}

void TestInstrCommands::rfSide()
{
    QVERIFY(store(remote("x.Wv"), "12345"));
    QJsonObject state = run({"state", device, "--json"}).json().object();
    QVERIFY(state.contains("waveform") && state["waveform"].isNull());
    QCOMPARE(state["arb"], QJsonValue(false));
    const QString transcript = local("talk.txt");
    const Outcome outcome = run({"run", device, "/var/user/x.Wv", "--transcript", transcript});
    QCOMPARE(outcome.exitCode, 0);
    QCOMPARE(outcome.log, QStringList{"warning: The RF output is off."});
    const QStringList lines = QString::fromUtf8(load(transcript)).split('\n');
    const QRegularExpression form(R"(^ *\d+ (>>|<<) .)");
    QCOMPARE(lines.filter(form).size(), lines.size() - 1);
    QCOMPARE(lines.filter(">> SOUR:BB:ARB:WAV:SEL '/var/user/x.Wv'").size(), 1);
    QCOMPARE(lines.filter("<< <5 bytes>").size(), 1);
    QCOMPARE(run({"rf", device, "--freq", "1.5G", "--level", "-12.5", "--on"}).exitCode, 0);
    state = run({"state", device, "--json"}).json().object();
    QCOMPARE(state["waveform"].toString(), "/var/user/x.Wv");
    QCOMPARE(state["arb"], QJsonValue(true));
    QCOMPARE(state["frequency"].toDouble(), 1.5e9);
    QCOMPARE(state["level"].toDouble(), -12.5);
    QCOMPARE(state["output"], QJsonValue(true));
    QCOMPARE(run({"stop", device}).exitCode, 0);
    const QString text = run({"state", device}).output;
    QVERIFY2(text.contains("ARB:            off\n") && text.contains("RF output:      on\n"),
             qPrintable(text));
    QCOMPARE(run({"rf", device, "--level", "99"}).exitCode, 1);
    QCOMPARE(run({"state", "GPIB0::5"}).lastLine(),
             "error: The device 'PAX-690, 200002' is no generator.");
}

void TestInstrCommands::limitsOfTheInstrument()
{
    const QString fast = local("fast.wv");
    const QStringList create{"create", "pm", "--freq", "1M", "--clock", "200M", "-o", fast};
    QCOMPARE(runProgram(create).exitCode, 0);
    Outcome outcome = runProgram({"check", fast, "--for", device, "--json"});
    QCOMPARE(outcome.exitCode, 3);
    QCOMPARE(outcome.json()["ok"], QJsonValue(false));
    const QString clock = outcome.json()["problems"].toArray().first().toString();
    QVERIFY2(clock.contains("200 MHz") && clock.contains("60 MHz"), qPrintable(clock));
    // The fastest options of the model play at 120 MHz, another model at 264 MHz.
    QCOMPARE(runProgram({"check", fast, "--model", "TGX-870"}).exitCode, 3);
    QCOMPARE(runProgram({"check", fast, "--model", "tbx-320"}).output, "ok\n");
    QCOMPARE(runProgram({"check", fast}).exitCode, 2);
    QCOMPARE(runProgram({"check", local("visa.ini"), "--model", "TGX-870"}).exitCode, 1);
    QVERIFY(store(local("n.txt"), "1"));
    outcome = run({"put", device, local("n.txt"), fast, "/var/user/", "--strict"});
    QCOMPARE(outcome.exitCode, 1);
    QVERIFY(!QFile::exists(remote("n.txt")));
    outcome = run({"put", device, local("n.txt"), fast, "/var/user/"});
    QCOMPARE(outcome.exitCode, 0);
    QCOMPARE(outcome.log.size(), 2);
    QVERIFY(outcome.log.first().startsWith("warning: " + fast));
    QVERIFY(load(remote("fast.wv")) == load(fast) && load(remote("n.txt")) == "1");
    // A whole file of which only the head is looked at is none that was cut off.
    QCOMPARE(runProgram({"create", "noise", "--duration", "20ms", "-o", local("n.wv")}).exitCode,
             0);
    QVERIFY(QFile::rename(local("n.wv"), remote("n.wv")));
    outcome = run({"run", device, "/var/user/n.wv", "--strict"});
    QCOMPARE(outcome.exitCode, 0);
    QCOMPARE(outcome.log, QStringList{"warning: The RF output is off."});
    QCOMPARE(run({"stop", device}).exitCode, 0);
    outcome = run({"run", device, "/var/user/fast.wv", "--strict"});
    QCOMPARE(outcome.exitCode, 1);
    QVERIFY2(outcome.lastLine().contains("200 MHz"), qPrintable(outcome.lastLine()));
    QCOMPARE(run({"query", device, "SOUR:BB:ARB:STAT?"}).output, "0\n");
}

/// From the analyzer by way of the disk to the generator.
void TestInstrCommands::capturedSignalPlaysBack()
{
    const QStringList capture{"capture",   "GPIB0::5", "-o",        local("c.wv"),
                              "--samples", "20000",    "--scaling", "none",
                              "--rate",    "2M",       "--comment", "two tones"};
    Outcome outcome = run(capture);
    QVERIFY2(outcome.exitCode == 0, qPrintable(outcome.log.join('\n')));
    QVERIFY(outcome.log.contains("Reading I/Q Data Complete."));
    QCOMPARE(outcome.log.last(), "Waveform File Created");
    outcome = runProgram({"info", "--json", local("c.wv")});
    const QJsonObject info = outcome.json().array().first().toObject();
    QCOMPARE(info["clock"].toDouble(), 2e6);
    QCOMPARE(info["samples"].toInt(), 20'000);
    QCOMPARE(info["comment"].toString(), "two tones");
    QCOMPARE(run(capture).exitCode, 1); // the file is there
    QCOMPARE(runProgram({"plot", local("c.wv"), "-o", local("c.png")}).exitCode, 0);
    outcome = runProgram(
        {"wrap", local("c.wv"), "-o", local("t.wv"), "--start", "1001", "--end", "11000"});
    QVERIFY2(outcome.exitCode == 0, qPrintable(outcome.log.join('\n')));
    QCOMPARE(run({"put", device, local("t.wv"), "/var/user/"}).exitCode, 0);
    QVERIFY(load(remote("t.wv")) == load(local("t.wv")));
    QCOMPARE(run({"run", device, "/var/user/t.wv"}).exitCode, 0);
    QCOMPARE(run({"query", device, "SOUR:BB:ARB:STAT?"}).output, "1\n");
}

void TestInstrCommands::interrupted()
{
    struct Row
    {
        const char *name; ///< the command
        QByteArray sign;  ///< in the log, that the work has begun
    };
    forRows<Row>(
        {{"put", "VISA >> Sending data"}, {"get", "Read block size"}, {"run", "Waiting for ARB"}},
        [this](const Row &row) { interrupt(row.name, row.sign); });
}

void TestInstrCommands::interrupt(const QString &command, const QByteArray &sign)
{
    // Sparse, and far more than moves before the signal arrives.
    QFile huge(command == "put" ? local("huge.wv") : remote("huge.wv"));
    QVERIFY(huge.open(QIODevice::WriteOnly) && huge.resize(999'999'999));
    QStringList arguments{"--verbose", "instr", command, device};
    if (command == "put") {
        arguments += {huge.fileName(), "/var/user/huge.wv"};
    } else {
        QCOMPARE(run({"send", device, ":SYST:FAUL 'busy',60"}).exitCode, 0);
        arguments += "/var/user/huge.wv";
        arguments += command == "get" ? QStringList{local("huge.wv")} : QStringList{};
    }
    QProcess process;
    process.setReadChannel(QProcess::StandardError);
    process.start(program(), arguments);
    QByteArray log;
    while (!log.contains(sign) && process.waitForReadyRead(30'000)) {
        log += process.readAllStandardError();
    }
    QElapsedTimer timer;
    timer.start();
    ::kill(static_cast<pid_t>(process.processId()), SIGINT);
    const Outcome outcome = outcomeOf(process);
    QCOMPARE(outcome.exitCode, 130);
    QVERIFY(timer.elapsed() < 10'000);
    // No part of a file, and an instrument that listens.
    QVERIFY(command == "put" ? !QFile::exists(remote("huge.wv"))
                             : !QFile::exists(local("huge.wv")));
    QCOMPARE(QDir(m_folder->path()).entryList({"*.part*"}), QStringList{});
    QCOMPARE(run({"query", device, "*OPT?"}).exitCode, 0);
    QFile::remove(huge.fileName());
    QCOMPARE(run({"send", device, ":SYST:FAUL:CLE"}).exitCode, 0);
}

void TestInstrCommands::withoutLibrary()
{
    QProcess process;
    QProcessEnvironment environment = QProcessEnvironment::systemEnvironment();
    environment.insert("CORVANE_VISA_LIBRARY", "/nonexistent.so");
    process.setProcessEnvironment(environment);
    process.start(program(), {"instr", "info", device});
    const Outcome outcome = outcomeOf(process);
    QCOMPARE(outcome.exitCode, 1);
    QVERIFY(outcome.log.first().contains("/nonexistent.so"));
    QVERIFY(outcome.log.contains("error: The VISA library cannot be loaded."));
}

QTEST_GUILESS_MAIN(TestInstrCommands)
#include "tst_instrcommands.moc"
