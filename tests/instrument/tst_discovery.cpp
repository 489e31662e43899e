// SPDX-License-Identifier: Apache-2.0
// The messages of the search for instruments, and what is made of the answers. The bytes are put
// together here by the standards' own diagrams.
#include "instrument/LanSearch.h"
#include "instrument/portmapmessage.h"
#include "jobs/instrument/LanScanJob.h"

#include <QTest>

namespace {

/// A pointer to a service instance and its service record, whose names share their ends.
const QByteArray twoRecords =
    QByteArray::fromHex("000084000000000200000000") +
    QByteArray("\x07_hislip\x04_tcp\x05local\0", 20) +                               // at 12
    QByteArray::fromHex("000c0001000000780006") + QByteArray("\x03TGX\xc0\x0c", 6) + // at 42
    QByteArray("\xc0\x2a", 2) + QByteArray::fromHex("0021800100000078000d0000000013b0") +
    QByteArray("\x04host\xc0\x19", 7);

} // namespace

class TestDiscovery : public QObject
{
    Q_OBJECT
private slots:
    void query();
    void records();
    void brokenRecords();
    void portMapper();
    void mergesAnswers();
    void mergesInstruments();
};

void TestDiscovery::query()
{
    QCOMPARE(dnsQuery({"_lxi._tcp.local"}), QByteArray::fromHex("000000000001000000000000") +
                                                QByteArray("\x04_lxi\x04_tcp\x05local\0", 17) +
                                                QByteArray::fromHex("000c8001"));
}

void TestDiscovery::records()
{
    const auto found = dnsRecords(twoRecords);
    QVERIFY(found && found->size() == 2);
    QCOMPARE(found->at(0).name, "_hislip._tcp.local");
    QCOMPARE(found->at(0).target, "TGX._hislip._tcp.local");
    QCOMPARE(found->at(1).name, "TGX._hislip._tcp.local");
    QCOMPARE(found->at(1).port, quint16{5040});
    QCOMPARE(found->at(1).target, "host.local");
}

void TestDiscovery::brokenRecords()
{
    for (qsizetype length = 0; length < twoRecords.size(); ++length) {
        QVERIFY(!dnsRecords(twoRecords.left(length)));
    }
    // A question is no answer, and a name that leads to itself has no end.
    QVERIFY(!dnsRecords(dnsQuery(LanSearch::services())));
    QVERIFY(!dnsRecords(QByteArray::fromHex("000084000001000000000000c00c000c0001")));
    QVERIFY(!dnsRecords(QByteArray::fromHex("00008400ffffffffffffffff")));
}

void TestDiscovery::portMapper()
{
    QCOMPARE(coreChannelCall(0x01020304),
             QByteArray::fromHex("010203040000000000000002000186a00000000200000003"
                                 "00000000000000000000000000000000"
                                 "000607af000000010000000600000000"));
    const QByteArray reply =
        QByteArray::fromHex("01020304000000010000000000000000000000000000000000000400");
    QCOMPARE(coreChannelPort(reply, 0x01020304).value_or(0), quint16{1024});
    QVERIFY(!coreChannelPort(reply, 0x01020305));
    QVERIFY(!coreChannelPort(reply.left(27), 0x01020304));
}

void TestDiscovery::mergesAnswers()
{
    LanSearch search;
    const QHostAddress host("192.0.2.7");
    search.addRecords(host, *dnsRecords(twoRecords));
    search.addRecords(host,
                      {{.name = "x._scpi-raw._tcp.local",
                        .type = DnsRecord::Service,
                        .target = "h",
                        .port = 5025},
                       {.name = "_lxi._tcp.local", .type = DnsRecord::Pointer, .target = "x"}});
    search.addRecords(QHostAddress("192.0.2.8"),
                      {{.name = "_ipp._tcp.local", .type = DnsRecord::Pointer, .target = "x"}});
    QCOMPARE(search.found().size(), 1);
    QCOMPARE(search.found().first().resources, (QStringList{"TCPIP::192.0.2.7::hislip0,5040::INSTR",
                                                            "TCPIP::192.0.2.7::5025::SOCKET"}));
}

void TestDiscovery::mergesInstruments()
{
    LanScanJob job;
    LanInstrument wired{.summary = {}, .found = {"vxi11"}, .resources = {"TCPIP::a::INSTR"}};
    wired.summary.model = "TGX-870";
    wired.summary.serial = "100001";
    LanInstrument other = wired;
    other.found = {"mdns"};
    other.resources = {"TCPIP::b::hislip0::INSTR"};
    job.add(wired);
    job.add(other);
    other.summary.serial = "100002";
    job.add(other);
    QCOMPARE(job.found().size(), 2);
    QCOMPARE(job.found().first().found, (QStringList{"vxi11", "mdns"}));
    QCOMPARE(job.found().first().resources.size(), 2);
}

QTEST_GUILESS_MAIN(TestDiscovery)
#include "tst_discovery.moc"
