// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <QString>

#include <memory>
#include <span>

class QFileDevice;
class QSaveFile;

/// A file to be written that keeps what stood under its name until all of it is there: a file is
/// replaced by commit() alone, by way of a temporary file beside it, and stays as it
/// was when the object goes without one. It keeps its permissions, and links to it lead to the new
/// content. Without a commit nothing is left of a file that was not there before.
///
/// Written in place are devices and pipes, and files in a folder where nothing can be added.
class OutputFile
{
public:
    /// What becomes of a file that stands under the name when the new one is complete.
    enum class Existing { Replaced, Kept };

    /// With Existing::Kept open() refuses a name that is taken, and commit() one that was taken
    /// meanwhile.
    explicit OutputFile(QString fileName, Existing existing = Existing::Replaced);
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
    [[nodiscard]] bool commitBesides(QSaveFile &file);

    QString m_fileName;
    Existing m_existing;
    QString m_problem; ///< one that the system has no words for
    std::unique_ptr<QFileDevice> m_file;
};

/// Whether two names, links included, lead to one and the same file on disk.
[[nodiscard]] bool isSameFile(const QString &one, const QString &other);
