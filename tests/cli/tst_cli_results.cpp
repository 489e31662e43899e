// SPDX-License-Identifier: Apache-2.0
#include "CliRun.h"
#include "support/files.h"
#include "support/rows.h"
#include "support/wavbytes.h"
#include "support/wvbytes.h"

#include <QDir>
#include <QJsonArray>
#include <QJsonDocument>
#include <QJsonObject>
#include <QStandardPaths>
#include <QTest>

#include <cmath>
#include <cstdlib>

/// What the commands print and write, against decoders of the test's own and against sox.
class TestCliResults : public QObject
{
    Q_OBJECT

private slots:
    void initTestCase();
    void dumpsEachForm();
    void dumpsRanges();
    void dumpsMarkers();
    void infoListsFiles();
    void infoShowsTheRest();
    void infoChecksSamples();
    void measuresSamples();
    void cropsPieces();
    void exportsAndTakesBack();
    void refusesBadSigmf();
    void keepsPresets();
    void carriesSoundThrough();

private:
    [[nodiscard]] QString path(const QString &name) const { return m_folder.path(name); }

    [[nodiscard]] CliRun run(const QString &arguments) const
    {
        return CliRun::in(m_folder.path(), arguments.split(' ', Qt::SkipEmptyParts));
    }

    TestFolder m_folder;
};

namespace {

/// Words whose values need all digits, exponents and both signs.
const QList<int> testWords{0,     1,      -1,    2,     -2,   32767, -32767, 12345, -12345,
                           16384, -16384, 10000, -9999, 3277, 33,    -327,   7,     -32766};
const QByteArray kindA = "{TYPE: TGX-WV,0}";

/// The value of a word in the common coding, in the single precision of the streams.
float valueOf(int word)
{
    return (static_cast<float>(word) - 0.5F) / 32767.0F;
}

QJsonDocument json(const CliRun &answer)
{
    QJsonParseError error{};
    const QJsonDocument document = QJsonDocument::fromJson(answer.output, &error);
    return error.error == QJsonParseError::NoError ? document : QJsonDocument();
}

} // namespace

void TestCliResults::initTestCase()
{
    QVERIFY2(QFile::exists(CliRun::program()), "CORVANE_BIN must name the folder of corvane-cli");
}

void TestCliResults::dumpsEachForm()
{
    QByteArray csv = "sample,i,q,markers\n";
    QByteArray floats;
    for (qsizetype i = 0; i < testWords.size(); i += 2) {
        const float inPhase = valueOf(testWords.at(i));
        const float quadrature = valueOf(testWords.at(i + 1));
        std::array<char, 100> line{};
        std::snprintf(line.data(), line.size(), "%d,%.9g,%.9g,0\n", static_cast<int>(i / 2),
                      static_cast<double>(inPhase), static_cast<double>(quadrature));
        csv += line.data();
        floats += littleEndian(inPhase) + littleEndian(quadrature);
    }
    QVERIFY(m_folder.store("in.wv", wvFile(kindA, words(testWords))));
    forRows({{"default", "", csv},
             {"cf32", "--format cf32", floats},
             {"ci16", "--format ci16", words(testWords)}},
            [&](const QString &format, const QByteArray &expected) {
                const CliRun answer = run("dump in.wv " + format);
                QCOMPARE(answer.exitCode, 0);
                QCOMPARE(answer.output, expected);
                QCOMPARE(run("dump in.wv --force -o dumped " + format).exitCode, 0);
                QCOMPARE(m_folder.load("dumped"), expected);
            });
}

void TestCliResults::dumpsRanges()
{
    QByteArray samples;
    for (int i = 0; i < 140000; ++i) {
        samples += littleEndian(static_cast<qint16>((i * 7919) % 32767));
    }
    QVERIFY(m_folder.store("in.wv", wvFile(kindA, samples)));
    // Blocks of the dump hold 16384 samples, those of the reader 65536.
    forRows({{"all", "", 0, 70000},
             {"both", "--from 16383 --count 49155", 16383, 49155},
             {"prefix", "--from 65.5k --count 3", 65500, 3}},
            [&](const QString &range, int begin, int count) {
                QVERIFY(run("dump in.wv --format ci16 " + range).output ==
                        samples.mid(4 * begin, 4 * count));
                const QList<QByteArray> lines = run("dump in.wv " + range).output.split('\n');
                QCOMPARE(lines.size(), count + 2); // the header and the end of the last line
                QVERIFY(lines.at(1).startsWith(QByteArray::number(begin) + ','));
                QVERIFY(lines.at(count).startsWith(QByteArray::number(begin + count - 1) + ','));
            });
}

void TestCliResults::dumpsMarkers()
{
    // The lists cover seven of eight samples: the trace goes on with its last byte.
    const QByteArray lists =
        "{CONTROL LENGTH:7}{MARKER LIST 1: 0:1;2:0}{MARKER LIST 2: 0:0;1:1;5:0}"
        "{MARKER LIST 3: 0:0}{MARKER LIST 4: 0:0;6:1}";
    QVERIFY(m_folder.store("in.wv", wvFile(kindA + lists, QByteArray(32, '\0'))));
    const QList<QByteArray> lines = run("dump in.wv").output.split('\n');
    QList<QByteArray> markers;
    for (int i = 1; i <= 8; ++i) {
        markers << lines.value(i).split(',').value(3);
    }
    QCOMPARE(markers, (QList<QByteArray>{"1", "3", "2", "2", "2", "0", "8", "8"}));
}

void TestCliResults::infoListsFiles()
{
    const QByteArray tags = "{TYPE: TVX-WV,77}{COMMENT:say \"hi\" \\}{COPYRIGHT:me}"
                            "{DATE:2011-04-18;09:30:00}{CLOCK:2000000}{LEVEL OFFS:6.5,1.25}"
                            "{SAMPLES:4}{MARKER LIST 1: 0:1}";
    QVERIFY(m_folder.store("a b.wv", wvFile(tags, QByteArray(16, '\0'))));
    const CliRun answer = CliRun::in(m_folder.path(), {"info", "--json", path("a b.wv")});
    QCOMPARE(answer.exitCode, 0);
    QVERIFY(json(answer).isArray());
    QJsonObject object = json(answer).array().first().toObject();
    const QString today = QFileInfo(path("a b.wv")).lastModified().toString("yyyy-MM-dd");
    const QJsonObject expected{{"fileName", "a b.wv"},
                               {"fileSize", qint64(QFileInfo(path("a b.wv")).size())},
                               {"created", today},
                               {"type", "TVX Waveform File"},
                               {"comment", "say \"hi\" \\"},
                               {"copyright", "me"},
                               {"date", "2011-04-18;09:30:00"},
                               {"samples", 4},
                               {"clock", 2e6},
                               {"playTime", 2e-6},
                               {"levelsValid", true},
                               {"peakOffset", 1.25},
                               {"rmsOffset", 6.5},
                               {"hasChecksum", true},
                               {"hasMarkers", true},
                               {"missingSamples", 0},
                               {"segmentCount", 0},
                               {"segments", QJsonArray()}};
    QCOMPARE(object, expected);
}

void TestCliResults::infoShowsTheRest()
{
    QVERIFY(m_folder.store("1.wv", wvFile(kindA + "{CLOCK:1}", QByteArray(4, '\0'))));
    QVERIFY(m_folder.store("2.wv", "{TYPE: NONE,0}"));
    QVERIFY(m_folder.store("3.wv", "{TYPE: TGX-WV,0}"));
    const CliRun listed = run("info 1.wv 2.wv missing.wv 3.wv --json");
    QCOMPARE(listed.exitCode, 1);
    const QJsonArray objects = json(listed).array();
    QCOMPARE(objects.size(), 2);
    QCOMPARE(objects.at(0).toObject().value("fileName"), "1.wv");
    QCOMPARE(objects.at(1).toObject().value("fileName"), "3.wv");
    // What no tag states is unknown.
    for (const char *unknown : {"samples", "clock", "playTime", "peakOffset", "rmsOffset"}) {
        QVERIFY(objects.at(1).toObject().value(QLatin1String(unknown)).isNull());
    }
    QCOMPARE(objects.at(1).toObject().value("levelsValid"), false);
    QVERIFY(listed.lines.contains("error: 2.wv: Invalid file format in TYPE tag."));
    QCOMPARE(listed.lastLine(), "error: missing.wv: File does not exist.");
    const QByteArray text = run("info missing.wv 1.wv 3.wv").output;
    QCOMPARE(text.count("File: "), 2);
    QVERIFY(text.indexOf("1.wv") < text.indexOf("3.wv"));
    QVERIFY(text.contains("the file is cut off: all are missing"));
    QCOMPARE(json(run("info missing.wv --json")).array().size(), 0);
    QVERIFY(m_folder.store("wave", wavFile(formatChunk() + chunk("data", words({1, 2})))));
    QVERIFY(m_folder.store("nothing", {}));
    QVERIFY(m_folder.store("words", "Some text.\n"));
    QVERIFY(m_folder.store("half", "{TYPE: TGX-WV,0}{MARKER LIST 1: 0:1;12"));
    forRows({{"wave", "wave", "This is no waveform file: it is a WAV sound file."},
             {"nothing", "nothing", "This is no waveform file: it is empty."},
             {"words", "words", "This is no waveform file: it is text."},
             {"half", "half", "The file is cut off within its tags."}},
            [&](const QString &name, const QString &reason) {
                const CliRun answer = run("info " + name);
                QCOMPARE(answer.exitCode, 1);
                QCOMPARE(answer.lastLine(), "error: " + name + ": " + reason);
            });
}

void TestCliResults::infoChecksSamples()
{
    const auto check = [&](const QByteArray &file) {
        [&] { QVERIFY(m_folder.store("in.wv", file)); }();
        return json(run("info --check --json in.wv"))
            .array()
            .first()
            .toObject()["check"]
            .toObject();
    };
    // A turn has 1000 samples: the tone ends 3249 steps of 0.36 degrees after its start.
    const QJsonObject open = check(toneFile(3250));
    QCOMPARE(open.value("complete"), true);
    QCOMPARE(open.value("loopContinuous"), false);
    QVERIFY(std::fabs(open.value("loopPhaseStep").toDouble() - (3 * 360 - 3249 * 0.36)) < 0.01);
    QVERIFY(std::fabs(open.value("loopMagnitudeStep").toDouble()) < 0.001);
    QVERIFY(std::fabs(open.value("peakOffset").toDouble() - 6.02) < 0.01);
    QVERIFY(std::fabs(open.value("crest").toDouble()) < 0.001);
    QCOMPARE(open.value("clipped"), 0);
    QCOMPARE(check(toneFile(3000)).value("loopContinuous"), true);

    const QJsonObject cut =
        check(wvFile(kindA, words({32767, -32767, 32766, -32766, 0, -32768})).chopped(1 + 4));
    QCOMPARE(cut.value("complete"), false);
    QCOMPARE(cut.value("clipped"), 2);
    const QJsonObject none = check(wvFile(kindA, words({1, 2})).chopped(1 + 4));
    QCOMPARE(none.value("complete"), false);
    QVERIFY(none.value("crest").isNull());
}

void TestCliResults::measuresSamples()
{
    QVERIFY(m_folder.store("in.wv", wvFile(kindA, words({0x4000, 0, 0, 0, 0, 0, 0, -100}))));
    const CliRun answer = run("measure in.wv --json");
    QCOMPARE(answer.exitCode, 0);
    const QJsonObject levels = json(answer).object();
    QCOMPARE(levels.keys(), (QStringList{"ccdf", "crest", "dcI", "dcQ", "obw99", "obwCentre",
                                         "peakOffset", "rmsOffset", "samples"}));
    QCOMPARE(levels.value("samples"), 4);
    QCOMPARE(levels.value("crest").toDouble(),
             levels.value("rmsOffset").toDouble() - levels.value("peakOffset").toDouble());
    // Equal magnitudes have no crest, and no sign to it.
    QCOMPARE(run("measure in.wv --from 1 --count 2").output.split('\n').value(3),
             "Peak / RMS:  0.000000 dB");
}

void TestCliResults::cropsPieces()
{
    const QByteArray file = toneFile(3000).replace("{CLOCK:", "{MORE: kept}{CLOCK:");
    QVERIFY(m_folder.store("in.wv", file));
    const CliRun answer = run("crop in.wv -o out.wv --from 1400 --count 250 --force");
    QCOMPARE(answer.exitCode, 0);
    QCOMPARE(answer.lastLine(), "Piece saved");
    const QByteArray piece = m_folder.load("out.wv");
    QCOMPARE(sampleWords(piece), sampleWords(file).mid(4 * 1400, 4 * 250));
    QCOMPARE(tag(piece, "MARKER LIST 1"), " 0:1;100:0"); // high in the first half of the source
    QCOMPARE(tag(piece, "MORE"), " kept");
    QCOMPARE(tag(piece, "CLOCK"), "1000000.000000");
    QVERIFY(answer.lines.join('\n').contains("warning: Loop point: step of "));
    QCOMPARE(run("crop in.wv -o other.wv --from 3000").exitCode, 2);
    QCOMPARE(run("crop in.wv -o out.wv").exitCode, 1);
}

void TestCliResults::exportsAndTakesBack()
{
    // All words that the writer makes come back, and so do markers and texts.
    QList<int> sampleValues;
    for (int word = -32767; word <= 32767; word += 7) {
        sampleValues << word << -word;
    }
    const QByteArray tags = kindA +
                            "{COMMENT:say \"hi\" \\}{COPYRIGHT:me}{CLOCK:1234567.25}{MORE: kept}"
                            "{CONTROL LENGTH:9363}{MARKER LIST 1: 0:1;1:0;9362:1}"
                            "{MARKER LIST 2: 0:0;7:1;5000:0}{MARKER LIST 3: 0:0}"
                            "{MARKER LIST 4: 0:1}";
    QVERIFY(m_folder.store("in.wv", wvFile(tags, words(sampleValues))));
    const QByteArray samples = run("dump in.wv").output;
    const QByteArray floats = run("dump in.wv --format cf32").output;
    forRows({{"s16", "", ".sigmf-meta"}, {"f32", "--type f32", ".sigmf-data"}},
            [&](const QString &type, const QString &suffix) {
                QCOMPARE(run("export in.wv -o out.sigmf-meta --force " + type).exitCode, 0);
                QCOMPARE(run("import sigmf out" + suffix + " -o back.wv --force").exitCode, 0);
                QVERIFY(run("dump back.wv").output == samples);
                const QByteArray back = m_folder.load("back.wv");
                QCOMPARE(tag(back, "CLOCK"), "1234567.250000");
                QCOMPARE(tag(back, "COMMENT"), "say \"hi\" \\");
                QCOMPARE(tag(back, "COPYRIGHT"), "me");
                QCOMPARE(tag(back, "MORE"), " kept");
            });
    const QJsonArray annotations =
        QJsonDocument::fromJson(m_folder.load("out.sigmf-meta")).object()["annotations"].toArray();
    QCOMPARE(annotations.size(), 4);
    QCOMPARE(
        annotations.at(1).toObject(),
        (QJsonObject{{"core:sample_start", 0}, {"core:sample_count", 9363}, {"core:label", "M4"}}));
    QVERIFY(m_folder.load("out.sigmf-data") == floats);

    const CliRun wav = run("export in.wv -o out.wav --from 100 --count 50");
    QCOMPARE(wav.exitCode, 0);
    QVERIFY(wav.lines.contains("warning: The clock of 1234567.25 Hz was rounded to 1234567 Hz: a "
                               "WAV file has whole sample rates."));
    QCOMPARE(m_folder.load("out.wav"), wavFile(formatChunk(1, 2, 1234567) +
                                               chunk("data", words(sampleValues).mid(400, 200))));
    QCOMPARE(run("export in.wv -o out.mat").exitCode, 0);
    QCOMPARE(run("import mat out.mat -o back.wv --clock 1M --scaling none --force").exitCode, 0);
    QVERIFY(run("dump back.wv --format cf32").output == floats);
    forRows({{"suffix", "out.txt", "'out.txt' doesn't tell the format"},
             {"type", "out.csv --type f32", "The type f32 isn't one of .csv files"}},
            [&](const QString &arguments, const QString &reason) {
                const CliRun answer = run("export in.wv -o " + arguments);
                QCOMPARE(answer.exitCode, 2);
                QVERIFY2(answer.lastLine().contains(reason), qPrintable(answer.lastLine()));
            });
}

void TestCliResults::refusesBadSigmf()
{
    const auto import = [&](const QByteArray &meta, const QByteArray &data) {
        [&] {
            QVERIFY(m_folder.store("bad.sigmf-meta", meta));
            QVERIFY(m_folder.store("bad.sigmf-data", data));
        }();
        return run("import sigmf bad.sigmf-meta -o bad.wv --force");
    };
    const QByteArray global = "{\"global\": {\"core:sample_rate\": 1e6, \"core:datatype\": ";
    forRows({{"no JSON", "{", "The SigMF metadata are no JSON"},
             {"type", global + "\"cf16_le\"}}", "The SigMF datatype 'cf16_le' is unknown"},
             {"header", global + "\"ci16_le\"}, \"captures\": [{\"core:header_bytes\": 9}]}",
              "The SigMF data are shorter than the headers"},
             {"start", global + "\"ci16_le\"}, \"captures\": [{\"core:sample_start\": -1}]}",
              "no whole number from 0 in core:sample_start: -1"},
             {"channels", global + "\"ci16_le\", \"core:num_channels\": 1e9}}",
              "no whole number from 0 in core:num_channels"}},
            [&](const QByteArray &meta, const QString &reason) {
                const CliRun answer = import(meta, QByteArray(8, '\1'));
                QCOMPARE(answer.exitCode, 1);
                QVERIFY2(answer.lastLine().contains(reason), qPrintable(answer.lastLine()));
            });
    // Annotations may lie anywhere; they are held to the samples.
    const QByteArray marks = ", \"annotations\": [{\"core:label\": \"M2\", "
                             "\"core:sample_start\": 1, \"core:sample_count\": 9000000000000}, "
                             "{\"core:label\": \"M1\", \"core:sample_start\": 4e15}]}";
    QCOMPARE(import(global + "\"ri8\"}" + marks, QByteArray::fromHex("00408100")).exitCode, 0);
    const QList<QByteArray> lines = run("dump bad.wv").output.split('\n');
    QCOMPARE(lines.value(1), "0,-1.52592547e-05,-1.52592547e-05,0");
    QCOMPARE(lines.value(2), "1,0.5,-1.52592547e-05,2");
    QVERIFY(m_folder.store("bad.sigmf", QByteArray(700, 'x')));
    QVERIFY(run("import sigmf bad.sigmf -o bad.wv --force").lastLine().contains("is damaged"));
}

void TestCliResults::keepsPresets()
{
    const auto content = [&] { return sampleWords(m_folder.load("out.wv")); };
    QCOMPARE(run("create fm --tones 2 --freq 2k --dev 75k --save-preset fm.ini -o out.wv --force")
                 .exitCode,
             0);
    const QByteArray made = content();
    QCOMPARE(m_folder.load("fm.ini"), "[WvCreate]\nfm.dev=75000\nfm.modf=2000\nver=1\nwv.main=3\n"
                                      "wv.sub=1\n");
    QCOMPARE(run("create fm --preset fm.ini -o out.wv --force").exitCode, 0);
    QVERIFY(content() == made);
    // What is given wins.
    QCOMPARE(run("create fm --dev 10k --tones 2 --freq 2k -o out.wv --force").exitCode, 0);
    const QByteArray other = content();
    QCOMPARE(run("create fm --preset fm.ini --dev 10k -o out.wv --force").exitCode, 0);
    QVERIFY(content() == other && other != made);

    QVERIFY(m_folder.store("in.wv", toneFile(3000)));
    QVERIFY(m_folder.store("bad.ini", "[Filter]\nfilterlength=1e9\n"));
    forRows({{"range", "bad.ini", "error: --length: '1000000000' is out of range; permitted: "},
             {"missing", "none.ini", "error: --preset: the file 'none.ini' cannot be read"}},
            [&](const QString &preset, const QString &reason) {
                const CliRun answer = run("filter in.wv -o new.wv --preset " + preset);
                QCOMPARE(answer.exitCode, 2);
                QVERIFY2(answer.lastLine().startsWith(reason), qPrintable(answer.lastLine()));
            });
}

void TestCliResults::carriesSoundThrough()
{
    if (QStandardPaths::findExecutable("sox").isEmpty()) {
        QSKIP("sox, which makes the files, is not installed");
    }
    const auto sox = [&](const QString &arguments) {
        return CliRun::of(m_folder.path(), "sox", arguments.split(' ', Qt::SkipEmptyParts));
    };
    // Noise on one channel, and a tone of its own on the other.
    const QString making = "synth 0.5 whitenoise sine 997 vol 0.7";
    QCOMPARE(sox("-D -R -n -r 96000 -b 16 -c 2 in.wav " + making).exitCode, 0);
    QCOMPARE(sox("in.wav -t raw -e signed-integer -b 16 original.raw").exitCode, 0);
    QCOMPARE(json(run("import wav in.wav --list --json")).object(),
             (QJsonObject{{"sampleRate", 96000},
                          {"samples", 48000},
                          {"playTime", 0.5},
                          {"channels", 2},
                          {"bits", 16},
                          {"float", false}}));
    const CliRun imported = run("import wav in.wav -o out.wv --scaling none --force");
    QCOMPARE(imported.exitCode, 0);
    QCOMPARE(imported.lastLine(), "Import completed");
    QCOMPARE(run("dump out.wv --format ci16 -o dumped.raw --force").exitCode, 0);

    // A word w is w / 32768 on the way, which becomes trunc(w / 32768 * 32767 + 0.5), each step of
    // it in single precision.
    const QByteArray original = m_folder.load("original.raw");
    QCOMPARE(original.size(), 4 * 48000);
    QByteArray expected;
    for (qsizetype i = 0; i < original.size(); i += 2) {
        const float value = qFromLittleEndian<qint16>(original.constData() + i) / 32768.0F;
        const float scaled = value * 32767.0F + 0.5F;
        expected += littleEndian(static_cast<qint16>(scaled));
    }
    QVERIFY(m_folder.load("dumped.raw") == expected);

    // Heard by sox, the result is the source but for the steps of 16 bits.
    QCOMPARE(sox("-t raw -r 96000 -e signed-integer -b 16 -c 2 dumped.raw out.wav").exitCode, 0);
    const CliRun difference = sox("-m -v 1 in.wav -v -1 out.wav -n stat");
    const QString peak = difference.lines.filter("Maximum amplitude").value(0).section(':', 1);
    QVERIFY2(!peak.isEmpty() && peak.toDouble() < 2.0 / 32768, qPrintable(peak));
    QJsonObject measured = json(run("measure out.wv --json")).object();
    QCOMPARE(measured.value("samples"), 48000);
    const QJsonObject info = json(run("info out.wv --json")).array().first().toObject();
    QCOMPARE(info.value("clock"), 96000);
    // The offsets of the tag were measured before the coding, so they agree to its resolution.
    QVERIFY(std::fabs(info.value("peakOffset").toDouble() -
                      measured.value("peakOffset").toDouble()) < 0.002);
    QVERIFY(std::fabs(info.value("rmsOffset").toDouble() - measured.value("rmsOffset").toDouble()) <
            0.002);
}

QTEST_GUILESS_MAIN(TestCliResults)
#include "tst_cli_results.moc"
