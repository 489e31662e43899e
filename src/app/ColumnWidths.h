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

    /// The widths from the start, while the user has chosen no others; empty from then on. The last
    /// column takes what is left and says nothing.
    [[nodiscard]] QList<int> untouched(const QString &kind) const;

    /// Keys are "tree1.local.section0" and so on. A list that can't be read leaves the widths.
    void write(QSettings &settings, int pane) const;
    void read(const QSettings &settings, int pane);

private:
    QMap<QString, QList<int>> m_widths; ///< by PaneFiles::settingsName()
};
