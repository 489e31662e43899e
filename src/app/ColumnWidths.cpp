// SPDX-License-Identifier: Apache-2.0
#include "ColumnWidths.h"

#include <QHeaderView>
#include <QSettings>

#include <algorithm>
#include <iterator>

namespace {

QString widthKey(int pane, const QString &kind, qsizetype section)
{
    return QString("tree%1.%2.section%3").arg(pane).arg(kind).arg(section);
}

QMap<QString, QList<int>> firstWidths()
{
    return {{"local", {220, 60, 60, 100}}, {"remote", {220, 60, 60}}};
}

} // namespace

ColumnWidths::ColumnWidths()
    : m_widths(firstWidths())
{
}

QList<int> ColumnWidths::untouched(const QString &kind) const
{
    QList<int> first = firstWidths().value(kind);
    const QList<int> widths = m_widths.value(kind);
    const bool isFirst = widths.size() == first.size() &&
                         std::equal(first.cbegin(), std::prev(first.cend()), widths.cbegin());
    return isFirst ? first : QList<int>();
}

void ColumnWidths::keep(const QString &kind, const QHeaderView &header)
{
    // An instrument that isn't open has a single column without a meaning.
    if (header.count() < m_widths.value(kind).size()) {
        return;
    }
    QList<int> widths;
    for (int section = 0; section < header.count(); ++section) {
        widths.append(header.sectionSize(section));
    }
    m_widths[kind] = widths;
}

void ColumnWidths::apply(const QString &kind, QHeaderView &header) const
{
    const QList<int> widths = m_widths.value(kind);
    const qsizetype count = std::min<qsizetype>(widths.size(), header.count());
    for (int section = 0; section < count; ++section) {
        header.resizeSection(section, widths.at(section));
    }
}

void ColumnWidths::write(QSettings &settings, int pane) const
{
    for (auto kind = m_widths.cbegin(); kind != m_widths.cend(); ++kind) {
        for (qsizetype section = 0; section < kind.value().size(); ++section) {
            settings.setValue(widthKey(pane, kind.key(), section), kind.value().at(section));
        }
    }
}

void ColumnWidths::read(const QSettings &settings, int pane)
{
    for (auto kind = m_widths.begin(); kind != m_widths.end(); ++kind) {
        QList<int> widths;
        for (;;) {
            bool isNumber = false;
            const int width =
                settings.value(widthKey(pane, kind.key(), widths.size()), -1).toInt(&isNumber);
            if (!isNumber || width < 0) {
                break;
            }
            widths.append(width);
        }
        if (!widths.isEmpty()) {
            kind.value() = widths;
        }
    }
}
