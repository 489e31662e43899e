// SPDX-License-Identifier: Apache-2.0
#include "instrument/dnsmessage.h"
#include "simulator/Announcer.h"

#include <QTest>

using namespace simulator;

namespace {

std::vector<std::uint8_t> answerOf(const QByteArray &query, const Announcement &instrument)
{
    const std::span bytes(reinterpret_cast<const std::uint8_t *>(query.constData()),
                          static_cast<std::size_t>(query.size()));
    return answerTo(bytes, instrument, true);
}

} // namespace

/// What an instrument announces, read by the side that searches.
class TestAnnouncer : public QObject
{
    Q_OBJECT

private slots:
    void answersWhatItServes();
    void leavesTheRest();
};

void TestAnnouncer::answersWhatItServes()
{
    const Announcement instrument{"10.0.0.7", "TGX-870", "100001", "1.0", true, false};
    const QByteArray query =
        dnsQuery({"_hislip._tcp.local", "_scpi-raw._tcp.local", "_VXI-11._tcp.local"});
    // As other searches write it: the second name and the third lead to the end of the first.
    QByteArray compressed = query;
    compressed.replace(QByteArray("\x04_tcp\x05local\0", 12), QByteArray("\xC0\x14", 2));
    compressed.replace(12 + 8, 2, QByteArray("\x04_tcp\x05local\0", 12));
    QCOMPARE(compressed.size(), query.size() - 20);
    for (const QByteArray &asked : {query, compressed}) {
        const std::vector<std::uint8_t> answer = answerOf(asked, instrument);
        const auto records = dnsRecords(
            QByteArray(reinterpret_cast<const char *>(answer.data()), std::ssize(answer)));
        QVERIFY(records);
        QStringList found;
        for (const DnsRecord &record : *records) {
            if (record.type == DnsRecord::Service) {
                found.append(QString("%1 %2 %3").arg(record.name, record.target).arg(record.port));
            }
        }
        QCOMPARE(found,
                 QStringList({"TGX-870 100001._hislip._tcp.local TGX-870-100001.local 4880",
                              "TGX-870 100001._vxi-11._tcp.local TGX-870-100001.local 111"}));
    }
}

void TestAnnouncer::leavesTheRest()
{
    const Announcement instrument{"10.0.0.7", "TGX-870", "100001", "1.0", true, true};
    QVERIFY(answerOf(dnsQuery({"_printer._tcp.local"}), instrument).empty());
    const QByteArray query = dnsQuery({"_lxi._tcp.local"});
    for (qsizetype size = 0; size < query.size(); ++size) {
        QVERIFY(answerOf(query.first(size), instrument).empty());
    }
    QByteArray answer = query;
    answer[2] = '\x84';
    QVERIFY(answerOf(answer, instrument).empty());
}

QTEST_GUILESS_MAIN(TestAnnouncer)
#include "tst_announcer.moc"
