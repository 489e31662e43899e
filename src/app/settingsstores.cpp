// SPDX-License-Identifier: Apache-2.0
#include "settingsstores.h"

namespace {

std::unique_ptr<QSettings> openStore(const QString &application)
{
    return std::make_unique<QSettings>(QSettings::IniFormat, QSettings::UserScope, "Halvorn",
                                       application);
}

} // namespace

std::unique_ptr<QSettings> openMainStore()
{
    return openStore("Corvane");
}

std::unique_ptr<QSettings> openColorStore()
{
    return openStore("Corvane-colors");
}
