// SPDX-License-Identifier: Apache-2.0
#include "ContentTree.h"

#include "appearance/lineicon.h"

#include <QHeaderView>
#include <QSignalBlocker>

namespace {

constexpr int KeyRole = Qt::UserRole;

} // namespace

ContentTree::ContentTree(QWidget *parent)
    : QTreeWidget(parent)
{
    setAccessibleName("Content of the file");
    setColumnCount(2);
    setHeaderLabels({"Content", "Value"});
    header()->setSectionResizeMode(0, QHeaderView::ResizeToContents);
    header()->setStretchLastSection(true);
    setUniformRowHeights(true);
    connect(this, &QTreeWidget::itemChanged, this, &ContentTree::slot_updateTree);
}

void ContentTree::addEntry(const QString &name, const QVariant &key, bool usable, const Rows &rows)
{
    const QSignalBlocker blocker(this);
    auto *item = new QTreeWidgetItem(this, {name});
    item->setData(0, KeyRole, key);
    if (usable) {
        item->setFlags(Qt::ItemIsEnabled | Qt::ItemIsSelectable | Qt::ItemIsUserCheckable);
        item->setCheckState(0, Qt::Unchecked);
    } else {
        item->setFlags(Qt::ItemIsEnabled | Qt::ItemIsSelectable);
        item->setIcon(0, lineIcon("cancel"));
    }
    for (const auto &[label, value] : rows) {
        auto *row = new QTreeWidgetItem(item, {label, value});
        row->setToolTip(1, value);
    }
    item->setExpanded(true);
}

void ContentTree::addDeadItem(const QString &text)
{
    const QSignalBlocker blocker(this);
    auto *item = new QTreeWidgetItem(this, {text});
    item->setFlags(Qt::ItemIsEnabled);
    item->setIcon(0, lineIcon("cancel"));
    item->setFirstColumnSpanned(true);
}

QVariant ContentTree::checkedKey() const
{
    for (int i = 0; i < topLevelItemCount(); ++i) {
        if (topLevelItem(i)->checkState(0) == Qt::Checked) {
            return topLevelItem(i)->data(0, KeyRole);
        }
    }
    return {};
}

void ContentTree::check(const QVariant &key)
{
    for (int i = 0; i < topLevelItemCount(); ++i) {
        QTreeWidgetItem *item = topLevelItem(i);
        if (item->data(0, KeyRole) == key && (item->flags() & Qt::ItemIsUserCheckable) != 0) {
            item->setCheckState(0, Qt::Checked);
        }
    }
}

void ContentTree::slot_updateTree(QTreeWidgetItem *changed)
{
    if (changed->checkState(0) == Qt::Checked) {
        const QSignalBlocker blocker(this);
        for (int i = 0; i < topLevelItemCount(); ++i) {
            QTreeWidgetItem *item = topLevelItem(i);
            if (item != changed && item->checkState(0) == Qt::Checked) {
                item->setCheckState(0, Qt::Unchecked);
            }
        }
    }
    emit checkChanged();
}
