// SPDX-License-Identifier: Apache-2.0
#include "WvTestFile.h"

#include <QSignalSpy>
#include <QTest>

#include <cmath>

namespace {

const QByteArray tgx = "{TYPE: TGX-WV,0}";
const QByteArray one = "{SAMPLES:1}{CONTROL LENGTH:1}" + sampleBlock({1, 2});

const QString tgxLine = "1|Format is TGX waveform.";
const QString oneSample = "1|Reading 1 samples @ 16 bit from waveform...";
const QString noSamples = "2|No SAMPLES tag found. Trying to determine the sample count later...";
const QString disagree = "2|Number of samples from xWAVEFORM tag and SAMPLES tag disagree";
const QString takesBlock = "2|Using data from xWAVEFORM tag.";

QString noControl(int count)
{
    return QString("2|No CONTROL LENGTH tag found. Using sample count instead (%1).").arg(count);
}

QString finalizing(int position, int value)
{
    return QString("1|Finalizing marker stream up to position %1 using value 0x%2")
        .arg(position)
        .arg(value, 0, 16);
}

double offsetOf(double level)
{
    return 20 * std::log10(1 / (level + 1e-7));
}

} // namespace

class TestWvReader : public QObject
{
    Q_OBJECT

private slots:
    void words_data();
    void words();
    void textTags_data();
    void textTags();
    void codings_data();
    void codings();
    void levelsAreMeasured();
    void blocksJoinSeamlessly_data();
    void blocksJoinSeamlessly();
    void unknownTagsAreKept();
    void prefixOfTheBlock();
    void recordIsCleared();
    void badCalls();
    void failingStreams_data();
    void failingStreams();
    void progressAndCancel();
    void debugWords();
};

void TestWvReader::words_data()
{
    QTest::addColumn<QByteArray>("file");
    QTest::addColumn<bool>("ok");
    QTest::addColumn<QStringList>("log");
    const auto good = [](const char *name, const QByteArray &file, const QStringList &log) {
        QTest::newRow(name) << file << true << log;
    };
    const auto bad = [](const char *name, const QByteArray &file, const QStringList &log) {
        QTest::newRow(name) << file << false << log;
    };
    const QStringList plain{tgxLine, finalizing(1, 0), oneSample};

    good("complete", tgx + one, plain);
    good("smallest file", tgx + sampleBlock({0, 0}),
         {tgxLine, noSamples, disagree, takesBlock, noControl(1), finalizing(1, 0), oneSample});
    good("block overrules SAMPLES", tgx + "{SAMPLES:7}{CONTROL LENGTH:1}" + sampleBlock({1, 2}),
         {tgxLine, disagree, takesBlock, finalizing(1, 0), oneSample});
    good("bytes between tags", "rubbish" + tgx + "\r\n" + one + "{SAMPLES:x", plain);
    good("numbers in blanks", tgx + "{SAMPLES:  1 }{CONTROL LENGTH:   1}" + sampleBlock({1, 2}),
         plain);
    good("any name with WAVEFORM", tgx + "{SAMPLES:1}{CONTROL LENGTH:1}{EmptyWaveForm-5: #abcd",
         plain);
    good("skipped tags", tgx + "{CRESTFACTOR:x\x01y}{SI COMPENSATED: 1}{SYSTEM:}{FREE: {}" + one,
         plain);
    good("14 bit", tgx + "{RESOLUTION:14}" + one,
         {tgxLine, finalizing(1, 0), "1|Reading 1 samples @ 14 bit from waveform..."});
    good("clock at its upper limit", tgx + "{CLOCK:600000000}" + one, plain);
    good("name of 99 characters", tgx + '{' + QByteArray(99, 'x') + ":}" + one, plain);
    good("text of 1024 characters", tgx + "{COMMENT:" + QByteArray(1024, 'x') + '}' + one, plain);
    good("CONTROL LENGTH of a quarter of the size",
         tgx + "{SAMPLES:1}{CONTROL LENGTH:0016}" + sampleBlock({1, 2}),
         {tgxLine, finalizing(16, 0), oneSample});
    good("CONTROL LENGTH 0 counts as absent",
         tgx + "{SAMPLES:1}{CONTROL LENGTH:0}" + sampleBlock({1, 2}),
         {tgxLine, noControl(1), finalizing(1, 0), oneSample});
    good("bytes of an incomplete sample are dropped",
         tgx + "{SAMPLES:1}{CONTROL LENGTH:1}" + "{WAVEFORM-8: #abcdefg}", plain);

    const QString noTag = "4|No tag mark found! Probably incorrect format.";
    bad("empty", "", {noTag});
    bad("no sample block", tgx + "{SAMPLES:1}", {tgxLine, noTag});
    bad("no type", one, {"4|Unsupported waveform file type!"});
    bad("name of 100 characters", '{' + QByteArray(100, 'x') + ":}" + tgx + one,
        {"4|Tag name '" + QString(100, 'x') + "' is invalid."});
    bad("name without end", "{TYPE", {"4|Tag name 'TYPE' is invalid."});
    for (const char *kind : {"TGX-MWV", "TGX-DL", "TGX-CL", "XYZ", ""}) {
        QTest::addRow("type '%s'", kind)
            << QByteArray("{TYPE: ") + QByteArray(kind).toLower() + " , 0}" + one << false
            << QStringList("4|File is not a valid waveform file (" + QString(kind) + ") !");
    }
    bad("endless type", "{TYPE:" + QByteArray(1025, 'x') + "}",
        {"4|Tag content exceeds limit.", "4|Invalid TYPE tag."});
    for (const char *tag :
         {"SI COMPENSATED", "RESOLUTION", "SYSTEM", "COMMENT", "COPYRIGHT", "DATE", "CLOCK",
          "SAMPLES", "LEVEL OFFS", "LEVEL OFFSET", "CONTROL LENGTH"}) {
        QTest::addRow("endless %s", tag)
            << tgx + '{' + tag + ":" + QByteArray(1025, 'x') + '}' + one << false
            << QStringList({tgxLine, "4|Tag content exceeds limit.", "4|Invalid tag data"});
    }
    for (const char *clock : {"0.001", "600000000.1", "-1", "", "1,5", "nan", "inf", "1 MHz"}) {
        QTest::addRow("clock '%s'", clock)
            << tgx + "{CLOCK:" + clock + '}' + one << false
            << QStringList({tgxLine, "4|Invalid clock rate! Range is 0.001-600MHz"});
    }
    for (const char *samples : {"0", "-1", "", "x", "1.5", "99999999999999999999"}) {
        QTest::addRow("samples '%s'", samples)
            << tgx + "{SAMPLES:" + samples + '}' + one << false
            << QStringList({tgxLine, "4|Invalid number of samples! Use value > 0."});
    }
    bad("samples beyond the limit", tgx + "{SAMPLES:2147483648}" + one,
        {tgxLine, "4|Number of samples 2147483648 is too large. At most 2147483647 samples can be "
                  "read."});
    bad("a block beyond the limit", tgx + "{SAMPLES:1}{WAVEFORM-8589934593: #",
        {tgxLine, disagree, takesBlock,
         "4|Number of samples 2147483648 is too large. At most 2147483647 samples can be read."});
    for (const char *levels : {"", "3", "3,", ",3", "3;0", "a,b", "nan,0"}) {
        QTest::addRow("levels '%s'", levels)
            << tgx + "{LEVEL OFFS:" + levels + '}' + one << false
            << QStringList({tgxLine, QString("4|LEVEL OFFS tag is invalid ('%1').").arg(levels)});
    }
    for (const char *length : {"", "x", "-1", "100", "1.0"}) {
        QTest::addRow("control length '%s'", length)
            << tgx + "{CONTROL LENGTH:" + length + '}' + one << false
            << QStringList(
                   {tgxLine, QString("4|CONTROL LENGTH tag is invalid ('%1').").arg(length)});
    }
    bad("CRESTFACTOR without end", tgx + "{CRESTFACTOR:1",
        {tgxLine, "4|Invalid tag. '}' is missing."});
    bad("unknown tag without end", tgx + "{FREE:1", {tgxLine, "4|Invalid tag. '}' is missing."});
    bad("no mark before the samples", tgx + "{SAMPLES:1}{WAVEFORM-5:}",
        {tgxLine, "4|Cannot read WAVEFORM tag"});
    bad("endless prefix", tgx + "{SAMPLES:1}{WAVEFORM-5:" + QByteArray(1025, '1') + '#',
        {tgxLine, "4|Tag content exceeds limit.", "4|Cannot read WAVEFORM tag"});
    bad("block without length", tgx + "{SAMPLES:1}{WAVEFORM: #abcd}",
        {tgxLine, "4|Invalid WAVEFORM tag format (samples count)."});
    bad("block of no number", tgx + "{SAMPLES:1}{WAVEFORM-x: #abcd}",
        {tgxLine, "4|Invalid WAVEFORM tag format (samples count)."});
    for (const char *length : {"0", "4", "-5"}) {
        QTest::addRow("block of %s bytes", length)
            << tgx + "{SAMPLES:1}{WAVEFORM-" + length + ": #abcd}" << false
            << QStringList(
                   length[0] == '-'
                       ? QStringList{tgxLine, "4|Invalid WAVEFORM tag format (samples count)."}
                       : QStringList{tgxLine, "4|Invalid number of samples in WAVEFORM tag."});
    }
    bad("block cut short", tgx + "{SAMPLES:2}{CONTROL LENGTH:2}{WAVEFORM-9: #abcdefg",
        {tgxLine, finalizing(2, 0), "1|Reading 2 samples @ 16 bit from waveform...",
         "4|Cannot read enough data from xWAVEFORM tag!"});
}

void TestWvReader::words()
{
    QFETCH(QByteArray, file);
    QFETCH(bool, ok);
    QFETCH(QStringList, log);
    ReadRun run(file);
    run.read();
    QCOMPARE(run.log, log);
    QCOMPARE(run.ok, ok);
}

void TestWvReader::textTags_data()
{
    QTest::addColumn<QByteArray>("content");
    QTest::addColumn<QString>("text");
    QTest::newRow("plain") << QByteArray("text") << "text";
    QTest::newRow("leading blanks go, trailing stay") << QByteArray("   a b ") << "a b ";
    QTest::newRow("empty") << QByteArray() << "";
    QTest::newRow("opening brace") << QByteArray("a{b") << "a{b";
    QTest::newRow("cut at a control byte") << QByteArray("ab\ncd") << "ab";
    QTest::newRow("cut at a byte beyond ASCII") << QByteArray("gr\xC3\xBC\xC3\x9F") << "gr";
    QTest::newRow("cut at a tilde") << QByteArray("a~b") << "a";
    QTest::newRow("the last character that counts") << QByteArray("a|b") << "a|b";
}

void TestWvReader::textTags()
{
    QFETCH(QByteArray, content);
    QFETCH(QString, text);
    for (const auto &[tag, field] : {std::pair{"COMMENT", &WvFileInfo::comment},
                                     {"COPYRIGHT", &WvFileInfo::copyright},
                                     {"SYSTEM", &WvFileInfo::system},
                                     {"DATE", &WvFileInfo::date}}) {
        ReadRun run(tgx + '{' + tag + ':' + content + '}' + one);
        QVERIFY(run.read().ok);
        QCOMPARE(run.info.*field, text);
    }
}

void TestWvReader::codings_data()
{
    QTest::addColumn<QByteArray>("head");
    QTest::addColumn<int>("format");
    QTest::addColumn<QString>("line");
    QTest::addColumn<QList<float>>("values");
    // The words 0, 0x8000, 0x7FFF and 0x4003.
    const QList<float> a{-0.5F / 32767, -32768.5F / 32767, 32766.5F / 32767, 16386.5F / 32767};
    const QList<float> b{0, -32768.0F / 32767, 1, 16387.0F / 32767};
    const QList<float> c{-32768.0F / 32767, 0, -1.0F / 32767, -16381.0F / 32767};
    const QList<float> d{-32768.5F / 32000, -0.5F / 32000, -4.5F / 32000, -16384.5F / 32000};
    const auto row = [](const char *head, int format, const char *line,
                        const QList<float> &values) {
        QTest::newRow(head) << QByteArray(head) << format
                            << QString("1|Format is %1 waveform.").arg(line) << values;
    };
    row("{TYPE: TGX-WV,0}", 2, "TGX", a);
    row("{TYPE:TBX-WV}", 3, "TBX", a);
    row("{TYPE: tvx-wv ,77}", 5, "TVX", a);
    row("{TYPE:TQX-130-WV,0}", 4, "TQX-130", b);
    row("{TYPE:WV,0}", 1, "TQX-110", c);
    row("{TYPE:WV-ADD,0}", 1, "TQX-110", c);
    row("{TYPE:WV,0}{RESOLUTION: 16 bit}", 1, "TQX-110", c);
    row("{TYPE:WV,0}{RESOLUTION:14}", 1, "TQX-110", d);
    row("{RESOLUTION:14}{TYPE:WV-ADD,0}", 1, "TQX-110", d);
    row("{TYPE:TGX-WV,0}{RESOLUTION:14}", 2, "TGX", a);
}

void TestWvReader::codings()
{
    QFETCH(QByteArray, head);
    QFETCH(int, format);
    QFETCH(QString, line);
    QFETCH(QList<float>, values);
    ReadRun run(head + sampleBlock({0, 0x8000, 0x7FFF, 0x4003}));
    QVERIFY(run.read().ok);
    QCOMPARE(run.info.format, format);
    QCOMPARE(run.log.value(0), line);
    QVERIFY(run.dataDevice.bytes.startsWith("IQF"));
    QCOMPARE(run.values(), values);
}

void TestWvReader::levelsAreMeasured()
{
    // 8192.5 / 32767 is the value of the word 8193.
    const QByteArray file = tgx + "{LEVEL OFFS: 3.5 , -1.25}" + sampleBlock({8193, 0, 0, 8193});
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
        QVERIFY(std::fabs(run.info.peakOffset - offsetOf(level * gain)) < 1e-5);
        QCOMPARE(run.info.rmsOffsetTag, 3.5);
        QCOMPARE(run.info.peakOffsetTag, -1.25);
    }
    ReadRun silent("{TYPE:TQX-130-WV}{LEVEL OFFSET:1,2}" + silentBlock(3));
    QVERIFY(silent.read().ok);
    QVERIFY(std::fabs(silent.info.rmsOffset - 140) < 1e-9);
    QVERIFY(std::fabs(silent.info.peakOffset - 140) < 1e-9);
    QCOMPARE(silent.info.peakOffsetTag, 2.0);
}

void TestWvReader::blocksJoinSeamlessly_data()
{
    QTest::addColumn<int>("samples");
    for (const int samples : {1, 65535, 65536, 65537, 131072, 200'001}) {
        QTest::addRow("%d samples", samples) << samples;
    }
}

void TestWvReader::blocksJoinSeamlessly()
{
    QFETCH(int, samples);
    QList<int> words;
    quint32 state = 99;
    for (int i = 0; i < 2 * samples; ++i) {
        state = state * 1664525U + 1013904223U;
        words << static_cast<qint16>(state >> 16);
    }
    ReadRun run(tgx + "{CLOCK:1e6}{SAMPLES:" + QByteArray::number(samples) + '}' +
                sampleBlock(words));
    QVERIFY(run.read().ok);
    QCOMPARE(run.info.samples, samples);
    QCOMPARE(run.info.controlLength, samples);
    QCOMPARE(run.info.clock, 1e6);
    const QList<float> values = run.values();
    QCOMPARE(values.size(), words.size());
    double sum = 0;
    double peak = 0;
    for (qsizetype i = 0; i < samples; ++i) {
        const double inPhase = (static_cast<float>(words.at(2 * i)) - 0.5F) / 32767.0F;
        const double quadrature = (static_cast<float>(words.at(2 * i + 1)) - 0.5F) / 32767.0F;
        if (static_cast<double>(values.at(2 * i)) != inPhase ||
            static_cast<double>(values.at(2 * i + 1)) != quadrature) {
            QFAIL(qPrintable(QString("sample %1").arg(i)));
        }
        const double power = inPhase * inPhase + quadrature * quadrature;
        sum += power;
        peak = std::max(peak, std::sqrt(power));
    }
    QCOMPARE(run.info.rmsOffset, offsetOf(std::sqrt(sum / samples)));
    QCOMPARE(run.info.peakOffset, offsetOf(peak));
    QCOMPARE(run.markers(), QByteArray(samples, '\0'));
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

void TestWvReader::prefixOfTheBlock()
{
    // B counts from the first byte that is no blank: "12,#" and one sample.
    ReadRun run(tgx + "{SAMPLES:1}{WAVEFORM-8:  12,#" + wordBytes({5, 6}) + '}');
    QVERIFY(run.read().ok);
    QCOMPARE(run.info.prefixNumber, 12);
    QCOMPARE(run.info.samples, 1);
    QCOMPARE(run.values(), QList<float>({4.5F / 32767, 5.5F / 32767}));
    ReadRun noComma(tgx + "{SAMPLES:1}{WAVEFORM-7:12#" + wordBytes({5, 6}) + '}');
    QVERIFY(noComma.read().ok);
    QCOMPARE(noComma.info.prefixNumber, 0);
}

void TestWvReader::recordIsCleared()
{
    ReadRun run(tgx + one);
    run.info.clock = 5;
    run.info.comment = "old";
    run.info.prefixNumber = 9;
    run.info.rmsOffsetTag = 1;
    QVERIFY(run.read().ok);
    QCOMPARE(run.info.clock, 0.0);
    QCOMPARE(run.info.comment, QString());
    QCOMPARE(run.info.prefixNumber, 0);
    QCOMPARE(run.info.rmsOffsetTag, 0.0);
    // Streams that served before serve again.
    QVERIFY(run.read().ok);
    QCOMPARE(run.values().size(), 2);
}

void TestWvReader::badCalls()
{
    CapturedLog log;
    HvFileIO io;
    QVERIFY(!io.readWaveform(nullptr));
    WvFileInfo info;
    QVERIFY(!io.readWaveform(&info));
    BufferedIO notReady;
    info.dataStream = &notReady;
    QVERIFY(!io.readWaveform(&info));
    info.markerStream = &notReady;
    QVERIFY(!io.readWaveform(&info));
    QCOMPARE(log.take(),
             QStringList({"4|Invalid input parameter.", "4|No temporary data storage available.",
                          "4|No temporary data storage available.", "4|Library not initialized.",
                          "4|Temporary marker storage not accessible."}));
    ReadRun run(tgx);
    run.info.fileName += ".none";
    QVERIFY(!run.read().ok);
    QCOMPARE(run.log, QStringList("4|Cannot open waveform input file."));
}

void TestWvReader::failingStreams_data()
{
    QTest::addColumn<QString>("fault");
    QTest::addColumn<QStringList>("log");
    QTest::newRow("data disk full at the samples")
        << "data" << QStringList({oneSample, "4|Cannot write to temporary file!"});
    QTest::newRow("data device that doesn't seek")
        << "data seek" << QStringList("4|Writing to temporary waveform storage failed.");
    QTest::newRow("marker disk full at the end")
        << "markers" << QStringList({oneSample, "4|Writing to temporary data storage failed."});
}

void TestWvReader::failingStreams()
{
    QFETCH(QString, fault);
    QFETCH(QStringList, log);
    ReadRun run(tgx + one);
    if (fault == "data") {
        run.dataDevice.capacity = 0;
    } else if (fault == "data seek") {
        run.dataDevice.canSeek = false;
    } else {
        run.markerDevice.capacity = 0;
    }
    QVERIFY(!run.read().ok);
    QCOMPARE(run.log, QStringList({tgxLine, finalizing(1, 0)}) + log);
}

void TestWvReader::progressAndCancel()
{
    QByteArray lists;
    for (int i = 0; i < 20'000; ++i) {
        lists += "{MARKER LIST 1: 0:1;1:0}";
    }
    const QByteArray file = tgx + lists + silentBlock(2'000'000);
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
    class SlowDevice : public TestDevice
    {
    protected:
        qint64 writeData(const char *data, qint64 length) override
        {
            const QDeadlineTimer tick(150);
            while (!tick.hasExpired()) {
            }
            return TestDevice::writeData(data, length);
        }
    };
    SlowDevice slow;
    BufferedIO stream;
    QVERIFY(stream.initBuf(&slow, BufferedIO::ReadWrite));
    ReadRun cancelled(file);
    cancelled.info.dataStream = &stream;
    connect(&io, &HvFileIO::ProgressUpdate, &io, &HvFileIO::cancel);
    QVERIFY(!io.readWaveform(&cancelled.info));
    QCOMPARE(log.take().last(), QString("4|Action aborted by user."));
    QVERIFY(slow.bytes.size() < 16'000'000);
    // A cancel is over with its run; another read starts afresh.
    io.disconnect();
    io.cancel();
    ReadRun again(tgx + one);
    QVERIFY(io.readWaveform(&again.info));
}

void TestWvReader::debugWords()
{
    ReadRun run(tgx + "{MARKER LIST 1: 0:0;2:1}{MARKER LIST 2: 0:1}{FREE:}" + silentBlock(4));
    run.read(Tracer::DebugMask);
    QVERIFY(run.ok);
    const QString cut = "2|The list of marker 2 ends high, but the marker falls at position 3, "
                        "where the other lists end.";
    QCOMPARE(run.log,
             QStringList({"16|Processing tag 'TYPE' ...", tgxLine,
                          "16|Processing tag 'MARKER LIST 1' ...",
                          "16|Marker section finished with value 0x1 at pos. 3",
                          "16|Processing tag 'MARKER LIST 2' ...",
                          "16|Marker section finished with value 0x2 at pos. 1",
                          "16|Completing marker trace up to pos. 3", "16|Processing tag 'FREE' ...",
                          noSamples, disagree, takesBlock, noControl(4), finalizing(4, 1), cut,
                          "1|Reading 4 samples @ 16 bit from waveform..."}));
    QCOMPARE(run.markers(), QByteArray("\x02\x02\x03\x01", 4));
}

QTEST_GUILESS_MAIN(TestWvReader)
#include "tst_wvreader.moc"
