// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "SampleCoding.h"

#include "base/limits.h"
#include "streams/levels.h"
#include "streams/looppoint.h"

#include <QList>
#include <QString>
#include <QStringList>
#include <QtGlobal>

class BufferedIO;

/// Groups of file kinds that share a sample coding, as the reader reports them.
enum WvFormat {
    WvFormatUnknown = 0,
    WvFormatWv = 1, ///< "WV" and "WV-ADD"
    WvFormatTgx = 2,
    WvFormatTbx = 3,
    WvFormatTqx = 4, ///< "TQX-130-WV"
    WvFormatTvx = 5,
};

/// File kinds that the writer produces.
enum WvType {
    WvTypeTgx = 1,
    WvTypeTbx = 2,
    WvTypeTvx = 3,
};

/// The type that a tool writes for the result of a file it has read: TVX stays, all others become
/// TGX.
[[nodiscard]] constexpr int typeForFormat(int format)
{
    return format == WvFormatTvx ? WvTypeTvx : WvTypeTgx;
}

/// How far the reader goes with the samples of a file.
enum class SampleReading {
    Unpacked, ///< into the data stream, measured on the way
    Measured, ///< the levels alone
    Located,  ///< not read; the measured levels stay those of the tags
    Checked,  ///< as Located, of a file that may be cut off; marker lists are passed over
};

/// Job record of HvFileIO::readWaveform. The caller fills the input fields; all others are cleared
/// and filled by the reader.
struct WvFileInfo
{
    double clock = 0;         ///< CLOCK tag, Hz
    int samples = 0;          ///< from the SAMPLES tag, overruled by the sample block
    int controlLength = 0;    ///< positions covered by the marker lists, else the sample count
    bool hasMarkers = false;  ///< there are marker lists
    QStringList droppedTags;  ///< known ones that no written file carries on
    int prefixNumber = 0;     ///< number before a comma in the sample block's prefix, else 0
    double rmsOffset = 0;     ///< measured, dB below full scale
    double peakOffset = 0;    ///< measured, dB below full scale
    LevelSums levels;         ///< measured
    double rmsOffsetTag = 0;  ///< first value of LEVEL OFFS, dB
    double peakOffsetTag = 0; ///< second value of LEVEL OFFS, dB
    int format = WvFormatUnknown;
    QString comment;
    QString copyright;
    QString system;
    QString date;

    SampleCoding coding = SampleCoding::A;
    qint64 blockStart = 0;     ///< byte of the file where the samples begin
    qint64 missingSamples = 0; ///< of a file to be checked: stated by its tags, but not there

    SampleReading reading = SampleReading::Unpacked; ///< in
    double gainDb = 0;                  ///< in: gain applied to all samples while reading, dB
    QString fileName;                   ///< in: path of the file
    BufferedIO *dataStream = nullptr;   ///< in: initialised stream, required to unpack
    BufferedIO *markerStream = nullptr; ///< in: initialised stream, required
    BufferedIO *tagsStream = nullptr; ///< in: initialised stream; null if unknown tags don't matter
};

/// Sources of a waveform to be written; each may be null. None is owned.
struct WvStreams
{
    BufferedIO *data = nullptr;
    BufferedIO *markers = nullptr;
    BufferedIO *tags = nullptr;
};

/// Job record of HvFileIO::writeWaveform.
struct WvWriteJob
{
    int type = WvTypeTgx;     ///< a WvType; any other value is written as TGX
    double clock = 0;         ///< sample clock, Hz
    double markerClock = 0;   ///< clock of the marker lists, Hz
    int samples = 0;          ///< must be above 0
    double rmsOffset = 0;     ///< dB; in, and out when computed by the writer
    double peakOffset = 0;    ///< dB; in, and out when computed by the writer
    bool overwrite = true;    ///< a file that stands under the name is replaced
    QString comment;          ///< empty: no tag
    QString copyright;        ///< empty: no tag
    bool markerLists = true;  ///< what the marker stream holds is written, too
    bool levelsValid = false; ///< the two offsets are given and are not to be computed
    QList<float> iSamples;    ///< I values in memory, or empty
    QList<float> qSamples;    ///< Q values in memory, or empty
    QList<int> markers;       ///< bits 0 to 3 are markers 1 to 4; or empty
    qint64 clippedValues = 0; ///< out: values, I and Q each, that no word of the file can hold
    double largestValue = 0;  ///< out: largest magnitude among those, of full scale 1
    LoopPoint loop;           ///< out: of the samples as they were written
};

/// One segment of a multi-segment waveform.
struct WvSegment
{
    QString fileName;
    double duration = 0;   ///< s
    double rmsOffset = 0;  ///< dB
    double peakOffset = 0; ///< dB
    double clock = 0;      ///< Hz
    qint64 start = 0;      ///< samples
    qint64 length = 0;     ///< samples
};

/// Result of HvFileIO::readWaveformInfo.
struct WvFileSummary
{
    QString fileName;
    qint64 fileSize = 0; ///< bytes
    QString created;     ///< creation date, yyyy-mm-dd
    QString typeText;    ///< description of the file kind
    QString comment;
    QString copyright;
    QString date;
    qint64 samples = -1;       ///< -1 if unknown
    qint64 missingSamples = 0; ///< that the file was cut off before
    bool isCutOff = false;     ///< the file ends before all that its tags lead one to expect
    double clock = -1;         ///< Hz, -1 if unknown
    double playTime = -1;      ///< s, -1 if unknown
    bool levelsValid = false;  ///< a readable LEVEL OFFS was found
    double peakOffset = 0;     ///< dB, from the tag
    double rmsOffset = 0;      ///< dB, from the tag
    bool hasChecksum = false;
    bool hasMarkers = false;
    QString settingsFile;
    QString levelMode;
    QString clockMode;
    int segmentCount = 0;
    QList<WvSegment> segments;
};
