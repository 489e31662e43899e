// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <QString>

#include <memory>
#include <span>

class QFileDevice;

/// A file to be written that keeps what stood under its name until all of it is there: a file is
/// replaced by commit() alone, by way of a temporary file beside it, and stays as it
/// was when the object goes without one. It keeps its permissions, and links to it lead to the new
/// content. Without a commit nothing is left of a file that was not there before.
///
/// Written in place are devices and pipes, and files in a folder where nothing can be added.
class OutputFile
{
public:
    explicit OutputFile(QString fileName);
    ~OutputFile();

    OutputFile(const OutputFile &) = delete;
    OutputFile &operator=(const OutputFile &) = delete;

    /// Opens the file, unbuffered. False if that fails, for the reason in errorString().
    [[nodiscard]] bool open();

    [[nodiscard]] bool isOpen() const;

    /// Writes all of the bytes behind those before. False if that fails, for the reason in
    /// errorString().
    [[nodiscard]] bool write(std::span<const char> bytes);

    /// Ends the writing and puts the file in its place. False if that fails, for the reason in
    /// errorString().
    [[nodiscard]] bool commit();

    [[nodiscard]] QString errorString() const;

private:
    [[nodiscard]] bool isReplaced() const;

    QString m_fileName;
    std::unique_ptr<QFileDevice> m_file;
};
