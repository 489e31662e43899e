// SPDX-License-Identifier: Apache-2.0
#include "QRegularExpression"
#include "WvTestFile.h"
#include "support/rows.h"
#include "support/seed.h"

#include <QTest>

#include <random>

namespace {

using Transition = std::pair<qint64, int>;

struct MarkerList
{
    int marker = 1;
    QList<Transition> transitions;
};

/// The rules of merging, position by position: one pass over all bytes for each list.
class PlainTrace
{
public:
    void merge(const MarkerList &list)
    {
        const int bit = 1 << (list.marker - 1);
        const QByteArray old = m_bytes;
        QByteArray result;
        qsizetype readAt = 0;
        qint64 pos = 0;
        int current = 0;
        int byte = 0;
        const auto oldByte = [&](qint64 q) {
            return q >= m_written ? m_last & ~bit : int(old.at(readAt++));
        };
        for (const auto &[p, state] : list.transitions) {
            if (p == pos - 1) {
                result += static_cast<char>(byte);
                ++pos;
            } else {
                for (qint64 q = pos; q <= p; ++q) {
                    byte = oldByte(q);
                    if (q == p) {
                        current = state == 1 ? bit : 0;
                    }
                    byte |= current;
                    result += static_cast<char>(byte);
                }
                pos = p + 1;
            }
            if (pos > m_written) {
                m_written = pos;
                m_last = byte;
            }
        }
        for (; pos < m_written; ++pos) {
            result += static_cast<char>(old.at(readAt++) | current);
        }
        m_bytes = result;
    }

    /// The stream after reading `samples` samples under a CONTROL LENGTH.
    QByteArray finished(qint64 controlLength, qint64 samples)
    {
        const auto byte = static_cast<char>(m_last);
        while (m_written < controlLength) {
            m_bytes += byte;
            ++m_written;
        }
        for (qint64 i = 0; i < samples; ++i) {
            if (i > m_written) {
                m_bytes += byte;
            }
        }
        return m_bytes;
    }

private:
    QByteArray m_bytes;
    qint64 m_written = 0;
    int m_last = 0;
};

QByteArray tagOf(const MarkerList &list, std::mt19937 *random = nullptr)
{
    // Blanks and signs are legal and take the general way through the parser.
    const auto decoration = [&]() -> QByteArray {
        return random != nullptr && (*random)() % 20 == 0 ? " " : "";
    };
    QByteArray text;
    for (const auto &[position, state] : list.transitions) {
        text += (text.isEmpty() ? " " : ";") + decoration() + QByteArray::number(position) +
                decoration() + ':' + decoration() + QByteArray::number(state) + decoration();
    }
    return "{MARKER LIST " + QByteArray::number(list.marker) + ':' + text + '}';
}

QByteArray fileOf(const QByteArray &lists, qint64 samples, qint64 controlLength = 0)
{
    QByteArray file = "{TYPE: TGX-WV,0}{SAMPLES:" + QByteArray::number(samples) + '}';
    if (controlLength > 0) {
        file += "{CONTROL LENGTH:" + QByteArray::number(controlLength) + '}';
    }
    return file + lists + silentBlock(samples);
}

/// "12" is the trace 1, 2 of marker bytes.
QByteArray trace(const char *digits)
{
    QByteArray bytes(digits);
    for (char &byte : bytes) {
        byte = static_cast<char>(byte - '0');
    }
    return bytes;
}

} // namespace

class TestMarkerLists : public QObject
{
    Q_OBJECT

private slots:
    void merged();
    void cuts();
    void refused();
    void randomLists();
    void listsOfManyTransitions();
    void controlLengthShorterThanTheSamples();
};

void TestMarkerLists::merged()
{
    forRows({{"one list", "{MARKER LIST 1: 0:1;10:0}", 20, "11111111110000000000"},
             {"no transition", "{MARKER LIST 1: }", 3, "000"},
             {"first one late", "{MARKER LIST 4:3:1}", 6, "000888"},
             {"states that are no 1", "{MARKER LIST 1: 0:7;1:-1;2:1}", 3, "001"},
             {"signs and blanks", "{MARKER LIST 1: +0 : +1 ; 2: 00}", 4, "1100"},
             {"a third number", "{MARKER LIST 1: 0:1:0;2:0:1}", 4, "1100"},
             {"an empty one ends it", "{MARKER LIST 1: 0:1;;2:0}", 4, "1111"},
             {"a control byte", "{MARKER LIST 1: 0:1;2:0\n;3:1}", 5, "11000"},
             {"any name with it", "{MY MARKER LIST 2: 1:1}", 3, "022"}},
            [](const QByteArray &lists, int samples, const char *bytes) {
                ReadRun run(fileOf(lists, samples));
                QVERIFY(run.read().ok);
                QCOMPARE(run.markers(), trace(bytes));
                QCOMPARE(run.info.controlLength, samples);
            });
}

void TestMarkerLists::cuts()
{
    const auto warning = [](int marker, int position) {
        return QString("2|The list of marker %1 ends high, but the marker falls at position %2, "
                       "where the other lists end.")
            .arg(marker)
            .arg(position);
    };
    forRows({{"alone", "{MARKER LIST 1: 0:0;5:1}", {}},
             {"cut", "{MARKER LIST 1: 0:0;9:0}{MARKER LIST 2: 0:1;9:1}", {warning(2, 10)}},
             {"longer by one", "{MARKER LIST 1: 0:0;9:0}{MARKER LIST 2: 0:1;10:1}", {}},
             {"two cut",
              "{MARKER LIST 1: 0:0;9:1}{MARKER LIST 2: 0:1}{MARKER LIST 3: 3:1}",
              {warning(2, 10), warning(3, 10)}},
             {"as long as the samples", "{MARKER LIST 1: 0:0;19:0}{MARKER LIST 2: 0:1}", {}}},
            [](const QByteArray &lists, const QStringList &warnings) {
                ReadRun run(fileOf(lists, 20, 20));
                QVERIFY(run.read().ok);
                QCOMPARE(run.log.filter(QRegularExpression("^2")), warnings);
            });
}

void TestMarkerLists::refused()
{
    forRows(
        {{"index", "5:0:1", "4|Invalid MARKER LIST tag. Index range is 1-4."},
         {"no index", ":0:1", "4|Invalid MARKER LIST tag. Index range is 1-4."},
         {"no state", "1: 0:1;7",
          "4|Unsupported MARKER LIST format. Use transition format.|4|'MARKER LIST 1' -> '7'"},
         {"no number", "1: 0:1;a:1", "4|Invalid MARKER LIST tag data.|4|'MARKER LIST 1' -> 'a:1'"},
         {"large number", "2: 99999999999999999999:0",
          "4|Invalid MARKER LIST tag data.|4|'MARKER LIST 2' -> '99999999999999999999:0'"},
         {"negative", "1: -1:1", "4|Marker position cannot be zero."},
         {"backwards", "1: 5:1;3:0",
          "4|Marker positions seem to go backwards.|4| old pos. = 6, new pos. = 3"},
         {"two states", "1: 5:1;5:0", "4| Same Marker position used with two states.|4| pos. = 5"},
         {"largest number", "1: 9223372036854775807:1", "4| Marker position value is too large."},
         {"endless", "1: " + QByteArray(1025, '1'),
          "4|Tag content exceeds limit.|4|Error in MARKER LIST tag."}},
        [](const QByteArray &list, const QString &log) {
            ReadRun run(fileOf("{MARKER LIST " + list + '}', 20));
            QVERIFY(!run.read().ok);
            QCOMPARE(run.log.join('|'), "1|Format is TGX waveform.|" + log);
        });
    // The limit itself is the last position that passes.
    const QByteArray rest = fileOf("{MARKER LIST 1: 00:1}", 20);
    const QByteArray last = QByteArray::number(rest.size() / 4);
    QCOMPARE(last.size(), 2);
    QVERIFY(ReadRun(QByteArray(rest).replace("00:1", last + ":1")).read().ok);
    const QByteArray next = QByteArray::number(rest.size() / 4 + 1);
    QVERIFY(!ReadRun(QByteArray(rest).replace("00:1", next + ":1")).read().ok);
}

void TestMarkerLists::randomLists()
{
    std::mt19937 random = randomGenerator();
    forRows({{"short lists", 200, 12}, {"long lists", 10, 3000}}, [&](int rounds, int longest) {
        const auto upTo = [&](int limit) {
            return static_cast<int>(random() % unsigned(limit + 1));
        };
        for (int round = 0; round < rounds; ++round) {
            const int samples = 1 + upTo(3 * longest);
            const int controlLength = upTo(1) == 0 ? 0 : 1 + upTo(samples + 5);
            PlainTrace expected;
            QByteArray tags;
            for (int count = upTo(7); count > 0; --count) {
                MarkerList list{1 + upTo(3), {}};
                qint64 position = upTo(1) == 0 ? 0 : upTo(longest);
                int state = upTo(1);
                const int step = 1 + upTo(9);
                for (int i = upTo(longest); i > 0 && position < samples; --i) {
                    list.transitions.append({position, state});
                    if (upTo(15) != 0) { // else the same once more
                        position = list.transitions.last().first + 1 + upTo(step);
                        state = upTo(1);
                    }
                }
                // A repeated position pushes the list on by one; the rules look at that place then.
                qint64 pos = 0;
                QList<Transition> valid;
                for (const Transition &item : list.transitions) {
                    const bool repeated = !valid.isEmpty() && item.first == pos - 1;
                    if (item.first < pos - 1 || (repeated && item.second != valid.last().second)) {
                        continue;
                    }
                    pos = repeated ? pos + 1 : item.first + 1;
                    valid.append(item);
                }
                list.transitions = valid;
                tags += tagOf(list, &random);
                expected.merge(list);
            }
            ReadRun run(fileOf(tags, samples, controlLength));
            run.read();
            QVERIFY2(run.ok, qPrintable(run.log.join('\n')));
            const QByteArray bytes =
                expected.finished(controlLength > 0 ? controlLength : samples, samples);
            if (run.markers() != bytes) {
                QFAIL(tags.left(2000).constData());
            }
        }
    });
}

/// So many transitions that they are no longer held in memory in one piece.
void TestMarkerLists::listsOfManyTransitions()
{
    constexpr int samples = 900'000;
    PlainTrace expected;
    QByteArray tags;
    for (int marker = 1; marker <= 4; ++marker) {
        MarkerList list{marker, {}};
        const int period = marker + 1;
        for (int position = 0; position < samples - 100 * marker; position += period) {
            list.transitions.append({position, position / period % 2});
        }
        tags += tagOf(list);
        expected.merge(list);
    }
    ReadRun run(fileOf(tags, samples));
    run.read();
    QVERIFY2(run.ok, qPrintable(run.log.join('\n')));
    QVERIFY(run.markers() == expected.finished(samples, samples));
}

/// The carried byte goes on from the sample behind the next one.
void TestMarkerLists::controlLengthShorterThanTheSamples()
{
    ReadRun run(fileOf("{MARKER LIST 1: 0:0;1:1}", 10, 4));
    QVERIFY(run.read().ok);
    QCOMPARE(run.info.controlLength, 4);
    QCOMPARE(run.markers(), trace("011111111"));
    ReadRun longer(fileOf("{MARKER LIST 1: 0:0;1:1}", 3, 6));
    QVERIFY(longer.read().ok);
    QCOMPARE(longer.markers(), trace("011111"));
}

QTEST_GUILESS_MAIN(TestMarkerLists)
#include "tst_markerlists.moc"
