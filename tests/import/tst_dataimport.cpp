// SPDX-License-Identifier: Apache-2.0
#include "import/DataFileAccess.h"
#include "import/dataguess.h"
#include "import/datavalues.h"
#include "importsupport.h"
#include "support/files.h"
#include "support/logreader.h"
#include "support/rows.h"
#include "support/wvbytes.h"

#include <QTest>

#include <cmath>

namespace {

constexpr auto Integer = DataFormat::Integer;
constexpr auto Rational = DataFormat::Rational;
constexpr auto Hex = DataFormat::Hexadecimal;
constexpr auto Bits8 = DataPrecision::Bits8;
constexpr auto Bits14 = DataPrecision::Bits14;
constexpr auto Bits16 = DataPrecision::Bits16;
constexpr auto Bits32 = DataPrecision::Bits32;
constexpr auto Bits64 = DataPrecision::Bits64;

} // namespace

class TestDataImport : public QObject
{
    Q_OBJECT

private slots:
    void init() { static_cast<void>(takeLog()); }
    void convertsTextByTheTable();
    void convertsBytesByTheTable();
    void refusesLines();
    void readsLines();
    void takesTags();
    void joinsTwoFiles();
    void readsBinaryFiles();
    void scales();
    void readsTextOfNumpy();
    void guessesTypeAndPartner();
    void keepsPresets();

private:
    struct Outcome
    {
        std::vector<float> values;
        QString error; ///< the first one
        WvWriteJob record;
    };

    [[nodiscard]] Outcome import(const WvImportJob &job, qint64 limit = 0)
    {
        Outcome outcome;
        TempStream stream;
        if (stream.open() && m_reader.importData(job, &outcome.record, stream.stream(), limit)) {
            outcome.values = floatsOf(stream);
        }
        outcome.error = takeMessages(Tracer::Error).value(0);
        return outcome;
    }

    /// A job on files with these contents; the second one is used if it isn't null.
    [[nodiscard]] WvImportJob jobFor(const QByteArray &first, const QByteArray &second = {},
                                     bool binary = false)
    {
        const bool stored = m_folder.store("i.dat", first) && m_folder.store("q.dat", second);
        WvImportJob job;
        job.file1 = stored ? m_folder.path("i.dat") : QString();
        job.file2 = m_folder.path("q.dat");
        job.useFile2 = !second.isNull();
        job.binary = binary;
        job.format.dataFormat = Rational;
        job.format.precision = Bits32;
        job.scaling = ImportScaling::Down;
        return job;
    }

    TestFolder m_folder;
    DataFileAccess m_reader;
};

void TestDataImport::convertsTextByTheTable()
{
    forRows({{"8 signed", Integer, Bits8, true, "100", 99.5 / 127},
             {"8 unsigned", Integer, Bits8, false, "100", 99.5 / 127 - 1},
             {"14 unsigned", Integer, Bits14, false, "8192", 8191.5 / 8191 - 1},
             {"16 signed", Integer, Bits16, true, "-32767", -32767.5 / 32767},
             {"16 unsigned", Integer, Bits16, false, "+1e4", 9999.5 / 32767 - 1},
             {"32 signed", Integer, Bits32, true, "-5", -5.5 / 2147483647},
             {"32 unsigned", Integer, Bits32, false, "4294967295", 4294967294.5 / 2147483647 - 1},
             {"rational", Rational, Bits32, true, "-0.125e1", -1.25},
             {"tiny", Rational, Bits64, true, "1e-400", 0.0},
             {"hex 16 unsigned", Hex, Bits16, false, "0xFfFf", 65534.5 / 32767 - 1},
             {"hex 16 signed", Hex, Bits16, true, "FFFF", -1.5 / 32767},
             {"hex 32 unsigned", Hex, Bits32, false, "80000000", 2147483647.5 / 2147483647 - 1},
             {"hex 32 signed", Hex, Bits32, true, "0X80000000", -2147483648.5 / 2147483647}},
            [](DataFormat format, DataPrecision precision, bool isSigned, const QByteArray &text,
               double expected) {
                double value = 0;
                const QByteArray line = "7;" + text;
                QVERIFY(getValueFromLine({line.data(), size_t(line.size())}, 2, &value,
                                         {format, precision, isSigned, false}, 1));
                QCOMPARE(value, expected);
                QCOMPARE(takeMessages(), QStringList());
            });
    double value = 5;
    QVERIFY(getValueFromLine("12G4", 1, &value, {Hex, Bits16, true, false}, 1));
    QCOMPARE(value, -0.5 / 32767);
    QCOMPARE(takeMessages(), QStringList("Invalid HEX data '12G4'."));
}

void TestDataImport::convertsBytesByTheTable()
{
    // The same bytes in either order; the values by the rule of each row.
    forRows({{"8 unsigned", Integer, Bits8, false, "FF", 1.0},
             {"8 signed", Integer, Bits8, true, "80", -128 / 32768.5 - 1},
             {"14 unsigned", Integer, Bits14, false, "C001", 1 / 8191.5 - 1},
             {"16 unsigned", Integer, Bits16, false, "0102", 258 / 32768.5 - 1},
             {"16 signed", Integer, Bits16, true, "8000", -32767.5 / 32767.5},
             {"32 unsigned", Integer, Bits32, false, "80000000", 2147483648.0 / 2147483648.5 - 1},
             {"32 signed", Integer, Bits32, true, "80000000", -2147483647.5 / 2147483647.5},
             {"float", Rational, Bits32, false, "3FC00000", 1.5}},
            [](DataFormat format, DataPrecision precision, bool isSigned, const QByteArray &hex,
               double expected) {
                QByteArray bytes = QByteArray::fromHex(hex);
                for (const bool big : {true, false}) {
                    float value = 0;
                    const ValueFormat kind{format, precision, isSigned, big};
                    QVERIFY(isBinaryFormatKnown(kind));
                    QByteArray copy = bytes;
                    convertBinary(std::as_writable_bytes(
                                      std::span(copy.data(), static_cast<size_t>(copy.size()))),
                                  kind, {&value, 1});
                    QCOMPARE(value, static_cast<float>(expected));
                    std::reverse(bytes.begin(), bytes.end());
                }
            });
    forRows(
        {{"hex", Hex, Bits16, false, "Unsupported file format."},
         {"14 signed", Integer, Bits14, true, "Unsupported file format."},
         {"rational 16", Rational, Bits16, true, "Unsupported file format."},
         {"double", Rational, Bits64, true, "Binary precision not supported."}},
        [this](DataFormat format, DataPrecision precision, bool isSigned, const QString &words) {
            WvImportJob job = jobFor("12345678", {}, true);
            job.format = {format, precision, isSigned, false};
            QCOMPARE(import(job).error, words);
        });
}

void TestDataImport::refusesLines()
{
    const QString line = "Conversion error in line %1: '%2' is not a number.";
    forRows({{"one column", Rational, Bits32, "0.5", "Column cannot be found in file."},
             {"no number", Rational, Bits32, "1 2\n\n3 x", line.arg(3).arg("x")},
             {"CRLF counts once", Rational, Bits32, "1 2\r\n3 x", line.arg(2).arg("x")},
             {"NUL", Rational, Bits32, QByteArray("1 2\0", 4),
              line.arg(1).arg(QString("2") + QChar(0))},
             {"nan", Rational, Bits32, "1 nan", line.arg(1).arg("nan")},
             {"infinite", Rational, Bits32, "1 1e999", line.arg(1).arg("1e999")},
             {"decimal commas", Rational, Bits32, "0,5;0,25",
              "Line 1 has decimal commas. Write its numbers with points: commas separate numbers "
              "here."},
             {"endless line", Rational, Bits32, QByteArray(3 << 20, ' '),
              "Line 1 exceeds 1024 characters. Aborting."},
             {"hex 8", Hex, Bits8, "1 2",
              "Unsupported file format: hexadecimal text is read with 16 or 32 bits only."},
             {"empty", Rational, Bits32, "# nothing\n", "No samples found in the input file."}},
            [this](DataFormat format, DataPrecision precision, const QByteArray &text,
                   const QString &words) {
                WvImportJob job = jobFor(text);
                job.format = {format, precision, true, false};
                QCOMPARE(import(job).error, words);
            });
    WvImportJob missing = jobFor({});
    missing.file1 = m_folder.path("none");
    QCOMPARE(import(missing).error, "Input file does not exist.");
}

void TestDataImport::readsLines()
{
    forRows({{"last line without end", "1,0\n0,1", 0, {1, 0, 0, 1}},
             {"all line ends", "1 0\r0 1\r\n1 0\n\n\r0 1\n", 0, {1, 0, 0, 1, 1, 0, 0, 1}},
             {"all separators", "1:0;7\n\t 0 ,; 1 9", 0, {1, 0, 0, 1}},
             {"limit", "1 0\n0 1\nx", 2, {1, 0, 0, 1}},
             {"line of 1024", "1 0" + QByteArray(1021, ' ') + "\n0 1", 0, {1, 0, 0, 1}}},
            [this](const QByteArray &text, int limit, const std::vector<float> &values) {
                const Outcome outcome = import(jobFor(text), limit);
                QCOMPARE(outcome.error, QString());
                QCOMPARE(outcome.values, values);
            });
}

void TestDataImport::takesTags()
{
    const Outcome outcome = import(jobFor("# comment = a = b\n%COPYRIGHT=me\n/ no tag\n"
                                          "! ClockRate = 1.5e6\n0.5 0\n"));
    QCOMPARE(outcome.error, QString());
    QCOMPARE(outcome.record.comment, "a = b");
    QCOMPARE(outcome.record.copyright, "me");
    QCOMPARE(m_reader.clockHz().value_or(0), 1.5e6);
    forRows({{"low", "399"}, {"high", "600000001"}, {"none", "fast"}},
            [this](const QByteArray &clock) {
                QCOMPARE(import(jobFor("1 0\n#CLOCKRATE=" + clock)).error,
                         "Line 2: Number for CLOCKRATE is out of range. Aborting.");
            });
}

void TestDataImport::joinsTwoFiles()
{
    QByteArray first;
    QByteArray second;
    std::vector<float> values;
    constexpr int samples = 100'000;
    for (int i = 0; i < samples; ++i) {
        first += QByteArray::number(i % 1000) + "e-4\n";
        second += "-0.0" + QByteArray::number(i % 10) + '\n';
        values.push_back(static_cast<float>(i % 1000 * 1e-4));
        values.push_back(static_cast<float>(i % 10 * -0.01));
    }
    const Outcome outcome = import(jobFor(first, second));
    QCOMPARE(outcome.error, QString());
    QCOMPARE(outcome.values.size(), values.size());
    for (size_t i = 0; i < values.size(); ++i) {
        QVERIFY(std::fabs(outcome.values[i] - values[i]) < 1e-8F);
    }
    forRows({{"2nd shorter", "1\n0\n1", "1\n0",
              "The files don't match: 3 I values in the first, 2 Q values in the second."},
             {"2nd longer", "1\n0", "1\n0\n1",
              "The files don't match: 2 I values in the first, 3 Q values in the second."}},
            [this](const QByteArray &i, const QByteArray &q, const QString &words) {
                const Outcome unequal = import(jobFor(i, q));
                QCOMPARE(unequal.error, words);
                QVERIFY(unequal.values.empty());
            });
    WvImportJob missing = jobFor("1", "");
    missing.file2 = m_folder.path("none");
    QCOMPARE(import(missing).error, "2nd input file does not exist.");
}

void TestDataImport::readsBinaryFiles()
{
    const auto floats = [](const QList<float> &list) {
        QByteArray bytes;
        for (const float value : list) {
            bytes += littleEndian(value);
        }
        return bytes;
    };
    const QByteArray none;
    forRows(
        {{"one file", floats({1, 0, 0, 0.5F}), none, 0, {1, 0, 0, 0.5F}, ""},
         {"odd length", floats({1, 0, 0.5F}) + "x", none, 0, {1, 0}, ""},
         {"limit", floats({1, 0, 0, 0.5F}), none, 1, {1, 0}, ""},
         {"two files", floats({1, 0}), floats({0, 0.5F}), 0, {1, 0, 0, 0.5F}, ""},
         {"2nd shorter", floats({1, 0}), floats({0}), 0, {}, "Number of I and Q values disagree."},
         {"2nd longer", floats({1}), floats({0, 1}), 0, {1, 0}, ""},
         {"too large",
          floats({1, 0, 0, 1001}),
          none,
          0,
          {},
          "Numbers appear to be too large. Check conversion settings!"},
         {"no number",
          floats({NAN, 0}),
          none,
          0,
          {},
          "Numbers appear to be too large. Check conversion settings!"},
         {"empty", "", none, 0, {}, "No samples found in the input file."}},
        [this](const QByteArray &first, const QByteArray &second, int limit,
               const std::vector<float> &values, const QString &words) {
            const Outcome outcome = import(jobFor(first, second, true), limit);
            QCOMPARE(outcome.error, words);
            QCOMPARE(outcome.values, values);
        });
}

void TestDataImport::scales()
{
    constexpr auto None = ImportScaling::None;
    constexpr auto Down = ImportScaling::Down;
    constexpr auto Auto = ImportScaling::Auto;
    const auto db = [](double level) { return 20 * std::log10(1 / level); };
    const double half = std::sqrt(0.5);
    // Peak and RMS are those of the values in the row.
    forRows({{"none, low", None, "0.5 0\n0 0", {0.5F, 0, 0, 0}, db(0.5), db(0.5 * half), 0},
             {"none, clipped", None, "3 0\n0 -2", {1, 0, 0, -1}, 0.0, 0.0, 2},
             {"none, long", None, "0.8 0.8\n0 0", {0.8F, 0.8F, 0, 0}, db(0.8F / half), db(0.8F), 0},
             {"none, one", None, "1 0\n0 -1", {1, 0, 0, -1}, 0.0, 0.0, 0},
             {"down, low", Down, "0.5 0\n0 0", {0.5F, 0, 0, 0}, db(0.5), db(0.5 * half), 0},
             {"down, high", Down, "4 0\n0 0", {1, 0, 0, 0}, 0.0, db(half), 0},
             {"auto, low", Auto, "0.25 0\n0 0", {1, 0, 0, 0}, 0.0, db(half), 0},
             {"auto, one", Auto, "1 0\n0 0", {1, 0, 0, 0}, 0.0, db(half), 0},
             {"auto, silence", Auto, "0 0\n0 0", {0, 0, 0, 0}, 240.0, 240.0, 0}},
            [this](ImportScaling scaling, const QByteArray &text, const std::vector<float> &values,
                   double peak, double rms, int clipped) {
                WvImportJob job = jobFor(text);
                job.scaling = scaling;
                const Outcome outcome = import(job);
                QCOMPARE(outcome.error, QString());
                QCOMPARE(outcome.values, values);
                QVERIFY(std::fabs(outcome.record.peakOffset - peak) < 1e-9);
                QVERIFY(std::fabs(outcome.record.rmsOffset - rms) < 1e-9);
                QVERIFY(outcome.record.levelsValid);
                QCOMPARE(m_reader.clipped().values, clipped);
            });
}

void TestDataImport::readsTextOfNumpy()
{
    QVERIFY(runPython(m_folder.path(),
                      "r = np.random.default_rng(7).uniform(-0.7, 0.7, (50000, 2))\n"
                      "np.savetxt('r.csv', r, delimiter=',')\n"
                      "r.astype('<f4').tofile('r.bin')\n"
                      "w = np.round(r * 32767).astype(int)\n"
                      "np.savetxt('w.txt', w, fmt='%d')\n"
                      "w.astype('>i2').tofile('w.bin')\n"));
    const QByteArray truth = m_folder.load("r.bin");
    std::vector<float> expected(100'000);
    QCOMPARE(truth.size(), qsizetype(expected.size() * sizeof(float)));
    memcpy(expected.data(), truth.data(), static_cast<size_t>(truth.size()));
    forRows(
        {{"text", "r.csv", false, Rational, Bits32, false},
         {"floats", "r.bin", true, Rational, Bits32, false},
         {"integer text", "w.txt", false, Integer, Bits16, false},
         {"words", "w.bin", true, Integer, Bits16, true}},
        [&](const char *name, bool binary, DataFormat format, DataPrecision precision, bool big) {
            WvImportJob job;
            job.file1 = m_folder.path(name);
            job.binary = binary;
            job.format = {format, precision, true, big};
            const Outcome outcome = import(job);
            QCOMPARE(outcome.error, QString());
            QCOMPARE(outcome.values.size(), expected.size());
            // Rounding, half a word of the rule, and its other full scale for large values.
            const float tolerance = format == Rational ? 0 : 1.5F / 32767;
            for (size_t i = 0; i < expected.size(); ++i) {
                QVERIFY(std::fabs(outcome.values[i] - expected[i]) <= tolerance);
            }
        });
}

void TestDataImport::guessesTypeAndPartner()
{
    forRows({{"text", "1.5,-2\r\n+3e4", false},
             {"old controls", QByteArray("1\x10\x13\t2"), false},
             {"comment", "# 1 2", true},
             {"NUL", QByteArray("1\0", 2), true},
             {"nothing", "", false}},
            [](const QByteArray &head, bool binary) { QCOMPARE(looksBinary(head), binary); });
    QVERIFY(m_folder.store("wi_i1.txt", "1") && m_folder.store("wi_q1.txt", "1"));
    DataGuess guess;
    QVERIFY(guessData(m_folder.path("wi_i1.txt"), guess));
    QCOMPARE(guess.partner, m_folder.path("wi_q1.txt"));
    QVERIFY(!guessData(m_folder.path("none"), guess));
    QCOMPARE(takeMessages(Tracer::Error), QStringList("Primary input file does not exist."));
    QCOMPARE(previewText("AZ a\x01"
                         "b\xFF"
                         "q",
                         true),
             "41 5A 20 61 01 62 FF AZ.a.b.\n71                   q\n");
    QCOMPARE(previewText(QByteArray("1\r\n").repeated(200), false).count('\n'), 99);
}

void TestDataImport::keepsPresets()
{
    ImportPreset preset;
    preset.job = {"a,b.txt", "c", true, true, {Hex, Bits32, false, true}, ImportScaling::None};
    preset.comment = "x, y = z";
    ImportPreset read;
    QVERIFY(savePreset(m_folder.path("p.ini"), preset) && loadPreset(m_folder.path("p.ini"), read));
    QCOMPARE(read.job.file1, "a,b.txt");
    QVERIFY(read.job.useFile2 && read.job.binary && read.job.format.bigEndian);
    QVERIFY(!read.job.format.isSigned && read.job.format.dataFormat == Hex);
    QCOMPARE(read.job.scaling, ImportScaling::None);
    QCOMPARE(read.comment, "x, y = z");
    // Written by hand, without a group and with a value that means nothing.
    QVERIFY(m_folder.store("q.ini", "dataformat=1\nprecision=77\nclock=2e6\n"));
    QVERIFY(loadPreset(m_folder.path("q.ini"), read));
    QCOMPARE(read.job.format.dataFormat, Rational);
    QCOMPARE(read.job.format.precision, Bits32);
    QCOMPARE(read.clockHz, 2e6);
    QVERIFY(!loadPreset(m_folder.path("none.ini"), read));
}

QTEST_GUILESS_MAIN(TestDataImport)
#include "tst_dataimport.moc"
