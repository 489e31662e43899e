// SPDX-License-Identifier: Apache-2.0
#include "Transcript.h"

#include "base/visibletext.h"
#include "log/Tracer.h"

#include <QElapsedTimer>
#include <QFile>
#include <QMutex>
#include <QMutexLocker>

namespace {

struct Record
{
    QMutex mutex;
    QFile file;
    QElapsedTimer time;
};

Record &record()
{
    static Record theRecord;
    return theRecord;
}

void write(const char *direction, const QString &text)
{
    Record &present = record();
    const QMutexLocker locker(&present.mutex);
    if (!present.file.isOpen()) {
        return;
    }
    const QString line =
        QString("%1 %2 %3\n").arg(present.time.elapsed(), 8).arg(direction, visibleText(text));
    present.file.write(line.toUtf8());
    present.file.flush();
}

} // namespace

bool Transcript::start(const QString &fileName)
{
    Record &present = record();
    const QMutexLocker locker(&present.mutex);
    present.file.close();
    present.file.setFileName(fileName);
    present.time.start();
    return present.file.open(QIODevice::WriteOnly | QIODevice::Append) ||
           Tracer::fail(QString("Cannot write the transcript '%1': %2")
                            .arg(fileName, present.file.errorString()));
}

void Transcript::stop()
{
    Record &present = record();
    const QMutexLocker locker(&present.mutex);
    present.file.close();
}

bool Transcript::isRunning()
{
    Record &present = record();
    const QMutexLocker locker(&present.mutex);
    return present.file.isOpen();
}

void Transcript::sent(const QString &text)
{
    write(">>", text);
}

void Transcript::received(const QString &text)
{
    write("<<", text);
}

QString Transcript::blockText(qint64 bytes)
{
    return QString("<%1 bytes>").arg(bytes);
}
