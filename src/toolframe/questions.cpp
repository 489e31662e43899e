// SPDX-License-Identifier: Apache-2.0
#include "questions.h"

#include "log/Tracer.h"

#include <QDateTime>
#include <QDir>
#include <QFileInfo>
#include <QInputDialog>
#include <QLabel>
#include <QLineEdit>
#include <QLocale>
#include <QMessageBox>
#include <QTimer>

#include <algorithm>

bool askYesNo(QWidget *parent, const QString &title, const QString &text, const QString &details)
{
    QMessageBox box(QMessageBox::Warning, title, text, QMessageBox::Yes | QMessageBox::No, parent);
    box.setTextFormat(Qt::PlainText);
    box.setInformativeText(details);
    box.setDefaultButton(QMessageBox::No);
    return box.exec() == QMessageBox::Yes;
}

std::optional<QString> askText(QWidget *parent, const QString &title, const QString &label,
                               const QString &initial, qsizetype marked)
{
    QInputDialog dialog(parent);
    dialog.setWindowTitle(title);
    dialog.setLabelText(label);
    dialog.setTextValue(initial);
    const QList<QLabel *> labels = dialog.findChildren<QLabel *>();
    for (QLabel *shown : labels) {
        shown->setTextFormat(Qt::PlainText);
    }
    dialog.resize(360, dialog.sizeHint().height());
    if (auto *edit = dialog.findChild<QLineEdit *>(); edit != nullptr && marked > 0) {
        // The dialog marks all when it is shown.
        QTimer::singleShot(0, edit,
                           [edit, marked] { edit->setSelection(0, static_cast<int>(marked)); });
    }
    if (dialog.exec() != QDialog::Accepted) {
        return std::nullopt;
    }
    return dialog.textValue();
}

QString fileDetails(const QStringList &paths)
{
    constexpr qsizetype MostShown = 10;
    const QLocale locale;
    QStringList lines;
    for (const QString &path : paths.first(std::min(paths.size(), MostShown))) {
        const QFileInfo file(path);
        lines.append(QString("%1 (%2, %3)")
                         .arg(QDir::toNativeSeparators(path), locale.formattedDataSize(file.size()),
                              locale.toString(file.lastModified(), QLocale::ShortFormat)));
    }
    return lines.join('\n') + (paths.size() > MostShown ? "\n..." : "");
}

bool confirmOverwrite(QWidget *parent, const QString &path)
{
    const bool agreed =
        !QFileInfo::exists(path) ||
        askYesNo(parent, "Overwrite File",
                 "The target file already exists.\nDo you want to overwrite this file?",
                 fileDetails({path}));
    return agreed || Tracer::fail("User break.");
}
