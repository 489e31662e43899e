// SPDX-License-Identifier: Apache-2.0
#include "splittersettings.h"

#include <QSettings>
#include <QSplitter>

void readSplitter(const QSettings &settings, const QString &prefix, QSplitter &splitter)
{
    QList<int> sizes;
    for (;;) {
        bool isNumber = false;
        const int size =
            settings.value(prefix + QString::number(sizes.size()), -1).toInt(&isNumber);
        if (!isNumber || size < 1) {
            break;
        }
        sizes.append(size);
    }
    if (sizes.size() >= 2) {
        splitter.setSizes(sizes);
    }
}

void writeSplitter(QSettings &settings, const QString &prefix, const QSplitter &splitter)
{
    const QList<int> sizes = splitter.sizes();
    for (qsizetype i = 0; i < sizes.size(); ++i) {
        settings.setValue(prefix + QString::number(i), sizes.at(i));
    }
}
