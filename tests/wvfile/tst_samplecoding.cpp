// SPDX-License-Identifier: Apache-2.0
#include "support/seed.h"
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
    void decodesEveryWord();
    void encodesAnything();
};

void TestSampleCoding::decodesEveryWord()
{
    const std::vector<std::byte> words = allWords();
    for (const float gain : {1.0F, 0.5F, 1.9952623F}) {
        for (const SampleCoding kind :
             {SampleCoding::A, SampleCoding::B, SampleCoding::C, SampleCoding::D}) {
            std::vector<float> values(wordCount);
            decodeWords(kind, words, gain, values);
            for (int word = 0; word < wordCount; ++word) {
                // The quotient of two such numbers rounds to the same float on the way over a
                // double.
                const float expected = static_cast<float>(plainValue(kind, word)) * gain;
                QVERIFY2(values.at(static_cast<size_t>(word)) == expected,
                         qPrintable(QString::number(word)));
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
    }
}

void TestSampleCoding::encodesAnything()
{
    QCOMPARE(plainWord(0.5F), 16384);
    QCOMPARE(plainWord(std::numeric_limits<float>::quiet_NaN()), 32767);
    std::mt19937 random = randomGenerator();
    std::uniform_real_distribution<float> around(-1.1F, 1.1F);
    std::vector<float> values(1'000'003);
    for (size_t i = 0; i < values.size(); ++i) {
        const auto bits = static_cast<quint32>(random());
        values[i] = around(random);
        if (i % 8 == 0) { // any bit pattern at all, numbers or none
            std::memcpy(&values[i], &bits, sizeof bits);
        }
    }
    values.front() = 1;
    values.back() = -1;
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

QTEST_GUILESS_MAIN(TestSampleCoding)
#include "tst_samplecoding.moc"
