// SPDX-License-Identifier: Apache-2.0
#include "pictures.h"

#include <QtGlobal>

void registerPictures()
{
    Q_INIT_RESOURCE(corvane);
}
