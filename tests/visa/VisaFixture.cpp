// SPDX-License-Identifier: Apache-2.0
#include "VisaFixture.h"

#include "Vxi11Peer.h"

#include <QFile>

VisaFixture::~VisaFixture()
{
    closeManager();
}

void VisaFixture::configure(const QByteArray &text)
{
    QFile file(m_folder.filePath("visa.ini"));
    if (!file.open(QIODevice::WriteOnly) || file.write(text) != text.size()) {
        qFatal("cannot write the configuration");
    }
    file.close();
    qputenv("CORVANE_VISA_CONFIG", file.fileName().toUtf8());
    if (viOpenDefaultRM(&m_manager) != VI_SUCCESS) {
        qFatal("cannot open the manager");
    }
}

void VisaFixture::closeManager()
{
    if (m_manager != VI_NULL) {
        viClose(m_manager);
    }
    m_manager = VI_NULL;
}

ViSession VisaFixture::open(const Vxi11Peer &peer, ViUInt32 timeoutMs)
{
    configure("[TCPIP0::127.0.0.1::inst0::INSTR]\nport = " + QByteArray::number(peer.port()));
    ViSession session = VI_NULL;
    if (viOpen(m_manager, "TCPIP::127.0.0.1::INSTR", VI_NO_LOCK, 0, &session) != VI_SUCCESS ||
        viSetAttribute(session, VI_ATTR_TMO_VALUE, timeoutMs) != VI_SUCCESS) {
        qFatal("cannot open the peer");
    }
    return session;
}

VisaFixture::Result VisaFixture::read(ViSession session, ViUInt32 size)
{
    QByteArray buffer(qsizetype(size), '\0');
    ViUInt32 count = 0;
    const ViStatus status =
        viRead(session, reinterpret_cast<ViByte *>(buffer.data()), size, &count);
    return {status, buffer.left(count)};
}

ViStatus VisaFixture::write(ViSession session, const QByteArray &data, ViUInt32 *count)
{
    return viWrite(session, reinterpret_cast<const ViByte *>(data.data()), ViUInt32(data.size()),
                   count);
}
