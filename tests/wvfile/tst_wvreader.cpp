// SPDX-License-Identifier: Apache-2.0
#include "WvTestFile.h"
#include "support/rows.h"
#include "support/seed.h"
#include "wvfile/SampleDevice.h"

#include <QSignalSpy>
#include <QTest>

#include <algorithm>
#include <cmath>

namespace {

const QByteArray tgx = "{TYPE: TGX-WV,0}";
const QByteArray one = "{SAMPLES:1}{CONTROL LENGTH:1}" + sampleBlock(words({1, 2}));

const QString tgxLine = "1|Format is TGX waveform.";
const QString oneSample = "1|Reading 1 samples @ 16 bit from waveform...";
const QString disagree = "2|Number of samples from xWAVEFORM tag and SAMPLES tag disagree";
const QString takesBlock = "2|Using data from xWAVEFORM tag.";

double offsetOf(double level)
{
    return 20 * std::log10(1 / (level + 1e-7));
}

} // namespace

class TestWvReader : public QObject
{
    Q_OBJECT

private slots:
    void accepted();
    void refused();
    void codings();
    void blocksJoinSeamlessly();
    void anyPosition();
    void recordAndPrefix();
    void textTags();
    void levelsAreMeasured();
    void unknownTagsAreKept();
    void progressAndCancel();
};

void TestWvReader::accepted()
{
    const QString noSamples =
        "2|No SAMPLES tag found. Trying to determine the sample count later...";
    const QString noControl = "2|No CONTROL LENGTH tag found. Using sample count instead (1).";
    const QByteArray block = sampleBlock(words({1, 2}));
    // The warnings.
    forRows(
        {{"smallest file", block, {noSamples, disagree, takesBlock}},
         {"block overrules SAMPLES",
          "{SAMPLES:7}{CONTROL LENGTH:1}" + block,
          {disagree, takesBlock}},
         {"bytes between tags", "\r\n" + one + "{SAMPLES:x", {}},
         {"skipped tags", "{CRESTFACTOR:x\x01y}{SI COMPENSATED: 1}{SYSTEM:}{FREE: {}" + one, {}},
         {"longest name and text",
          '{' + QByteArray(99, 'x') + ":}{COMMENT:" + QByteArray(1024, 'x') + '}' + one,
          {}},
         {"CONTROL LENGTH 0 counts as absent",
          "{SAMPLES:1}{MARKER LIST 1:0:1}{CONTROL LENGTH:0}" + block,
          {noControl}},
         {"bytes of an incomplete sample are dropped",
          "{SAMPLES:1}{CONTROL LENGTH:1}{WAVEFORM-8: #abcdefg}",
          {}}},
        [](const QByteArray &tags, const QStringList &warnings) {
            ReadRun run("rubbish" + tgx + tags);
            QVERIFY(run.read().ok);
            QCOMPARE(run.log.filter(QRegularExpression("^2")), warnings);
            QCOMPARE(run.log.last(), oneSample);
        });
}

void TestWvReader::refused()
{
    const char *clock = "4|Invalid clock rate! Range is 0.001-600MHz";
    const char *samples = "4|Invalid number of samples! Use value > 0.";
    const char *tooMany = "4|Number of samples 2147483648 is too large. At most 2147483647 samples "
                          "can be read.";
    const char *block = "4|Invalid WAVEFORM tag format (samples count).";
    const char *noBlock = "4|Cannot read WAVEFORM tag";
    forRows(
        {{"no sample block", tgx + "{SAMPLES:1}",
          "4|No tag mark found! Probably incorrect format."},
         {"no type", one, "4|Unsupported waveform file type!"},
         {"name of 100 characters", '{' + QByteArray(100, 'x') + ":}" + tgx + one,
          "4|Tag name '" + QString(100, 'x') + "' is invalid."},
         {"other type", "{TYPE: tgx-mwv , 0}" + one,
          "4|File is not a valid waveform file (TGX-MWV) !"},
         {"clock too high", tgx + "{CLOCK:600000000.1}" + one, clock},
         {"clock no number", tgx + "{CLOCK:nan}" + one, clock},
         {"more than any number", tgx + "{SAMPLES:99999999999999999999}" + one, samples},
         {"samples beyond the limit", tgx + "{SAMPLES:2147483648}" + one, tooMany},
         {"a block beyond it", tgx + "{SAMPLES:1}{WAVEFORM-8589934593: #", tooMany},
         {"no level", tgx + "{LEVEL OFFS:nan,0}" + one, "4|LEVEL OFFS tag is invalid ('nan,0')."},
         {"control length beyond the file", tgx + "{CONTROL LENGTH:100}" + one,
          "4|CONTROL LENGTH tag is invalid ('100')."},
         {"endless prefix", tgx + "{SAMPLES:1}{WAVEFORM-5:" + QByteArray(1025, '1') + '#', noBlock},
         {"block of negative length", tgx + "{SAMPLES:1}{WAVEFORM--5: #abcd}", block},
         {"block of 4 bytes", tgx + "{SAMPLES:1}{WAVEFORM-4: #abcd}",
          "4|Invalid number of samples in WAVEFORM tag."},
         {"block cut short", tgx + "{SAMPLES:2}{WAVEFORM-9: #abcdefg",
          "4|Cannot read enough data from xWAVEFORM tag!"}},
        [](const QByteArray &file, const QString &words) {
            ReadRun run(file);
            QVERIFY(!run.read().ok);
            QCOMPARE(run.log.last(), words);
        });
    for (const char *tag :
         {"SI COMPENSATED", "RESOLUTION", "SYSTEM", "COMMENT", "COPYRIGHT", "DATE", "CLOCK",
          "SAMPLES", "LEVEL OFFS", "LEVEL OFFSET", "CONTROL LENGTH"}) {
        ReadRun endless(tgx + '{' + tag + ":" + QByteArray(1025, 'x') + '}' + one);
        QVERIFY2(!endless.read().ok, tag);
        QCOMPARE(endless.log,
                 QStringList({tgxLine, "4|Tag content exceeds limit.", "4|Invalid tag data"}));
    }
}

void TestWvReader::codings()
{
    // The words 0, 0x8000, 0x7FFF and 0x4003.
    const QList<float> a{-0.5F / 32767, -32768.5F / 32767, 32766.5F / 32767, 16386.5F / 32767};
    const QList<float> b{0, -32768.0F / 32767, 1, 16387.0F / 32767};
    const QList<float> c{-32768.0F / 32767, 0, -1.0F / 32767, -16381.0F / 32767};
    const QList<float> d{-32768.5F / 32000, -0.5F / 32000, -4.5F / 32000, -16384.5F / 32000};
    forRows(
        {{"TGX", "{TYPE: TGX-WV,0}", 2, "TGX", a},
         {"TVX", "{TYPE: tvx-wv ,77}", 5, "TVX", a},
         {"TQX-130", "{TYPE:TQX-130-WV,0}", 4, "TQX-130", b},
         {"TQX-110", "{TYPE:WV,0}{RESOLUTION: 16 bit}", 1, "TQX-110", c},
         {"14 bit", "{RESOLUTION:14}{TYPE:WV-ADD,0}", 1, "TQX-110", d}},
        [](const QByteArray &head, int format, const QString &name, const QList<float> &values) {
            ReadRun run(head + sampleBlock(words({0, 0x8000, 0x7FFF, 0x4003})));
            QVERIFY(run.read().ok);
            QCOMPARE(run.info.format, format);
            QCOMPARE(run.log.value(0), "1|Format is " + name + " waveform.");
            QVERIFY(run.dataDevice.bytes.startsWith("IQF"));
            QCOMPARE(run.values(), values);
        });
}

void TestWvReader::blocksJoinSeamlessly()
{
    for (const int samples : {1, 65535, 65536, 65537, 200'001}) {
        const QByteArray block = randomBytes(4 * samples);
        ReadRun run(tgx + "{CLOCK:1e6}{SAMPLES:" + QByteArray::number(samples) + '}' +
                    sampleBlock(block));
        QVERIFY(run.read().ok);
        QCOMPARE(run.info.samples, samples);
        QCOMPARE(run.info.controlLength, samples);
        QCOMPARE(run.info.clock, 1e6);
        const QList<float> values = run.values();
        QCOMPARE(values.size(), qsizetype(2) * samples);
        const auto valueOf = [&](qsizetype index) {
            const auto word = qFromLittleEndian<qint16>(block.constData() + 2 * index);
            return double((static_cast<float>(word) - 0.5F) / 32767.0F);
        };
        double sum = 0;
        double peak = 0;
        for (qsizetype i = 0; i < samples; ++i) {
            const double inPhase = valueOf(2 * i);
            const double quadrature = valueOf(2 * i + 1);
            QVERIFY(double(values.at(2 * i)) == inPhase &&
                    double(values.at(2 * i + 1)) == quadrature);
            const double power = inPhase * inPhase + quadrature * quadrature;
            sum += power;
            peak = std::max(peak, std::sqrt(power));
        }
        QCOMPARE(run.info.rmsOffset, offsetOf(std::sqrt(sum / samples)));
        QCOMPARE(run.info.peakOffset, offsetOf(peak));
        QCOMPARE(run.markers(), QByteArray(samples, '\0'));
    }
}

/// What one file has left behind isn't the next one's.
/// Without unpacking, each stretch of the file decodes to what the unpacked stream holds there.
void TestWvReader::anyPosition()
{
    constexpr int Samples = 200'000;
    ReadRun run("{TYPE: TGX-WV,0}{SAMPLES:200000}" + sampleBlock(randomBytes(4 * Samples)));
    QVERIFY(run.read().ok);
    const QByteArray unpacked = run.dataDevice.bytes;
    SampleDevice device;
    QVERIFY(device.setSource(run.info) && device.open(QIODevice::ReadOnly));
    QCOMPARE(device.size(), unpacked.size());
    for (const auto &[position, count] :
         {std::pair{0, 2}, {1, 600'000}, {3 + 8 * 65'536 - 1, 9}, {3 + 8 * Samples - 5, 100}}) {
        QVERIFY(device.seek(position));
        QVERIFY2(device.read(count) == unpacked.mid(position, count),
                 qPrintable(QString::number(position)));
    }
    // Cut off meanwhile: what is there comes, and then an error instead of a wait or of zeros.
    QVERIFY(QFile::resize(run.info.fileName, QFileInfo(run.info.fileName).size() / 2));
    SampleDevice cut;
    QVERIFY(cut.setSource(run.info) && cut.open(QIODevice::ReadOnly | QIODevice::Unbuffered));
    QByteArray got;
    QByteArray piece(100'000, '\0');
    qint64 count = 0;
    while ((count = cut.read(piece.data(), got.isEmpty() ? piece.size() : 8)) > 0) {
        got += piece.left(count);
    }
    QCOMPARE(count, -1);
    QVERIFY(unpacked.startsWith(got) && std::abs(got.size() - unpacked.size() / 2) < 200);
}

void TestWvReader::recordAndPrefix()
{
    // B counts from the first byte that is no blank: "12,#" and one sample.
    ReadRun run(tgx + "{SAMPLES:1}{WAVEFORM-8:  12,#" + words({5, 6}) + '}');
    run.info.clock = 5;
    run.info.comment = "old";
    run.info.rmsOffsetTag = 1;
    QVERIFY(run.read().ok);
    QCOMPARE(run.info.prefixNumber, 12);
    QCOMPARE(run.info.samples, 1);
    QCOMPARE(run.values(), QList<float>({4.5F / 32767, 5.5F / 32767}));
    QCOMPARE(run.info.clock, 0.0);
    QCOMPARE(run.info.comment, QString());
    QCOMPARE(run.info.rmsOffsetTag, 0.0);
    // Streams that served before serve again.
    QVERIFY(run.read().ok);
    QCOMPARE(run.values().size(), 2);
    ReadRun noComma(tgx + "{SAMPLES:1}{WAVEFORM-7:12#" + words({5, 6}) + '}');
    noComma.info.prefixNumber = 9;
    QVERIFY(noComma.read().ok);
    QCOMPARE(noComma.info.prefixNumber, 0);
}

void TestWvReader::textTags()
{
    forRows({{"leading blanks go, trailing stay", "   a b ", "a b "},
             {"cut at a control byte", "ab\ncd", "ab"},
             {"cut at a byte beyond ASCII", "gr\xC3\xBC\xC3\x9F", "gr"},
             {"cut at a tilde", "a~b", "a"},
             {"the last character that counts", "a|b", "a|b"}},
            [&](const QByteArray &content, const QString &text) {
                ReadRun run(tgx + "{COMMENT:" + content + "}{DATE:" + content + '}' + one);
                QVERIFY(run.read().ok);
                QCOMPARE(run.info.comment, text);
                QCOMPARE(run.info.date, text);
            });
}

void TestWvReader::levelsAreMeasured()
{
    // 8192.5 / 32767 is the value of the word 8193.
    const QByteArray file =
        tgx + "{LEVEL OFFS: 3.5 , -1.25}" + sampleBlock(words({8193, 0, 0, 8193}));
    const double high = 8192.5 / 32767;
    const double low = 0.5 / 32767;
    const double level = std::sqrt(high * high + low * low);
    for (const double gainDb : {0.0, 6.0206, -20.0}) {
        ReadRun run(file);
        run.info.gainDb = gainDb;
        QVERIFY(run.read().ok);
        const double gain = std::pow(10, gainDb / 20);
        QVERIFY(std::fabs(run.values().at(0) - high * gain) < 1e-7);
        QVERIFY(std::fabs(run.info.rmsOffset - offsetOf(level * gain)) < 1e-5);
        QCOMPARE(run.info.rmsOffsetTag, 3.5);
        QCOMPARE(run.info.peakOffsetTag, -1.25);
    }
    ReadRun silent("{TYPE:TQX-130-WV}{LEVEL OFFSET:1,2}" + silentBlock(3));
    QVERIFY(silent.read().ok);
    QVERIFY(std::fabs(silent.info.rmsOffset - 140) < 1e-9);
    QVERIFY(std::fabs(silent.info.peakOffset - 140) < 1e-9);
    QCOMPARE(silent.info.peakOffsetTag, 2.0);
}

void TestWvReader::unknownTagsAreKept()
{
    const QByteArray binary("a\0\xFF{\n~", 6);
    const QByteArray longText(200'000, 'y');
    const QByteArray file = tgx + "{FREE:  text }{CLOCK MARKER:1.5}{EMPTY:}{RAW:" + binary +
                            "}{LONG:" + longText + "}{CRESTFACTOR:3}{type:x}" + one + "{BEHIND:1}";
    ReadRun kept(file, true);
    QVERIFY(kept.read().ok);
    QCOMPARE(kept.tags(), "{FREE: text }{CLOCK MARKER: 1.5}{EMPTY: }{RAW: " + binary +
                              "}{LONG: " + longText + "}{type: x}");
    ReadRun dropped(file);
    QVERIFY(dropped.read().ok);
    QCOMPARE(dropped.tags(), QByteArray());
    QCOMPARE(dropped.log, kept.log);
    // What was kept once is kept the same way when it is read again.
    ReadRun again(tgx + kept.tags() + one, true);
    QVERIFY(again.read().ok);
    QCOMPARE(again.tags(), kept.tags());
    ReadRun cut(tgx + "{FREE:text", true);
    QVERIFY(!cut.read().ok);
    QCOMPARE(cut.log.last(), QString("4|Invalid tag. '}' is missing."));
}

void TestWvReader::progressAndCancel()
{
    const QByteArray lists = QByteArray("{MARKER LIST 1: 0:1;1:0}").repeated(20'000);
    const QByteArray file = tgx + lists + silentBlock(500'000);
    ReadRun whole(file);
    HvFileIO io;
    QSignalSpy progress(&io, &HvFileIO::ProgressUpdate);
    CapturedLog log;
    QVERIFY(io.readWaveform(&whole.info));
    QCOMPARE(progress.last().at(0).toInt(), 100);
    int last = 0;
    for (const QList<QVariant> &update : progress) {
        QVERIFY(update.at(0).toInt() >= last && update.at(0).toInt() <= 100);
        last = update.at(0).toInt();
    }
    static_cast<void>(log.take());

    // A slow device lets a tick of the clock pass; the flag set before is seen then.
    TestDevice slow;
    slow.slowMs = 150;
    BufferedIO stream(1 << 20);
    QVERIFY(stream.initBuf(&slow, BufferedIO::ReadWrite));
    ReadRun cancelled(file);
    cancelled.info.dataStream = &stream;
    connect(&io, &HvFileIO::ProgressUpdate, &io, &HvFileIO::cancel);
    QVERIFY(!io.readWaveform(&cancelled.info));
    QCOMPARE(log.take().last(), QString("4|Action aborted by user."));
    QVERIFY(slow.bytes.size() < 4'000'000);
    // A cancel is over with its run; another read starts afresh.
    io.disconnect();
    io.cancel();
    ReadRun again(tgx + one);
    QVERIFY(io.readWaveform(&again.info));
}

QTEST_GUILESS_MAIN(TestWvReader)
#include "tst_wvreader.moc"
