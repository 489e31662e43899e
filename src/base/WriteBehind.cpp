// SPDX-License-Identifier: Apache-2.0
#include "WriteBehind.h"

#include <utility>

WriteBehind::WriteBehind(Sink write, qint64 blockBytes, qint64 pieceBytes)
    : m_write(std::move(write))
    , m_blockBytes(blockBytes)
    , m_filling(blockBytes + pieceBytes, Qt::Uninitialized)
    , m_writing(blockBytes + pieceBytes, Qt::Uninitialized)
{
}

bool WriteBehind::add(qint64 count)
{
    m_pending += count;
    if (m_pending < m_blockBytes) {
        return true;
    }
    m_worker.wait();
    const bool isGood = m_isGood;
    handOver();
    return isGood;
}

bool WriteBehind::finish()
{
    m_worker.wait();
    handOver();
    m_worker.wait();
    return m_isGood;
}

void WriteBehind::handOver()
{
    const qint64 count = std::exchange(m_pending, 0);
    if (count == 0 || !m_isGood) {
        return;
    }
    m_filling.swap(m_writing);
    m_worker.start([this, count] {
        m_isGood = m_write({m_writing.constData(), static_cast<std::size_t>(count)});
    });
}
