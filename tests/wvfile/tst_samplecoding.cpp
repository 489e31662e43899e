// SPDX-License-Identifier: Apache-2.0
#include "streams/levels.h"
#include "wvfile/SampleCoding.h"

#include <QTest>

#include <cmath>
#include <cstring>
#include <limits>
#include <random>
#include <vector>

namespace {

constexpr int wordCount = 65536;

/// Every word once, in the byte order of a file.
std::vector<std::byte> allWords()
{
    std::vector<std::byte> bytes;
    for (int word = 0; word < wordCount; ++word) {
        bytes.push_back(static_cast<std::byte>(word & 0xFF));
        bytes.push_back(static_cast<std::byte>(word >> 8));
    }
    return bytes;
}

int signedWord(int word)
{
    return word < 32768 ? word : word - 65536;
}

/// The codings by the book, in double precision.
double plainValue(SampleCoding coding, int word)
{
    switch (coding) {
    case SampleCoding::A:
        return (signedWord(word) - 0.5) / 32767;
    case SampleCoding::B:
        return signedWord(word) / 32767.0;
    case SampleCoding::C:
        return signedWord(word ^ 0x8000) / 32767.0;
    case SampleCoding::D:
        return ((word & 0xFFFC) - 32768.5) / 32000;
    }
    return 0;
}

/// Single precision, step by step.
int plainWord(float value)
{
    if (value >= -1.0F && value <= 1.0F) {
        const float product = value * 32767.0F;
        const float sum = product + 0.5F;
        return static_cast<int>(sum);
    }
    return value < -1.0F ? -32767 : 32767;
}

} // namespace

class TestSampleCoding : public QObject
{
    Q_OBJECT

private slots:
    void decodesEveryWord_data();
    void decodesEveryWord();
    void everyWordComesBack();
    void encodesTable_data();
    void encodesTable();
    void encodesAnything();
    void levelsInOrder();
};

void TestSampleCoding::decodesEveryWord_data()
{
    QTest::addColumn<int>("coding");
    QTest::addColumn<float>("gain");
    for (const float gain : {1.0F, 0.5F, 1.9952623F}) {
        QTest::addRow("A, gain %g", double(gain)) << int(SampleCoding::A) << gain;
        QTest::addRow("B, gain %g", double(gain)) << int(SampleCoding::B) << gain;
        QTest::addRow("C, gain %g", double(gain)) << int(SampleCoding::C) << gain;
        QTest::addRow("D, gain %g", double(gain)) << int(SampleCoding::D) << gain;
    }
}

void TestSampleCoding::decodesEveryWord()
{
    QFETCH(int, coding);
    QFETCH(float, gain);
    const auto kind = static_cast<SampleCoding>(coding);
    const std::vector<std::byte> words = allWords();
    std::vector<float> values(wordCount);
    decodeWords(kind, words, gain, values);
    for (int word = 0; word < wordCount; ++word) {
        // The quotient of two such numbers rounds to the same float on the way over a double.
        const float expected = static_cast<float>(plainValue(kind, word)) * gain;
        if (values.at(static_cast<size_t>(word)) != expected) {
            QFAIL(qPrintable(QString("word %1").arg(word)));
        }
    }
    // Any length, any address.
    std::vector<std::byte> shifted(words.size() + 1);
    std::memcpy(shifted.data() + 1, words.data(), words.size());
    for (const size_t count : {0U, 1U, 2U, 3U, 15U, 17U, 4095U, 4097U, 12289U}) {
        std::vector<float> some(count + 1, 7.0F);
        decodeWords(kind, std::span(shifted).subspan(1, 2 * count), gain,
                    std::span(some).first(count));
        QVERIFY(std::equal(some.begin(), some.end() - 1, values.begin()));
        QCOMPARE(some.back(), 7.0F);
    }
}

void TestSampleCoding::everyWordComesBack()
{
    const std::vector<std::byte> words = allWords();
    std::vector<float> values(wordCount);
    decodeWords(SampleCoding::A, words, 1.0F, values);
    std::vector<std::byte> back(words.size());
    encodeWords(values, back);
    for (int word = 0; word < wordCount; ++word) {
        const auto at = 2 * static_cast<size_t>(word);
        const int got =
            std::to_integer<int>(back.at(at)) + 256 * std::to_integer<int>(back.at(at + 1));
        // -32768 lies beyond full scale; the writer has no such word.
        QCOMPARE(signedWord(got), std::max(signedWord(word), -32767));
    }
    // What has been written once doesn't change any more.
    std::vector<float> again(wordCount);
    decodeWords(SampleCoding::A, back, 1.0F, again);
    std::vector<std::byte> twice(words.size());
    encodeWords(again, twice);
    QVERIFY(twice == back);
}

void TestSampleCoding::encodesTable_data()
{
    QTest::addColumn<float>("value");
    QTest::addColumn<int>("word");
    const float infinity = std::numeric_limits<float>::infinity();
    QTest::newRow("one") << 1.0F << 32767;
    QTest::newRow("minus one") << -1.0F << -32766;
    QTest::newRow("zero") << 0.0F << 0;
    QTest::newRow("minus zero") << -0.0F << 0;
    QTest::newRow("zero as read") << -0.5F / 32767 << 0;
    QTest::newRow("half") << 0.5F << 16384;
    QTest::newRow("minus half") << -0.5F << -16383;
    QTest::newRow("above") << 1.5F << 32767;
    QTest::newRow("below") << -1.5F << -32767;
    QTest::newRow("just above") << std::nextafter(1.0F, 2.0F) << 32767;
    QTest::newRow("just below") << std::nextafter(-1.0F, -2.0F) << -32767;
    QTest::newRow("infinite") << infinity << 32767;
    QTest::newRow("minus infinite") << -infinity << -32767;
    QTest::newRow("largest") << std::numeric_limits<float>::max() << 32767;
    QTest::newRow("smallest") << std::numeric_limits<float>::denorm_min() << 0;
    QTest::newRow("no number") << std::numeric_limits<float>::quiet_NaN() << 32767;
    QTest::newRow("no number, negative") << -std::numeric_limits<float>::quiet_NaN() << 32767;
}

void TestSampleCoding::encodesTable()
{
    QFETCH(float, value);
    QFETCH(int, word);
    QCOMPARE(int(encodeWord(value)), word);
    QCOMPARE(plainWord(value), word);
    // In a block all places must agree, also those of the vector loop.
    const std::vector<float> values(67, value);
    std::vector<std::byte> words(2 * values.size());
    encodeWords(values, words);
    for (size_t i = 0; i < values.size(); ++i) {
        qint16 got = 0;
        std::memcpy(&got, words.data() + 2 * i, 2);
        QCOMPARE(int(got), word);
    }
}

void TestSampleCoding::encodesAnything()
{
    const unsigned seed = std::random_device{}();
    qInfo("seed %u", seed);
    std::mt19937 random(seed);
    std::uniform_real_distribution<float> around(-1.1F, 1.1F);
    std::vector<float> values(1'000'003);
    for (size_t i = 0; i < values.size(); ++i) {
        const auto bits = static_cast<quint32>(random());
        values[i] = around(random);
        if (i % 8 == 0) { // any bit pattern at all
            std::memcpy(&values[i], &bits, sizeof bits);
        }
    }
    std::vector<std::byte> words(2 * values.size());
    encodeWords(values, words);
    for (size_t i = 0; i < values.size(); ++i) {
        qint16 got = 0;
        std::memcpy(&got, words.data() + 2 * i, 2);
        if (got != plainWord(values[i]) || got != encodeWord(values[i])) {
            QFAIL(qPrintable(QString::number(values[i], 'g', 9)));
        }
    }
}

void TestSampleCoding::levelsInOrder()
{
    std::mt19937 random(1);
    std::uniform_real_distribution<float> around(-2, 2);
    std::vector<float> values(20'014);
    for (float &value : values) {
        value = around(random);
    }
    LevelSums expected;
    for (size_t i = 0; i < values.size(); i += 2) {
        const double power =
            static_cast<double>(values[i]) * static_cast<double>(values[i]) +
            static_cast<double>(values[i + 1]) * static_cast<double>(values[i + 1]);
        expected.sum += power;
        expected.peak = std::max(expected.peak, power);
    }
    for (const size_t block : {2U, 6U, 14U, 512U, 514U, 20014U}) {
        LevelSums sums;
        for (size_t done = 0; done < values.size(); done += block) {
            addLevels(std::span(values).subspan(done, std::min(block, values.size() - done)), sums);
        }
        // Bit by bit: the order of the additions is part of the result.
        QVERIFY(sums.sum == expected.sum && sums.peak == expected.peak);
    }
}

QTEST_GUILESS_MAIN(TestSampleCoding)
#include "tst_samplecoding.moc"
