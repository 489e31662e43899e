// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "ReadControl.h"

#include <QFile>
#include <QString>

/// What the readers of one foreign file share: the file or device that is read.
class FileAccess : public ReadControl
{
    Q_OBJECT

public:
    /// Closes an open file, then opens this one, with an empty name the one before, for reading.
    /// Only regular files are opened.
    [[nodiscard]] bool open(const QString &fileName);

    /// Reads from a device that is open already and can seek. It isn't owned.
    void open(QIODevice &device);

    void close();

    [[nodiscard]] bool isOpen() const { return m_device != nullptr; }

protected:
    explicit FileAccess(QObject *parent);

    /// The file's name has changed: what is known of its content counts no more.
    virtual void forget() = 0;

    /// The open file; null without one.
    [[nodiscard]] QIODevice *device() const { return m_device; }
    [[nodiscard]] QString fileName() const { return m_file.fileName(); }

private:
    QFile m_file;
    QIODevice *m_device = nullptr;
};
