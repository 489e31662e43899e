// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <QList>
#include <QPair>
#include <QString>
#include <QTreeWidget>

/// What a file holds, of which one entry can be checked.
class ContentTree : public QTreeWidget
{
    Q_OBJECT

public:
    using Rows = QList<QPair<QString, QString>>;

    explicit ContentTree(QWidget *parent = nullptr);

    /// Adds an entry with its rows. One that isn't usable can't be checked. `key` comes back from
    /// checkedKey().
    void addEntry(const QString &name, const QVariant &key, bool usable, const Rows &rows);

    /// Shows a reason in the place of entries.
    void addDeadItem(const QString &text);

    /// The key of the checked entry; invalid if there is none.
    [[nodiscard]] QVariant checkedKey() const;

    /// Checks an entry, if it is there and can be.
    void check(const QVariant &key);

signals:
    void checkChanged();

private slots:
    void slot_updateTree(QTreeWidgetItem *changed);
};
