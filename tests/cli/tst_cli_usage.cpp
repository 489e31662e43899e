// SPDX-License-Identifier: Apache-2.0
#include "CliRun.h"
#include "support/files.h"
#include "support/rows.h"
#include "support/wavbytes.h"
#include "support/wvbytes.h"

#include <QDir>
#include <QRegularExpression>
#include <QTest>

#include <csignal>
#include <unistd.h>

/// How the program is called, and how it answers a call that goes wrong.
class TestCliUsage : public QObject
{
    Q_OBJECT

private slots:
    void initTestCase();
    void init();
    void refusesWrongUsage();
    void takesOptionsAnywhere();
    void helpsOnEachLevel();
    void failsWithItsReason();
    void keepsExistingFiles();
    void forceOverwritesEvenTheSource();
    void survivesBadStreams();
    void separatesResultAndLog();
    void takesNamesAndTextsAsTheyAre();
    void interruptCancels();

private:
    [[nodiscard]] QString path(const QString &name) const { return m_folder.path(name); }

    [[nodiscard]] CliRun run(const QStringList &arguments) const
    {
        return CliRun::in(m_folder.path(), arguments);
    }

    /// Arguments as a user types them, split at blanks.
    [[nodiscard]] CliRun run(const QString &arguments) const
    {
        return run(arguments.split(' ', Qt::SkipEmptyParts));
    }

    TestFolder m_folder;
    TestFolder m_temporary; // for the streams of the runs
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
    QVERIFY(::store(path("in.wv"), wvBytes) && ::store(path("in.wav"), wavBytes));
    QVERIFY(::store(path("cut.wv"), wvBytes.chopped(2)) &&
            ::store(path("cut.wav"), wavBytes.chopped(1)));
    QVERIFY(::store(path("empty"), {}));
}

void TestCliUsage::refusesWrongUsage()
{
    // The whole last line, as a regular expression behind "error: ".
    const QList<std::pair<const char *, const char *>> uses{
        {"", ".*[Ss]ubcommand.*"},
        {"import unheard", ".*'unheard'.*"},
        {"level in.wv -o out.wv --unheard", ".*'--unheard'.*"},
        {"level in.wv in.wv -o out.wv", ".*in\\.wv.*"},
        {"level in.wv -o out.wv --peak 1 --peak 2", ".*--peak.*"},
        {"level in.wv -o out.wv --peak abc", "--peak: 'abc' is not a number; .*-50 dB to 50 dB"},
        {"level in.wv -o out.wv --peak nan", "--peak: 'nan' is not a number; .*"},
        {"level in.wv -o out.wv --peak 50.001",
         "--peak: '50.001' is out of range; .*-50 dB to 50 dB"},
        {"import wav in.wav -o out.wv --scaling up",
         "--scaling: 'up' is unknown; permitted: none, down, auto"},
        {"dump in.wv -o out --from 1.5", "--from: '1.5' is not a whole number; .*"},
        {"dump in.wv -o out --count 5", "--count: 5 leads outside the file; permitted: 1 to 4"},
        {"plot in.wv -o out.bmp", "--output: 'out.bmp' has no suffix of a picture; .*"},
        {"measure in.wv --limit foo<3", "--limit: 'foo<3' is no limit; permitted: .*"},
        {"plot in.wv -o out --view x", "--view: 'x' is unknown; permitted: iq, .*, overview"},
        {"plot in.wv -o out --size 63x64", "--size: 63x64 is not permitted; permitted: 64x64 .*"},
        {"create noise -o out --seed -1",
         "--seed: '-1' is out of range; permitted: 0 to 4294967295"},
        {"resample in.wv -o out", ".*--clock and --samples.*"},
        {"measure in.wv --from 4", "--from: 4 lies outside the file; permitted: 0 to 3"}};
    for (const auto &[arguments, reason] : uses) {
        const CliRun answer = run(QString(arguments));
        QVERIFY2(answer.exitCode == 2, arguments);
        const QRegularExpression expected("^error: " + QString(reason) + '$');
        QVERIFY2(expected.match(answer.lastLine()).hasMatch(), qPrintable(answer.lastLine()));
        QVERIFY2(answer.output.isEmpty(), arguments);
    }
    QCOMPARE(m_folder.entries(), m_inputs);
}

void TestCliUsage::takesOptionsAnywhere()
{
    for (const char *arguments :
         {"--quiet level -o out.wv --peak=-3 in.wv --force",
          "--quiet --no-progress level --force --output=out.wv in.wv --peak -3dB",
          "level --quiet -oout.wv --force --peak -3 -- in.wv"}) {
        const CliRun answer = run(QString(arguments));
        QVERIFY2(answer.exitCode == 0 && answer.lines.isEmpty(), arguments);
        QVERIFY2(m_folder.load("out.wv").contains(",3.000000}"), arguments);
        QVERIFY(m_folder.store("out.wv", {}));
    }
}

void TestCliUsage::helpsOnEachLevel()
{
    forRows({{"program", "--help", QStringList{"info", "--no-progress", "--version"}},
             {"version", "--version", QStringList{"corvane-cli "}},
             {"command", "import wav --help", QStringList{"--clock", "none|down|auto", "--force"}}},
            [&](const QString &arguments, const QStringList &expected) {
                const CliRun answer = run(arguments);
                QCOMPARE(answer.exitCode, 0);
                QVERIFY(answer.lines.isEmpty());
                for (const QString &word : expected) {
                    QVERIFY2(answer.output.contains(word.toUtf8()), qPrintable(word));
                }
            });
}

void TestCliUsage::failsWithItsReason()
{
    const QList<std::pair<const char *, const char *>> uses{
        {"info missing.wv", "error: missing.wv: File does not exist."},
        {"info folder", "error: folder: This is no waveform file: it is a folder."},
        {"dump /dev/zero", "error: Cannot open waveform input file."},
        {"dump cut.wv -o out", "error: Cannot read enough data from xWAVEFORM tag!"},
        {"level in.wv -o missing/out",
         "error: Error opening output file 'missing/out': No such file or directory"},
        {"level in.wv -o folder --force", "error: The output file 'folder' is a folder."},
        {"level in.wv -o /dev/full --force",
         "error: Error writing output file: No space left on device"},
        {"dump in.wv -o /dev/full --force",
         "error: Cannot write '/dev/full': No space left on device"},
        {"import wav empty -o out", "error: This is not a valid RIFF waveform file."},
        {"import wav cut.wav -o out", "error: Cannot read data from .wav file."}};
    for (const auto &[arguments, reason] : uses) {
        const CliRun answer = run(QString(arguments));
        QVERIFY2(answer.exitCode == 1 && answer.output.isEmpty(), arguments);
        QCOMPARE(answer.lastLine(), QString(reason));
    }
    QCOMPARE(m_folder.entries(), m_inputs);
}

void TestCliUsage::keepsExistingFiles()
{
    for (const char *arguments :
         {"level in.wv -o out.wv", "import wav in.wav -o out.wv", "dump in.wv -o out.wv",
          "plot in.wv -o out.png", "create pm -o out.wv", "resample in.wv --samples 8 -o in.wv"}) {
        for (const char *name : {"out.wv", "out.png"}) {
            QVERIFY(m_folder.store(name, "mine"));
        }
        const CliRun answer = run(QString(arguments));
        QVERIFY2(answer.exitCode == 1 && answer.lastLine().contains("--force"), arguments);
        QCOMPARE(m_folder.load("out.wv") + m_folder.load("out.png"), "minemine");
        QVERIFY2(m_folder.load("in.wv") == wvBytes, arguments);
    }
}

void TestCliUsage::forceOverwritesEvenTheSource()
{
    QCOMPARE(run("level in.wv -o in.wv --force --peak -9 --pkrms 0").exitCode, 0);
    const QByteArray bytes = m_folder.load("in.wv");
    QVERIFY(bytes.contains("{LEVEL OFFS:9.000000,9.000000}"));
    QCOMPARE(bytes.mid(bytes.indexOf('#')), wvBytes.mid(wvBytes.indexOf('#')));
}

void TestCliUsage::survivesBadStreams()
{
    forRows({{"full", "dump in.wv >/dev/full", 1},
             {"closed", "info in.wv >&-", 1},
             {"no input either", "measure in.wv <&- >&-", 1},
             {"help", "--help >/dev/full", 1},
             {"no output", "level in.wv -o out.wv --force >&-", 0},
             {"none at all", "level in.wv -o out.wv --force <&- >&- 2>&-", 0},
             {"full log", "--verbose level in.wv -o out.wv --force 2>/dev/full", 0}},
            [&](const QString &command, int exitCode) {
                const CliRun answer = CliRun::shell(m_folder.path(), "\"$CLI\" " + command);
                QCOMPARE(answer.exitCode, exitCode);
                if (exitCode == 0) {
                    // A closed stream must not have been mixed up with the file.
                    QVERIFY(m_folder.load("out.wv").startsWith("{TYPE: TGX-WV,0}"));
                } else {
                    QCOMPARE(answer.lastLine(), "error: Cannot write to standard output.");
                }
            });
}

void TestCliUsage::separatesResultAndLog()
{
    // Result on standard output; on standard error report lines and, when asked for, information.
    forRows({{"result", "info in.wv", true, false, false},
             {"result, verbose", "--verbose dump in.wv --format cf32", true, false, true},
             {"report", "level in.wv -o out.wv --force", false, true, false},
             {"quiet", "level in.wv -o out.wv --force --quiet", false, false, false},
             {"quiet and verbose", "level in.wv -o out.wv --force --quiet --verbose", false, false,
              true}},
            [&](const QString &arguments, bool output, bool report, bool information) {
                const CliRun answer = run(arguments);
                QCOMPARE(answer.exitCode, 0);
                QCOMPARE(!answer.output.isEmpty(), output);
                const auto count = [&](const char *pattern) {
                    return answer.lines.filter(QRegularExpression(pattern)).size();
                };
                QCOMPARE(answer.lines.size() > count("^(error|warning|info|debug): "), report);
                QCOMPARE(count("^info: ") > 0, information);
                QCOMPARE(count("^debug: ") > 0, information);
                // A bar and its escapes don't come without a terminal.
                QCOMPARE(count("[\\x1b\\r<>]"), 0);
            });
}

void TestCliUsage::takesNamesAndTextsAsTheyAre()
{
    const auto check = [&](const char *nameText, const char *commentText, const QByteArray &written,
                           int warnings) {
        const QString name = QString::fromUtf8(nameText);
        const CliRun copy = run(
            QStringList{"level", "in.wv", "-o", name, "--comment", QString::fromUtf8(commentText)});
        QCOMPARE(copy.exitCode, 0);
        QCOMPARE(tag(m_folder.load(name), "COMMENT"), written);
        QVERIFY(copy.lines.contains("File:        " + name));
        QCOMPARE(copy.lines.filter("warning: The comment").size(), warnings);
        QCOMPARE(run(QStringList{"measure", name}).exitCode, 0);
        // Whatever the language of the terminal is set to.
        const QString quoted = "'" + QString(name).replace("'", "'\\''") + "'";
        QVERIFY(CliRun::shell(m_folder.path(), "LC_ALL=C \"$CLI\" info " + quoted)
                    .output.contains(QFileInfo(name).fileName().toUtf8()));
    };
    forRows({{"blanks", "a b  c.wv", "two  blanks", "two  blanks", 0},
             // A tag holds Latin-1.
             {"other scripts", "波形 ü.wv", "Prüfung",
              QByteArray("Pr\xFC"
                         "fung"),
              1},
             {"markup", "<b>&amp;'\".wv", "<b>&amp;'\"", "<b>&amp;'\"", 0},
             {"like an option", "./-x", "--force", "--force", 0},
             {"like a command", "plot", "plot", "plot", 0},
             {"like a list", "[a,b]", "[a,b]", "[a,b]", 0}},
            check);
}

void TestCliUsage::interruptCancels()
{
    // Sparse files, so long that a step lasts for seconds; saving needs room for the samples.
    constexpr qint64 huge = 2'000'000'000;
    constexpr qint64 large = 400'000'000;
    const auto check = [&](const QString &arguments, const QByteArray &sign, qint64 bytes) {
        const QByteArray head =
            "{TYPE: TGX-WV,0}{CLOCK:1e6}{WAVEFORM-" + QByteArray::number(bytes + 1) + ": #";
        QVERIFY(m_folder.store("long.wav", wavFile(formatChunk() + chunk("data", {}, bytes))));
        QVERIFY(m_folder.store("long.wv", head));
        QVERIFY(QFile::resize(path("long.wav"), bytes + 44));
        QVERIFY(QFile::resize(path("long.wv"), bytes + 1000));
        const QStringList files = m_folder.entries();

        QProcess process;
        process.setWorkingDirectory(m_folder.path());
        process.start(CliRun::program(), arguments.split(' '));
        QByteArray errors;
        const auto read = [&] { return errors += process.readAllStandardError(); };
        QTRY_VERIFY_WITH_TIMEOUT(process.waitForReadyRead(10) || read().contains(sign), 30000);
        QTRY_VERIFY_WITH_TIMEOUT(read().contains(sign), 30000);
        QCOMPARE(::kill(static_cast<pid_t>(process.processId()), SIGINT), 0);
        QVERIFY(process.waitForFinished(30000));
        QCOMPARE(process.exitStatus(), QProcess::NormalExit);
        QCOMPARE(process.exitCode(), 130);
        QVERIFY2(read().contains("Action aborted by user."), errors);
        QCOMPARE(m_folder.entries(), files);
        QFile source(path("long.wv"));
        QCOMPARE(source.size(), bytes + 1000);
        QVERIFY(source.open(QIODevice::ReadOnly) && source.read(head.size()) == head);
        QVERIFY(QDir(m_temporary.path()).isEmpty(QDir::Files));
    };
    forRows(
        {{"import", "import wav long.wav -o out.wv", "Reading WAV-file data", huge},
         {"saving over the source", "--verbose level long.wv -o long.wv --force --peak 0 --pkrms 0",
          "Creating waveform file", large}},
        check);
}

QTEST_GUILESS_MAIN(TestCliUsage)
#include "tst_cli_usage.moc"
