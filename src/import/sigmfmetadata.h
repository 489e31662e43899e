// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <QByteArray>
#include <QList>
#include <QString>

#include <optional>
#include <vector>

/// How a SigMF recording stores a value.
struct SigmfType
{
    enum class Kind { Float, Signed, Unsigned };

    bool isComplex = true;
    Kind kind = Kind::Signed;
    int bytes = 2;
    bool bigEndian = false;
    QString name; ///< as the standard writes it, such as "ci16_le"
};

/// The type of a name of the standard, such as "cf32_le" or "ru8"; nothing if it is none.
[[nodiscard]] std::optional<SigmfType> sigmfType(const QString &name);

/// The metadata of a recording, as far as they matter here. Numbers of samples are held to what can
/// be, but not to the length of the data.
struct SigmfMetadata
{
    /// Where a part of the data begins that has a header of its own.
    struct Capture
    {
        qint64 begin = 0;       ///< sample
        qint64 headerBytes = 0; ///< in front of it
    };

    /// An annotation that stands for a marker.
    struct Mark
    {
        qint64 begin = 0;
        qint64 count = 0; ///< -1: up to the end
        int marker = 1;   ///< 1 to 4
    };

    SigmfType type;
    double sampleRate = 0; ///< Hz; 0 if it isn't stated
    int channels = 1;
    QString description;
    QString copyright;
    QString dataset;          ///< name of a data file of another form; usually empty
    qint64 trailingBytes = 0; ///< behind the samples
    QByteArray sha512;        ///< hexadecimal; empty if it isn't stated
    QByteArray unknownTags;   ///< those of the waveform that the recording was made of
    QList<Capture> captures;  ///< in the order of their begins
    std::vector<Mark> marks;
};

/// Reads the metadata. Nothing, with the reason logged, if they aren't those of a recording whose
/// samples can be read.
[[nodiscard]] std::optional<SigmfMetadata> parseSigmfMetadata(const QByteArray &text);
