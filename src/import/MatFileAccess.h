// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "FileAccess.h"

#include <QList>
#include <QString>

class BufferedIO;
class InflateSource;
class MatSource;

/// One element of a MATLAB level 5 file, as its directory tells it.
struct MatEntry
{
    qint64 position = 0; ///< of the element's data in the file; of a compressed one, of those bytes
    quint32 size = 0;    ///< bytes of the element; of a compressed one, its compressed bytes
    quint32 type = 0;    ///< data type of the element, 14 for an array
    bool compressed = false;
    bool small = false; ///< in the small data format
    quint32 classId = 0;
    bool global = false;
    bool complex = false;
    bool logical = false;
    QString name;
    QList<int> dimensions;
    qint64 realPosition = 0; ///< in the file or, of a compressed element, in the inflated data
    qint64 imagPosition = 0; ///< likewise; 0 without an imaginary part
    quint32 realCount = 0;
    quint32 imagCount = 0;
    quint32 realType = 0;
    quint32 imagType = 0;

    /// An array of two dimensions: what the tools show.
    [[nodiscard]] bool isShown() const { return type == 14 && dimensions.size() == 2; }

    /// A complex vector that has a name.
    [[nodiscard]] bool isUsable() const;

    /// Why the variable can't be imported, with what to do; empty if it can.
    [[nodiscard]] QString obstacle() const;

    [[nodiscard]] QString className() const;
};

/// Reads complex vectors from MATLAB level 5 files into sample streams.
class MatFileAccess : public FileAccess
{
    Q_OBJECT

public:
    explicit MatFileAccess(QObject *parent = nullptr);

    /// Walks through the elements of the open file. Compressed ones are inflated on the way, as far
    /// as they declare, and not kept.
    [[nodiscard]] bool readDirectory();

    [[nodiscard]] const QList<MatEntry> &directory() const { return m_directory; }

    /// Text at the start of the file.
    [[nodiscard]] const QString &description() const { return m_description; }

    /// Writes "IQF" and the samples of a variable into the stream. A limit above 0 is the most of
    /// them; it may be null, and gets the number that was read.
    [[nodiscard]] bool readVariable(const QString &name, BufferedIO *stream, qint64 *limit);

protected:
    void forget() override;

private:
    [[nodiscard]] bool readHeader();
    [[nodiscard]] bool readElement(quint32 tag, MatSource &source);
    [[nodiscard]] bool addSmallElement(quint32 tag, MatSource &source);
    [[nodiscard]] bool addRegularElement(quint32 tag, MatSource &source);
    [[nodiscard]] bool addMatrix(MatSource &source);
    [[nodiscard]] bool addCompressedElement(MatSource &source);
    [[nodiscard]] bool addInflated(InflateSource &inflated);
    void dumpBytes(qint64 start) const;
    [[nodiscard]] const MatEntry *usableEntry(const QString &name) const;
    [[nodiscard]] bool copySamples(const MatEntry &entry, qint64 samples, BufferedIO &stream);

    QString m_description;
    QList<MatEntry> m_directory;
    int m_level = 0; ///< of the format: 5 after a good header
    bool m_swap = false;
    bool m_directoryValid = false;
};
