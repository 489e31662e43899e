// SPDX-License-Identifier: Apache-2.0
#include "CliRun.h"
#include "jobs/filebytes.h"

#include <QDir>
#include <QRegularExpression>
#include <QTemporaryDir>
#include <QTest>

#include <csignal>
#include <unistd.h>

using namespace filebytes;

/// How the program is called, and how it answers a call that goes wrong.
class TestCliUsage : public QObject
{
    Q_OBJECT

private slots:
    void initTestCase();
    void init();
    void refusesWrongUsage_data();
    void refusesWrongUsage();
    void takesNumbers_data();
    void takesNumbers();
    void takesOptionsAnywhere_data();
    void takesOptionsAnywhere();
    void helpsOnEachLevel_data();
    void helpsOnEachLevel();
    void failsWithItsReason_data();
    void failsWithItsReason();
    void keepsExistingFiles_data();
    void keepsExistingFiles();
    void forceOverwritesEvenTheSource();
    void survivesBadStreams_data();
    void survivesBadStreams();
    void separatesResultAndLog_data();
    void separatesResultAndLog();
    void takesNamesAndTextsAsTheyAre_data();
    void takesNamesAndTextsAsTheyAre();
    void interruptCancels_data();
    void interruptCancels();

private:
    [[nodiscard]] QString path(const QString &name) const { return m_folder.filePath(name); }

    [[nodiscard]] CliRun run(const QStringList &arguments) const
    {
        return CliRun::in(m_folder.path(), arguments);
    }

    /// Arguments as a user types them, split at blanks.
    [[nodiscard]] CliRun run(const QString &arguments) const
    {
        return run(arguments.split(' ', Qt::SkipEmptyParts));
    }

    QTemporaryDir m_folder;
    QTemporaryDir m_temporary; // for the streams of the runs
    const QStringList m_inputs{"cut.wav", "cut.wv", "empty", "folder", "in.wav", "in.wv"};
};

namespace {

const QByteArray wvBytes =
    wvFile("{TYPE: TGX-WV,0}{COMMENT:c}{CLOCK:1000000}{LEVEL OFFS:3.5,1.25}{SAMPLES:4}"
           "{CONTROL LENGTH:4}{MARKER LIST 1: 0:0;1:1}",
           words({0, 1, 2, 3, 0x4000, 5, 6, 7}));
const QByteArray wavBytes = wavFile(formatChunk() + chunk("data", QByteArray(40, '\2')));

} // namespace

void TestCliUsage::initTestCase()
{
    QVERIFY2(QFile::exists(CliRun::program()), "CORVANE_BIN must name the folder of corvane-cli");
    qputenv("TMPDIR", QFile::encodeName(m_temporary.path()));
}

void TestCliUsage::init()
{
    QDir(m_folder.path()).removeRecursively();
    QVERIFY(QDir().mkpath(path("folder")));
    QVERIFY(store(path("in.wv"), wvBytes) && store(path("in.wav"), wavBytes));
    QVERIFY(store(path("cut.wv"), wvBytes.chopped(2)) &&
            store(path("cut.wav"), wavBytes.chopped(1)));
    QVERIFY(store(path("empty"), {}));
}

void TestCliUsage::refusesWrongUsage_data()
{
    QTest::addColumn<QString>("arguments");
    QTest::addColumn<QString>("reason"); // regular expression for the whole last line
    const auto row = [](const char *arguments, const char *reason) {
        QTest::newRow(arguments[0] == '\0' ? "nothing" : arguments)
            << QString(arguments) << QString("^error: ") + reason + '$';
    };
    row("", ".*[Ss]ubcommand.*");
    row("import", ".*[Ss]ubcommand.*");
    row("unheard", ".*'unheard'.*");
    row("import unheard", ".*'unheard'.*");
    row("info", ".*files.*");
    row("dump", ".*file.*");
    row("measure", ".*file.*");
    row("level -o out.wv", ".*file.*");
    row("import wav -o out.wv", ".*file.*");
    row("level in.wv", ".*--output.*");
    row("import wav in.wav", ".*--output.*");
    row("level in.wv -o", ".*--output.*");
    row("level in.wv -o out.wv --unheard", ".*'--unheard'.*");
    row("--unheard info in.wv", ".*'--unheard'.*");
    row("info in.wv --unheard", ".*'--unheard'.*");
    row("level in.wv in.wv -o out.wv", ".*in\\.wv.*");
    row("level in.wv -o out.wv --peak", ".*--peak.*");
    row("level in.wv -o out.wv --peak 1 --peak 2", ".*--peak.*");
    row("level in.wv -o out.wv --peak=", ".*--peak.*");
    row("level in.wv -o out.wv --peak abc", "--peak: 'abc' is not a number; .*-50 dB to 50 dB");
    row("level in.wv -o out.wv --peak nan", "--peak: 'nan' is not a number; .*");
    row("level in.wv -o out.wv --peak inf", "--peak: 'inf' is not a number; .*");
    row("level in.wv -o out.wv --peak 1e999", "--peak: '1e999' is not a number; .*");
    row("level in.wv -o out.wv --peak 0x10", "--peak: '0x10' is not a number; .*");
    row("level in.wv -o out.wv --peak 1.2.3", "--peak: '1.2.3' is not a number; .*");
    row("level in.wv -o out.wv --peak 5Hz", "--peak: '5Hz' is not a number; .*");
    row("level in.wv -o out.wv --peak 5P", "--peak: '5P' is not a number; .*");
    row("level in.wv -o out.wv --peak 50.001",
        "--peak: '50.001' is out of range; .*-50 dB to 50 dB");
    row("level in.wv -o out.wv --pkrms -50.1", "--pkrms: '-50.1' is out of range; .*");
    row("level in.wv -o out.wv --pkrms 1k", "--pkrms: '1k' is out of range; .*");
    row("import wav in.wav -o out.wv --clock 999",
        "--clock: '999' is out of range; permitted: 1 kHz to 600 MHz");
    row("import wav in.wav -o out.wv --clock 600000001",
        "--clock: '600000001' is out of range; .*");
    row("import wav in.wav -o out.wv --clock -1M", "--clock: '-1M' is out of range; .*");
    row("import wav in.wav -o out.wv --clock 10us", "--clock: '10us' is not a number; .*");
    row("import wav in.wav -o out.wv --scaling up",
        "--scaling: 'up' is unknown; permitted: none, down, auto");
    row("dump in.wv --format xml", "--format: 'xml' is unknown; permitted: csv, cf32, ci16");
    row("dump in.wv -o out --from -1", "--from: '-1' is out of range; permitted: 0 to 2147483646");
    row("dump in.wv -o out --from 4", "--from: 4 lies outside the file; permitted: 0 to 3");
    row("dump in.wv -o out --from 1.5", "--from: '1.5' is not a whole number; .*");
    row("dump in.wv -o out --from 99999999999", "--from: '99999999999' is out of range; .*");
    row("dump in.wv -o out --count 0", "--count: '0' is out of range; permitted: 1 to 2147483647");
    row("dump in.wv -o out --count 5", "--count: 5 leads outside the file; permitted: 1 to 4");
    row("dump in.wv -o out --from 3 --count 2",
        "--count: 2 leads outside the file; permitted: 1 to 1");
    row("plot in.wv -o out --from 4", "--from: 4 lies outside the file; permitted: 0 to 3");
    row("plot in.wv --output=", ".*--output.*");
    row("plot in.wv -o out --view x", "--view: 'x' is unknown; permitted: iq, .*, constellation");
    row("plot in.wv -o out --size 63x64", "--size: 63x64 is not permitted; permitted: 64x64 .*");
    row("create", ".*[Ss]ubcommand.*");
    row("create function", ".*--output.*");
    row("create function -o out --freq 99",
        "--freq: '99' is out of range; permitted: 100 Hz to 20 MHz");
    row("create function -o out --amp-i nan", "--amp-i: 'nan' is not a number; .*0 to 1");
    row("create function -o out --oversampling 4.5",
        "--oversampling: '4.5' is not a whole number; permitted: 4 to 100000");
    row("create noise -o out --seed -1",
        "--seed: '-1' is out of range; permitted: 0 to 4294967295");
    row("create am -o out --mode x", "--mode: 'x' is unknown; permitted: regular, .*, 2-tone-nc");
    row("create pm -o out --clock inf", "--clock: 'inf' is not a number; .*1 kHz to 600 MHz");
    row("resample in.wv -o out", ".*--clock and --samples.*");
    row("resample in.wv -o out --samples 4 --clock 1M", ".*--clock.*--samples.*");
    row("resample in.wv -o out --samples 2147483647",
        "--samples: '2147483647' is out of range; permitted: 1 to 268435456");
    row("resample in.wv -o out --clock 601M", "--clock: '601M' is out of range; .*");
    row("measure in.wv --from 4", "--from: 4 lies outside the file; permitted: 0 to 3");
    row("measure in.wv --from 1 --count 4", "--count: 4 leads outside the file; permitted: 1 to 3");
}

void TestCliUsage::refusesWrongUsage()
{
    QFETCH(QString, arguments);
    QFETCH(QString, reason);
    const CliRun answer = run(arguments);
    QCOMPARE(answer.exitCode, 2);
    QVERIFY2(QRegularExpression(reason).match(answer.lastLine()).hasMatch(),
             qPrintable(answer.lines.join('\n')));
    QVERIFY(answer.output.isEmpty());
    QCOMPARE(QDir(m_folder.path()).entryList(QDir::AllEntries | QDir::NoDotAndDotDot), m_inputs);
}

void TestCliUsage::takesNumbers_data()
{
    QTest::addColumn<QString>("text");
    QTest::addColumn<QByteArray>("clock");
    const auto row = [](const char *text, const char *clock) {
        QTest::newRow(text) << QString(text) << QByteArray(clock);
    };
    row("10k", "10000.000000");
    row("10K", "10000.000000");
    row("1.5M", "1500000.000000");
    row("1,5M", "1500000.000000");
    row(" 1.5 MHz", "1500000.000000");
    row("1.5e6", "1500000.000000");
    row("1 000 kHz", "1000000.000000");
    row("2000000m", "2000.000000");
    row("0.6G", "600000000.000000");
    row("1000hz", "1000.000000");
    row("+44100.125", "44100.125000");
}

void TestCliUsage::takesNumbers()
{
    QFETCH(QString, text);
    QCOMPARE(run(QStringList{"import", "wav", "in.wav", "-o", "out.wv", "--clock", text}).exitCode,
             0);
    QFETCH(QByteArray, clock);
    QVERIFY(load(path("out.wv")).contains("{CLOCK:" + clock + "}{CLOCK MARKER:" + clock + '}'));
}

void TestCliUsage::takesOptionsAnywhere_data()
{
    QTest::addColumn<QString>("arguments");
    for (const char *arguments :
         {"level in.wv -o out.wv --peak -3 --quiet", "--quiet level -o out.wv --peak=-3 in.wv",
          "level --peak -3 in.wv --output out.wv --quiet",
          "--quiet --no-progress level --output=out.wv in.wv --peak -3dB",
          "level --quiet -oout.wv --peak -3 -- in.wv"}) {
        QTest::newRow(arguments) << QString(arguments);
    }
}

void TestCliUsage::takesOptionsAnywhere()
{
    QFETCH(QString, arguments);
    const CliRun answer = run(arguments);
    QCOMPARE(answer.exitCode, 0);
    QVERIFY2(answer.lines.isEmpty(), qPrintable(answer.lines.join('\n')));
    QVERIFY(load(path("out.wv")).contains(",3.000000}"));
}

void TestCliUsage::helpsOnEachLevel_data()
{
    QTest::addColumn<QString>("arguments");
    QTest::addColumn<QStringList>("expected");
    const QStringList output{"--output", "--comment", "--copyright", "--force"};
    QTest::newRow("top") << "--help" << QStringList{"info",      "dump",          "measure",
                                                    "level",     "import",        "--quiet",
                                                    "--verbose", "--no-progress", "--version"};
    QTest::newRow("version") << "--version" << QStringList{"corvane-cli "};
    QTest::newRow("info") << "info --help" << QStringList{"--json"};
    QTest::newRow("dump") << "dump --help"
                          << QStringList{"--from", "--count", "--format", "csv|cf32|ci16"};
    QTest::newRow("measure") << "measure --help" << QStringList{"--from", "--count", "--json"};
    QTest::newRow("level") << "level --help" << QStringList{"--peak", "--pkrms"} + output;
    QTest::newRow("import") << "import --help" << QStringList{"wav"};
    QTest::newRow("import wav") << "import wav --help"
                                << QStringList{"--clock", "none|down|auto", "--list", "--json"} +
                                       output;
}

void TestCliUsage::helpsOnEachLevel()
{
    QFETCH(QString, arguments);
    QFETCH(QStringList, expected);
    const CliRun answer = run(arguments);
    QCOMPARE(answer.exitCode, 0);
    QVERIFY(answer.lines.isEmpty());
    for (const QString &word : expected) {
        QVERIFY2(answer.output.contains(word.toUtf8()), qPrintable(word));
    }
}

void TestCliUsage::failsWithItsReason_data()
{
    QTest::addColumn<QString>("arguments");
    QTest::addColumn<QString>("reason");
    const auto row = [](const char *arguments, const char *reason) {
        QTest::newRow(arguments) << QString(arguments) << QString(reason);
    };
    row("info missing.wv", "error: missing.wv: File does not exist.");
    row("info folder", "error: folder: Cannot open file.");
    row("dump missing.wv", "error: Cannot open waveform input file.");
    row("dump missing.wv --from 3 -o out", "error: Cannot open waveform input file.");
    row("dump folder", "error: Cannot open waveform input file.");
    row("dump /dev/zero", "error: Cannot open waveform input file.");
    row("dump empty", "error: No tag mark found! Probably incorrect format.");
    row("dump cut.wv -o out", "error: Cannot read enough data from xWAVEFORM tag!");
    row("measure in.wav", "error: No tag mark found! Probably incorrect format.");
    row("measure cut.wv", "error: Cannot read enough data from xWAVEFORM tag!");
    row("level missing.wv -o out", "error: Cannot open waveform input file.");
    row("level cut.wv -o out", "error: Cannot read enough data from xWAVEFORM tag!");
    row("level in.wv -o missing/out", "error: Error opening output file.");
    row("level in.wv -o folder", "error: The output file 'folder' is a folder.");
    row("level in.wv -o folder --force", "error: The output file 'folder' is a folder.");
    row("level in.wv -o /dev/full --force",
        "error: Error writing output file: No space left on device");
    row("dump in.wv -o /dev/full --force",
        "error: Cannot write '/dev/full': No space left on device");
    row("dump in.wv -o missing/out", "error: Cannot open 'missing/out': No such file or directory");
    row("import wav missing.wav -o out", "error: Cannot open .wav file.");
    row("import wav missing.wav --list", "error: Cannot open .wav file.");
    row("import wav folder -o out", "error: Cannot open .wav file.");
    row("import wav empty -o out", "error: This is not a valid RIFF waveform file.");
    row("import wav in.wv --list --json", "error: This is not a valid RIFF waveform file.");
    row("import wav cut.wav -o out", "error: Cannot read data from .wav file.");
    row("import wav in.wav -o missing/out", "error: Error opening output file.");
}

void TestCliUsage::failsWithItsReason()
{
    QFETCH(QString, arguments);
    const CliRun answer = run(arguments);
    QCOMPARE(answer.exitCode, 1);
    QTEST(answer.lastLine(), "reason");
    QVERIFY(answer.output.isEmpty());
    QCOMPARE(QDir(m_folder.path()).entryList(QDir::AllEntries | QDir::NoDotAndDotDot), m_inputs);
}

void TestCliUsage::keepsExistingFiles_data()
{
    QTest::addColumn<QString>("arguments");
    QTest::newRow("level") << "level in.wv -o out.wv";
    QTest::newRow("level, source") << "level in.wv -o in.wv";
    QTest::newRow("import wav") << "import wav in.wav -o out.wv";
    QTest::newRow("dump") << "dump in.wv -o out.wv";
    QTest::newRow("dump, source") << "dump in.wv -o in.wv";
    QTest::newRow("plot") << "plot in.wv -o out.wv";
    QTest::newRow("create") << "create pm -o out.wv";
    QTest::newRow("resample") << "resample in.wv -o out.wv --samples 8";
    QTest::newRow("resample, source") << "resample in.wv --samples 8 -o in.wv";
}

void TestCliUsage::keepsExistingFiles()
{
    QFETCH(QString, arguments);
    QVERIFY(store(path("out.wv"), "mine"));
    const CliRun answer = run(arguments);
    QCOMPARE(answer.exitCode, 1);
    QVERIFY(answer.lastLine().startsWith("error: ") && answer.lastLine().contains("--force"));
    QCOMPARE(load(path("out.wv")), "mine");
    QCOMPARE(load(path("in.wv")), wvBytes);
    if (!arguments.endsWith("in.wv")) {
        QCOMPARE(run(arguments + " --force").exitCode, 0);
        QVERIFY(load(path("out.wv")) != "mine");
    }
}

void TestCliUsage::forceOverwritesEvenTheSource()
{
    QCOMPARE(run("level in.wv -o in.wv --force --peak -9 --pkrms 0").exitCode, 0);
    const QByteArray bytes = load(path("in.wv"));
    QVERIFY(bytes.contains("{LEVEL OFFS:9.000000,9.000000}"));
    QCOMPARE(bytes.mid(bytes.indexOf('#')), wvBytes.mid(wvBytes.indexOf('#')));
}

void TestCliUsage::survivesBadStreams_data()
{
    QTest::addColumn<QString>("command");
    QTest::addColumn<int>("exitCode");
    const auto row = [](const char *command, int exitCode) {
        QTest::newRow(command) << QString(command) << exitCode;
    };
    row("\"$CLI\" dump in.wv >/dev/full", 1);
    row("\"$CLI\" dump in.wv >&-", 1);
    row("\"$CLI\" info in.wv >/dev/full", 1);
    row("\"$CLI\" info in.wv >&-", 1);
    row("\"$CLI\" measure in.wv <&- >&-", 1);
    row("\"$CLI\" import wav in.wav --list >&-", 1);
    row("\"$CLI\" --help >/dev/full", 1);
    row("\"$CLI\" level in.wv -o out.wv >&-", 0);
    row("\"$CLI\" level in.wv -o out.wv 2>&-", 0);
    row("\"$CLI\" level in.wv -o out.wv <&- >&- 2>&-", 0);
    row("\"$CLI\" --verbose level in.wv -o out.wv 2>/dev/full", 0);
}

void TestCliUsage::survivesBadStreams()
{
    QFETCH(QString, command);
    QFETCH(int, exitCode);
    const CliRun answer = CliRun::shell(m_folder.path(), command);
    QCOMPARE(answer.exitCode, exitCode);
    if (exitCode == 0) {
        // A closed stream must not have been mixed up with the file.
        QVERIFY(load(path("out.wv")).startsWith("{TYPE: TGX-WV,0}"));
    } else {
        QCOMPARE(answer.lastLine(), "error: Cannot write to standard output.");
    }
}

void TestCliUsage::separatesResultAndLog_data()
{
    QTest::addColumn<QString>("arguments");
    QTest::addColumn<bool>("hasOutput");
    QTest::addColumn<bool>("hasReport"); // lines that are neither log nor progress
    QTest::addColumn<bool>("hasInformation");
    const auto row = [](const char *arguments, bool output, bool report, bool information) {
        QTest::newRow(arguments) << QString(arguments) << output << report << information;
    };
    row("info in.wv", true, false, false);
    row("info in.wv --verbose", true, false, true);
    row("dump in.wv", true, false, false);
    row("--verbose dump in.wv --format cf32", true, false, true);
    row("measure in.wv --json", true, false, false);
    row("level in.wv -o out.wv", false, true, false);
    row("level in.wv -o out.wv --quiet", false, false, false);
    row("level in.wv -o out.wv --quiet --verbose", false, false, true);
    row("import wav in.wav -o out.wv --verbose", false, true, true);
    row("import wav in.wav -o out.wv --quiet", false, false, false);
    row("import wav in.wav --list", true, false, false);
}

void TestCliUsage::separatesResultAndLog()
{
    QFETCH(QString, arguments);
    const CliRun answer = run(arguments);
    QCOMPARE(answer.exitCode, 0);
    QTEST(!answer.output.isEmpty(), "hasOutput");
    const QRegularExpression log("^(error|warning|info|debug): ");
    const qsizetype logged = answer.lines.filter(log).size();
    QTEST(answer.lines.size() > logged, "hasReport");
    QTEST(!answer.lines.filter(QRegularExpression("^info: ")).isEmpty(), "hasInformation");
    // Debug messages come with the same option; a bar and its escapes don't come without terminal.
    QTEST(!answer.lines.filter(QRegularExpression("^debug: ")).isEmpty(), "hasInformation");
    QVERIFY(answer.lines.filter(QRegularExpression("[\\x1b\\r<>]")).isEmpty());
}

void TestCliUsage::takesNamesAndTextsAsTheyAre_data()
{
    QTest::addColumn<QString>("name");
    QTest::addColumn<QString>("comment");
    QTest::addColumn<QByteArray>("written"); // the tag in Latin-1, which is what a file holds
    QTest::addColumn<bool>("warns");
    const auto row = [](const char *title, const char *name, const char *comment,
                        const QByteArray &written, bool warns) {
        QTest::newRow(title) << QString::fromUtf8(name) << QString::fromUtf8(comment) << written
                             << warns;
    };
    row("blanks", "a b  c.wv", "two  blanks", "{COMMENT:two  blanks}", false);
    row("umlauts", "äöü €.wv", "Prüfung",
        "{COMMENT:Pr\xFC"
        "fung}",
        true);
    row("other script", "波形.wv", "波形", "{COMMENT:??}", true);
    row("markup", "<b>&amp;'\".wv", "<b>&amp;'\"", "{COMMENT:<b>&amp;'\"}", false);
    row("braces", "{a}.wv", "a{bc}d{SAMPLES:9}", "{COMMENT:acAMPLES:9}}", true);
    row("like an option", "./-x", "--force", "{COMMENT:--force}", false);
    row("like a command", "info", "info", "{COMMENT:info}", false);
    row("like a list", "[a,b]", "[a,b]", "{COMMENT:[a,b]}", false);
    row("empty text", "e.wv", "", "WV,0}{DATE:", false);
}

void TestCliUsage::takesNamesAndTextsAsTheyAre()
{
    QFETCH(QString, name);
    QFETCH(QString, comment);
    QFETCH(QByteArray, written);
    QFETCH(bool, warns);
    const CliRun copy = run(QStringList{"level", "in.wv", "-o", name, "--comment", comment});
    QCOMPARE(copy.exitCode, 0);
    QVERIFY2(load(path(name)).contains(written), load(path(name)).left(80));
    QVERIFY(copy.lines.contains("File:        " + name));
    QCOMPARE(copy.lines.filter("warning: The comment").size(), warns ? 1 : 0);
    QCOMPARE(run(QStringList{"measure", name}).exitCode, 0);
    QCOMPARE(run(QStringList{"info", name}).exitCode, 0);
    // Whatever the language of the terminal is set to.
    QVERIFY(CliRun::shell(m_folder.path(),
                          "LC_ALL=C \"$CLI\" info '" + QString(name).replace("'", "'\\''") + "'")
                .output.contains(QFileInfo(name).fileName().toUtf8()));
}

void TestCliUsage::interruptCancels_data()
{
    QTest::addColumn<QString>("arguments");
    QTest::addColumn<QString>("sign"); // printed when the long step runs
    QTest::addColumn<qint64>("bytes"); // of samples
    // Sparse files, so long that a step lasts for seconds; saving needs room for the samples.
    constexpr qint64 huge = 2'000'000'000;
    constexpr qint64 large = 400'000'000;
    QTest::newRow("import") << "import wav long.wav -o out.wv"
                            << "Reading WAV-file data" << huge;
    QTest::newRow("level") << "--verbose level long.wv -o out.wv"
                           << "samples @ 16 bit" << huge;
    QTest::newRow("measure") << "--verbose measure long.wv"
                             << "samples @ 16 bit" << huge;
    QTest::newRow("level, saving over the source")
        << "--verbose level long.wv -o long.wv --force --peak 0 --pkrms 0"
        << "Creating waveform file" << large;
}

void TestCliUsage::interruptCancels()
{
    QFETCH(QString, arguments);
    QFETCH(QString, sign);
    QFETCH(qint64, bytes);
    const QByteArray head =
        "{TYPE: TGX-WV,0}{CLOCK:1e6}{WAVEFORM-" + QByteArray::number(bytes + 1) + ": #";
    QVERIFY(store(path("long.wav"), wavFile(formatChunk() + chunk("data", {}, bytes))));
    QVERIFY(store(path("long.wv"), head));
    QVERIFY(QFile::resize(path("long.wav"), bytes + 44));
    QVERIFY(QFile::resize(path("long.wv"), bytes + 1000));
    const QStringList files = QDir(m_folder.path()).entryList(QDir::Files);

    QProcess process;
    process.setWorkingDirectory(m_folder.path());
    process.start(CliRun::program(), arguments.split(' '));
    QByteArray errors;
    const auto read = [&] { return errors += process.readAllStandardError(); };
    QTRY_VERIFY_WITH_TIMEOUT(process.waitForReadyRead(10) || read().contains(sign.toUtf8()), 30000);
    QTRY_VERIFY_WITH_TIMEOUT(read().contains(sign.toUtf8()), 30000);
    QCOMPARE(::kill(static_cast<pid_t>(process.processId()), SIGINT), 0);
    QVERIFY(process.waitForFinished(30000));
    QCOMPARE(process.exitStatus(), QProcess::NormalExit);
    QCOMPARE(process.exitCode(), 130);
    QVERIFY2(read().contains("Action aborted by user."), errors);
    QVERIFY(process.readAllStandardOutput().isEmpty());
    QCOMPARE(QDir(m_folder.path()).entryList(QDir::Files), files);
    QFile source(path("long.wv"));
    QCOMPARE(source.size(), bytes + 1000);
    QVERIFY(source.open(QIODevice::ReadOnly) && source.read(head.size()) == head);
    QVERIFY(QDir(m_temporary.path()).isEmpty(QDir::Files));
}

QTEST_GUILESS_MAIN(TestCliUsage)
#include "tst_cli_usage.moc"
