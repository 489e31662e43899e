// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "FakeVisa.h"

#include <QString>
#include <QStringList>

/// Makes the next first VisaDevice load the fake library and gives access to its script.
class FakeInstrument
{
public:
    FakeInstrument();

    /// Forgets the script, which may know things of the test that end with it.
    ~FakeInstrument();
    FakeInstrument(const FakeInstrument &) = delete;
    FakeInstrument &operator=(const FakeInstrument &) = delete;

    FakeVisa *operator->() const { return m_fake; }

    /// The calls of the last operations, which are then forgotten.
    [[nodiscard]] QStringList takeCalls() const;
    /// The complete messages, likewise, without the error queue's.
    [[nodiscard]] QStringList takeMessages() const;

    /// Makes the calls that begin so end with a status, after `skipped` of them went well.
    void failCall(const QString &beginning, qint32 status, int skipped = 0) const;

    [[nodiscard]] static QString libraryName();

private:
    FakeVisa *m_fake = nullptr;
};
