// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <QList>
#include <QMap>
#include <QString>

class QHeaderView;
class QSettings;

/// The column widths of one pane, in pixels, kept apart for each kind of tree that it can show.
class ColumnWidths
{
public:
    ColumnWidths();

    /// Takes over the widths that a header has now.
    void keep(const QString &kind, const QHeaderView &header);

    /// Gives a header the widths of a kind.
    void apply(const QString &kind, QHeaderView &header) const;

    /// Whether nobody has changed the width that a column has from the start.
    [[nodiscard]] static bool isUntouched(const QString &kind, const QHeaderView &header,
                                          int section);

    /// Keys are "tree1.local.section0" and so on. A list that can't be read leaves the widths.
    void write(QSettings &settings, int pane) const;
    void read(const QSettings &settings, int pane);

private:
    QMap<QString, QList<int>> m_widths; ///< by PaneFiles::settingsName()
};
