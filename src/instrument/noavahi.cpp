// SPDX-License-Identifier: Apache-2.0
#include "AvahiSearch.h"

std::unique_ptr<AvahiSearch> AvahiSearch::open(const QStringList & /*services*/, Found /*found*/)
{
    return nullptr;
}
