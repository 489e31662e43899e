// SPDX-License-Identifier: Apache-2.0
#include "dnsmessage.h"

#include <QtEndian>

namespace {

constexpr qsizetype HeaderBytes = 12;
constexpr quint16 ResponseFlag = 0x8000;
constexpr quint16 ClassInternet = 1;
constexpr quint16 UnicastAnswer = 0x8000;

void appendNumber(QByteArray &message, quint16 number)
{
    message.append(static_cast<char>(number >> 8));
    message.append(static_cast<char>(number & 0xFF));
}

/// Takes a message apart from front to back; after a failure it stays at its end.
class Cursor
{
public:
    explicit Cursor(const QByteArray &message)
        : m_message(message)
    {
    }

    [[nodiscard]] bool isGood() const { return m_isGood; }
    [[nodiscard]] qsizetype place() const { return m_place; }

    void skip(qsizetype count)
    {
        m_isGood = m_isGood && count <= m_message.size() - m_place;
        m_place += m_isGood ? count : 0;
    }

    quint16 number()
    {
        const qsizetype place = m_place;
        skip(2);
        return m_isGood ? qFromBigEndian<quint16>(m_message.constData() + place) : quint16{0};
    }

    QString name()
    {
        // A name may lead to one that stands before it, so that what follows it lies behind the
        // first of the pointers. A chain of more is a loop.
        constexpr int MaxPointers = 16;
        constexpr quint8 PointerMark = 0xC0;
        QStringList labels;
        qsizetype end = -1;
        for (int pointers = 0; m_isGood && pointers <= MaxPointers;) {
            const quint8 length = byte();
            if (length >= PointerMark) {
                const qsizetype target = (length & ~PointerMark) << 8 | byte();
                end = end < 0 ? m_place : end;
                m_place = target;
                m_isGood = m_isGood && target < m_message.size();
                ++pointers;
                continue;
            }
            if (length == 0) {
                m_place = end < 0 ? m_place : end;
                return labels.join('.');
            }
            const qsizetype place = m_place;
            skip(length);
            labels.append(QString::fromUtf8(m_message.mid(place, m_isGood ? length : 0)));
        }
        m_isGood = false;
        return {};
    }

private:
    quint8 byte()
    {
        const qsizetype place = m_place;
        skip(1);
        return m_isGood ? static_cast<quint8>(m_message.at(place)) : quint8{0};
    }

    const QByteArray &m_message;
    qsizetype m_place = 0;
    bool m_isGood = true;
};

} // namespace

QByteArray dnsQuery(const QStringList &services)
{
    QByteArray message(HeaderBytes, '\0');
    qToBigEndian(static_cast<quint16>(services.size()), message.data() + 4);
    for (const QString &service : services) {
        for (const QByteArray &label : service.toUtf8().split('.')) {
            message.append(static_cast<char>(label.size()));
            message.append(label);
        }
        message.append('\0');
        appendNumber(message, DnsRecord::Pointer);
        appendNumber(message, UnicastAnswer | ClassInternet);
    }
    return message;
}

std::optional<QList<DnsRecord>> dnsRecords(const QByteArray &message)
{
    Cursor cursor(message);
    cursor.skip(2);
    const quint16 flags = cursor.number();
    const int questions = cursor.number();
    const int answers = cursor.number();
    const int authorities = cursor.number();
    const int records = answers + authorities + cursor.number();
    if (!cursor.isGood() || (flags & ResponseFlag) == 0) {
        return std::nullopt;
    }
    for (int i = 0; i < questions && cursor.isGood(); ++i) {
        (void)cursor.name();
        cursor.skip(4);
    }
    if (!cursor.isGood()) {
        return std::nullopt;
    }
    QList<DnsRecord> found;
    for (int i = 0; i < records; ++i) {
        DnsRecord record;
        record.name = cursor.name();
        record.type = cursor.number();
        constexpr qsizetype ClassAndLifeBytes = 6;
        cursor.skip(ClassAndLifeBytes);
        const quint16 length = cursor.number();
        const qsizetype begin = cursor.place();
        if (record.type == DnsRecord::Service) {
            cursor.skip(4); // priority and weight
            record.port = cursor.number();
        }
        if (record.type == DnsRecord::Service || record.type == DnsRecord::Pointer) {
            record.target = cursor.name();
        }
        cursor.skip(begin + length - cursor.place());
        if (!cursor.isGood() || cursor.place() != begin + length) {
            return std::nullopt;
        }
        found.append(record);
    }
    return found;
}
