// SPDX-License-Identifier: Apache-2.0
#include "toolpages.h"

#include "display/QtNumericEdit.h"

#include <QFileDialog>
#include <QFileInfo>
#include <QLineEdit>

#include <cmath>

namespace {

QString waveformFilter()
{
    return "Waveform File (*.wv)";
}

} // namespace

QString waveformTitle()
{
    return "Select waveform file";
}

bool chooseSourceFile(QWidget *parent, QLineEdit &field)
{
    const QString fileName =
        QFileDialog::getOpenFileName(parent, waveformTitle(), field.text(), waveformFilter());
    if (!fileName.isEmpty()) {
        field.setText(fileName);
    }
    return !fileName.isEmpty();
}

void chooseTargetFile(QWidget *parent, QLineEdit &field, const QString &title)
{
    const QString fileName = QFileDialog::getSaveFileName(
        parent, title, field.text(), waveformFilter(), nullptr, QFileDialog::DontConfirmOverwrite);
    if (!fileName.isEmpty()) {
        field.setText(fileName);
    }
}

QString fileNameWithSuffix(const QString &fileName, const QString &suffix)
{
    const QFileInfo file(fileName);
    const QString extension = file.suffix();
    return file.path() + '/' + file.completeBaseName() + suffix +
           (extension.isEmpty() ? QString() : '.' + extension);
}

void roundInput(QtNumericEdit &edit)
{
    QObject::connect(&edit, &QtNumericEdit::valueUpdated, &edit, [&edit](double value) {
        if (value != std::round(value)) {
            edit.setVal(std::round(value));
        }
    });
}
