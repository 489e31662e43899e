// SPDX-License-Identifier: Apache-2.0
#include "PathBox.h"

#include "appearance/lineicon.h"

#include <QComboBox>
#include <QCompleter>
#include <QDir>
#include <QFileSystemModel>
#include <QHBoxLayout>
#include <QLineEdit>
#include <QSignalBlocker>
#include <QToolButton>

namespace {

/// A typed path with "~" for the home folder, as shells take it.
QString typedPath(const QString &text, bool local)
{
    QString path = text.trimmed();
    if (local && (path == "~" || path.startsWith("~/"))) {
        return QDir::homePath() + path.mid(1);
    }
    return path;
}

} // namespace

PathBox::PathBox(QComboBox *box, QHBoxLayout *row)
    : QObject(box)
    , m_box(box)
    , m_files(new QFileSystemModel(this))
    , m_completer(new QCompleter(this))
{
    m_box->setEditable(true);
    m_box->setInsertPolicy(QComboBox::NoInsert);
    m_box->setToolTip("Path of the current entry; type another one to go there");
    m_box->lineEdit()->setPlaceholderText("Path");
    m_files->setFilter(QDir::AllEntries | QDir::NoDotAndDotDot);
    m_completer->setModel(m_files);
    m_completer->setCompletionMode(QCompleter::PopupCompletion);
    m_box->setCompleter(nullptr); // that of the choices
    m_box->lineEdit()->setCompleter(m_completer);
    connect(m_box->lineEdit(), &QLineEdit::textEdited, this, [this] {
        if (m_isLocal && m_files->rootPath().isEmpty()) {
            m_files->setRootPath("/"); // not before it is needed: it watches folders
        }
    });
    connect(m_box, &QComboBox::currentIndexChanged, this, [this](int index) {
        if (index >= 0) {
            emit pathChosen(m_box->itemText(index));
        }
    });
    connect(m_box->lineEdit(), &QLineEdit::returnPressed, this, [this] {
        const QString path = typedPath(m_box->currentText(), m_isLocal);
        if (!path.isEmpty() && m_box->findText(path) < 0) { // the box itself goes to known ones
            emit pathChosen(path);
        }
    });
    struct Button
    {
        const char *icon;
        const char *name;
        const char *toolTip;
        void (PathBox::*request)();
    };
    const Button buttons[] = {
        {"up", "tb_up", "Folder above (Backspace)", &PathBox::upRequested},
        {"home", "tb_home", "Default folder", &PathBox::homeRequested},
    };
    for (const Button &button : buttons) {
        auto *made = new QToolButton;
        made->setObjectName(button.name + m_box->objectName().right(1).prepend('_'));
        made->setIcon(lineIcon(button.icon));
        made->setToolTip(button.toolTip);
        made->setAutoRaise(true);
        made->setFocusPolicy(Qt::NoFocus); // the keys stay in the tree
        connect(made, &QToolButton::clicked, this, button.request);
        row->addWidget(made);
    }
}

void PathBox::show(const QString &path)
{
    const QSignalBlocker blocker(m_box);
    if (m_box->findText(path, Qt::MatchExactly | Qt::MatchCaseSensitive) < 0) {
        while (m_box->count() >= MaxHistory) {
            m_box->removeItem(0);
        }
        m_box->addItem(path);
    }
    m_box->setCurrentIndex(m_box->findText(path, Qt::MatchExactly | Qt::MatchCaseSensitive));
    m_box->lineEdit()->setText(path);
}

void PathBox::forget(const QString &path, const QString &shown)
{
    const QSignalBlocker blocker(m_box);
    m_box->removeItem(m_box->findText(path));
    m_box->setCurrentIndex(m_box->findText(shown));
    m_box->setEditText(shown);
}

void PathBox::restart(bool local)
{
    const QSignalBlocker blocker(m_box);
    m_isLocal = local;
    m_box->clear();
    m_box->clearEditText();
    m_box->lineEdit()->setCompleter(local ? m_completer : nullptr);
}
