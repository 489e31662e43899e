// SPDX-License-Identifier: Apache-2.0
#include "FakeInstrument.h"

#include <QLibrary>

#include <utility>

namespace {

QStringList toStrings(const std::vector<std::string> &texts)
{
    QStringList strings;
    for (const std::string &text : texts) {
        strings.append(QString::fromLatin1(text.data(), static_cast<qsizetype>(text.size())));
    }
    return strings;
}

} // namespace

FakeInstrument::FakeInstrument()
{
    const QString name = libraryName();
    qputenv("CORVANE_VISA_LIBRARY", name.toLocal8Bit());
    QLibrary library(name);
    const auto access = reinterpret_cast<decltype(&fakeVisa)>(library.resolve("fakeVisa"));
    if (access == nullptr) {
        qFatal("%s", qPrintable(library.errorString()));
    }
    m_fake = access();
    *m_fake = FakeVisa();
}

FakeInstrument::~FakeInstrument()
{
    m_fake->answer = nullptr;
    m_fake->status = nullptr;
}

QString FakeInstrument::libraryName()
{
    return FAKE_VISA_FOLDER "/fakevisa.so";
}

QStringList FakeInstrument::takeCalls() const
{
    return toStrings(std::exchange(m_fake->calls, {}));
}

QStringList FakeInstrument::takeMessages() const
{
    QStringList messages = toStrings(std::exchange(m_fake->messages, {}));
    messages.removeAll(":SYST:ERR?");
    return messages;
}

void FakeInstrument::failCall(const QString &beginning, qint32 status, int skipped) const
{
    m_fake->status = [prefix = beginning.toStdString(), status,
                      skipped](const std::string &call) mutable -> std::int32_t {
        if (call.rfind(prefix, 0) != 0) {
            return 0;
        }
        return skipped-- > 0 ? 0 : status;
    };
}
