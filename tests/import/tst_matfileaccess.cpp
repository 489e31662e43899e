// SPDX-License-Identifier: Apache-2.0
#include "import/MatFileAccess.h"
#include "importsupport.h"
#include "support/files.h"
#include "support/logreader.h"
#include "support/rows.h"
#include "support/wvbytes.h"

#include <QTest>

#include <cmath>

namespace {

QByteArray number(quint32 value)
{
    return littleEndian(value);
}

QByteArray header(quint16 version = 0x0100, quint16 indicator = 0x4D49)
{
    return QByteArray("Made by a test").leftJustified(116, '\0') + QByteArray(8, '\0') +
           littleEndian(version) + littleEndian(indicator);
}

/// A sub-element with its tag, filled up to a multiple of 8.
QByteArray part(quint32 type, const QByteArray &bytes)
{
    return number(type) + number(static_cast<quint32>(bytes.size())) + bytes +
           QByteArray((8 - bytes.size() % 8) % 8, '\0');
}

QByteArray doubles(const QList<double> &values)
{
    QByteArray bytes;
    for (const double value : values) {
        bytes += littleEndian(value);
    }
    return bytes;
}

constexpr quint32 complexFlag = 0x800;

QByteArray start(quint32 flags, const QList<quint32> &dimensions, const QByteArray &name)
{
    QByteArray sizes;
    for (const quint32 size : dimensions) {
        sizes += number(size);
    }
    return part(6, number(flags) + number(0)) + part(5, sizes) +
           (name.size() == 3 ? number(0x00030001) + name + '\0' : part(1, name));
}

QByteArray matrix(const QByteArray &content)
{
    return number(14) + number(static_cast<quint32>(content.size())) + content;
}

QByteArray compressed(const QByteArray &element)
{
    const QByteArray bytes = qCompress(element).mid(4);
    return number(15) + number(static_cast<quint32>(bytes.size())) + bytes;
}

const QByteArray twoReal = part(9, doubles({0.25, -0.5}));
const QByteArray twoImag = part(9, doubles({1, 0.125}));

/// What reading a variable ends with: its floats, or the errors of the log.
struct Outcome
{
    std::vector<float> values;
    QStringList errors;
};

Outcome readFile(MatFileAccess &file, const QString &path, const QString &name, qint64 limit = 0)
{
    static_cast<void>(takeLog());
    TempStream stream;
    Outcome outcome;
    if (file.open(path) && stream.open() && file.readDirectory() &&
        file.readVariable(name, stream.stream(), &limit)) {
        outcome.values = floatsOf(stream);
    }
    outcome.errors = takeMessages(Tracer::Error);
    return outcome;
}

} // namespace

class TestMatFileAccess : public QObject
{
    Q_OBJECT

private slots:
    void readsWhatBytesSay();
    void refusesWithItsWords();
    void convertsEachType();
    void boundsInflation();
    void readsFilesOfScipy();

private:
    TestFolder m_folder;
};

void TestMatFileAccess::readsWhatBytesSay()
{
    const std::vector<float> both{0.25F, 1, -0.5F, 0.125F};
    forRows({{"row", start(complexFlag | 6, {1, 2}, "abc"), "abc", 0, both},
             {"column", start(complexFlag | 6, {2, 1}, "longer"), "longer", 0, both},
             {"name of 40", start(complexFlag | 6, {2, 1}, QByteArray(40, 'n')),
              QByteArray(40, 'n'), 0, both},
             {"limit", start(complexFlag | 6, {1, 2}, "abc"), "abc", 1, {0.25F, 1}},
             {"limit beyond", start(complexFlag | 6, {1, 2}, "abc"), "abc", 5, both}},
            [this](const QByteArray &head, const QByteArray &name, int limit,
                   const std::vector<float> &values) {
                // An element of another kind stands before and behind.
                QVERIFY(m_folder.store("a.mat", header() + part(2, "xyz") +
                                                    compressed(matrix(head + twoReal + twoImag)) +
                                                    number(0x00020003) + "ab"));
                MatFileAccess file;
                const Outcome outcome = readFile(file, m_folder.path("a.mat"), name, limit);
                QCOMPARE(outcome.errors, QStringList());
                QCOMPARE(outcome.values, values);
                QCOMPARE(file.description(), "Made by a test");
            });
}

void TestMatFileAccess::refusesWithItsWords()
{
    const QByteArray good = start(complexFlag | 6, {1, 2}, "abc");
    const auto file = [](const QByteArray &content) {
        return header() + compressed(matrix(content));
    };
    const QString levelFive = "This file does not seem to be a level 5 MAT.file.";
    forRows(
        {
            {"empty", QByteArray(), "Cannot read inital 4 bytes from file."},
            {"level 4", QByteArray(128, '\0'), levelFive},
            {"big endian", header(0x0001, 0x494D), levelFive},
            {"7.3", "MATLAB 7.3 MAT-file" + header(0x0200).mid(19),
             levelFive + " It is a MATLAB 7.3 file (HDF5): save it with 'save -v7'."},
            {"indicator", header(0x0100, 0x1234), "Invalid endian indicator tag."},
            {"small type", header() + number(0x00010013) + "abcd", "Invalid data type: 19"},
            {"regular cut", header() + number(2), "Cannot read number of bytes of matrix element."},
            {"class", file(part(6, number(14) + number(0))),
             "Invalid class ID in array flags subelement."},
            {"flags cut", file(number(6) + number(8)), "Cannot read array flags from subelement."},
            {"long name", file(part(6, number(6) + number(0)) + part(1, QByteArray(1025, 'n'))),
             "Length of name subelement is > 1024 characters."},
            {"dimensions cut", file(part(6, number(6) + number(0)) + number(5) + number(99)),
             "Cannot read dimension information from subelement."},
            {"many dimensions",
             file(part(6, number(6) + number(0)) + number(5) + number(0xFFFFFFFC)),
             "Cannot read dimension information from subelement."},
            {"type 8", file(good + part(8, "12345678")), "Size of data sub element is zero."},
            {"other name", file(start(complexFlag | 6, {1, 2}, "abd") + twoReal + twoImag),
             "Variable not found in directory."},
            {"real", file(start(6, {1, 2}, "abc") + twoReal), "Variable is not of type COMPLEX."},
            {"single", file(start(complexFlag | 7, {1, 2}, "abc") + twoReal + twoImag),
             "Array must be of type DOUBLE."},
            {"three dimensions", file(start(complexFlag | 6, {1, 2, 1}, "abc") + twoReal + twoImag),
             "Array must have two dimensions."},
            {"scalar", file(start(complexFlag | 6, {1, 1}, "abc") + twoReal + twoImag),
             "Array dimensions must be 1xN or Nx1."},
            {"unequal parts", file(good + twoReal + part(9, doubles({1, 2, 3}))),
             "Length of real and imaginary data do not match."},
            {"data cut", file(good + twoReal + twoImag.left(16)), "Data index is out of range."},
            {"not compressed", header() + matrix(good + twoReal + twoImag),
             "TO DO: !!! Evaluate data of uncompressed elements !!!"},
        },
        [this](const QByteArray &bytes, const QString &words) {
            QVERIFY(m_folder.store("b.mat", bytes));
            MatFileAccess reader;
            const Outcome outcome = readFile(reader, m_folder.path("b.mat"), "abc");
            QCOMPARE(outcome.errors.value(0), words);
        });
}

void TestMatFileAccess::convertsEachType()
{
    // Real and imaginary parts may be of different types.
    forRows({{"int8", 1, QByteArray("\x01\xFF", 2), {1, -1}},
             {"uint8", 2, QByteArray("\x01\xFF", 2), {1, 255}},
             {"int16", 3, QByteArray("\x01\x00\xFE\xFF", 4), {1, -2}},
             {"uint16", 4, QByteArray("\x01\x00\xFE\xFF", 4), {1, 65534}},
             {"int32", 5, number(7) + number(0xFFFFFFF0), {7, -16}},
             {"uint32", 6, number(7) + number(0xF0000000), {7, 4026531840.0F}},
             {"float", 7, littleEndian(1.5F) + littleEndian(-2.5F), {1.5F, -2.5F}},
             {"int64", 12, littleEndian(qint64(5)) + littleEndian(qint64(-5)), {5, -5}},
             {"uint64",
              13,
              littleEndian(quint64(5)) + littleEndian(quint64(1) << 63U),
              {5, 9223372036854775808.0F}}},
            [this](int type, const QByteArray &bytes, const std::vector<float> &values) {
                QVERIFY(m_folder.store(
                    "c.mat", header() + compressed(matrix(start(complexFlag | 6, {1, 2}, "abc") +
                                                          part(static_cast<quint32>(type), bytes) +
                                                          twoImag))));
                MatFileAccess file;
                const Outcome outcome = readFile(file, m_folder.path("c.mat"), "abc");
                QCOMPARE(outcome.values, (std::vector<float>{values[0], 1, values[1], 0.125F}));
            });
}

void TestMatFileAccess::boundsInflation()
{
    // 64 MiB of zeros in 64 KiB, of which the element declares nothing.
    const QByteArray content = start(complexFlag | 6, {1, 2}, "abc") + twoReal + twoImag;
    QVERIFY(m_folder.store("d.mat",
                           header() + compressed(matrix(content) + QByteArray(1 << 26, '\0'))));
    MatFileAccess file;
    QVERIFY(file.open(m_folder.path("d.mat")));
    static_cast<void>(takeLog());
    QVERIFY(!file.readDirectory());
    QCOMPARE(takeMessages(Tracer::Error),
             (QStringList{QString("Decompression: More data than the %1 bytes that the element "
                                  "declares.")
                              .arg(8 + content.size()),
                          "Uncompressing data failed."}));

    QByteArray damaged = header() + compressed(matrix(content));
    damaged[140] = static_cast<char>(~damaged[140]);
    QVERIFY(m_folder.store("d.mat", damaged) && file.open({}) && !file.readDirectory());
    QCOMPARE(takeMessages(Tracer::Error).value(0), "Decompression: zlib inflate() returned error.");

    QVERIFY(m_folder.store("d.mat", header() + number(15) + number(0xFFFFFFFF) + "x"));
    QVERIFY(file.open({}) && !file.readDirectory());
    QCOMPARE(takeMessages(Tracer::Error).mid(0, 3),
             (QStringList{"Decompression: Not enough data available from input stream.",
                          "Decompression: Bytes requested: 262144",
                          "Decompression: Bytes received: 1"}));
}

void TestMatFileAccess::readsFilesOfScipy()
{
    constexpr int samples = 70001; // more than two blocks
    QVERIFY(runPython(m_folder.path(), QString("n = np.arange(%1)\n"
                                               "z = np.cos(0.001 * n) - 0.5j * np.sin(0.003 * n)\n"
                                               "names = {'n' * k: z for k in (3, 5, 17, 31)}\n"
                                               "names.update(col=z.reshape(-1, 1), a=z, ab=z, "
                                               "abcd=z, text='text', real=n * 1.0)\n"
                                               "io.savemat('packed.mat', names, "
                                               "do_compression=True)\n"
                                               "io.savemat('plain.mat', names)\n")
                                           .arg(samples)));
    std::vector<float> expected;
    for (int n = 0; n < samples; ++n) {
        expected.push_back(static_cast<float>(std::cos(0.001 * n)));
        expected.push_back(static_cast<float>(-0.5 * std::sin(0.003 * n)));
    }
    MatFileAccess file;
    for (const QString &name :
         {QString(3, 'n'), QString(5, 'n'), QString(17, 'n'), QString(31, 'n'), QString("col")}) {
        const Outcome outcome = readFile(file, m_folder.path("packed.mat"), name);
        QCOMPARE(outcome.errors, QStringList());
        QCOMPARE(outcome.values.size(), expected.size());
        for (size_t i = 0; i < expected.size(); ++i) {
            // Both sides round the same double, but for the last bit of their sines.
            QVERIFY(std::fabs(outcome.values[i] - expected[i]) <= 6e-8F);
        }
    }
    QCOMPARE(file.directory().size(), 10);
    for (const char *nameless : {"a", "ab", "abcd"}) {
        QCOMPARE(readFile(file, m_folder.path("packed.mat"), nameless).errors,
                 QStringList("Variable not found in directory."));
    }
    QCOMPARE(readFile(file, m_folder.path("plain.mat"), "col").errors,
             QStringList("TO DO: !!! Evaluate data of uncompressed elements !!!"));
    QCOMPARE(file.directory().size(), 10);
}

QTEST_GUILESS_MAIN(TestMatFileAccess)
#include "tst_matfileaccess.moc"
