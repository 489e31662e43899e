// SPDX-License-Identifier: Apache-2.0
#include "SigmfFileAccess.h"

#include "tarentries.h"

#include "base/limits.h"
#include "log/Tracer.h"
#include "streams/BufferedIO.h"

#include <QCryptographicHash>
#include <QFileInfo>
#include <QtEndian>

#include <algorithm>
#include <vector>

namespace {

constexpr qint64 BlockSamples = 32 * 1024;

/// More than the annotations of the longest recordings need, and than memory has to bear.
constexpr qint64 LargestMetadata = 256LL * 1024 * 1024;

constexpr QLatin1String MetaSuffix(".sigmf-meta");
constexpr QLatin1String DataSuffix(".sigmf-data");

template <typename T>
T numberAt(const char *bytes, bool bigEndian)
{
    return bigEndian ? qFromBigEndian<T>(bytes) : qFromLittleEndian<T>(bytes);
}

/// One value of a type other than 16-bit words, of full scale 1.
float valueAt(const char *bytes, const SigmfType &type)
{
    const bool big = type.bigEndian;
    if (type.kind == SigmfType::Kind::Float) {
        return type.bytes == 4 ? numberAt<float>(bytes, big)
                               : static_cast<float>(numberAt<double>(bytes, big));
    }
    const bool isSigned = type.kind == SigmfType::Kind::Signed;
    double value = 0;
    switch (type.bytes) {
    case 1:
        value = isSigned ? static_cast<double>(static_cast<qint8>(*bytes))
                         : static_cast<double>(static_cast<quint8>(*bytes));
        break;
    case 2:
        value = numberAt<quint16>(bytes, big);
        break;
    default:
        value = isSigned ? static_cast<double>(numberAt<qint32>(bytes, big))
                         : static_cast<double>(numberAt<quint32>(bytes, big));
        break;
    }
    const double half = static_cast<double>(1ULL << (8 * type.bytes - 1));
    // The middle of unsigned numbers lies between two of them.
    return static_cast<float>(isSigned ? value / half : (value - half + 0.5) / (half - 0.5));
}

/// The values of one channel, I and Q in turn, from whole frames.
void convert(std::span<const char> frames, const SigmfType &type, qint64 frameBytes,
             qint64 channelOffset, std::span<float> values)
{
    const bool isWord = type.kind == SigmfType::Kind::Signed && type.bytes == 2;
    std::vector<qint16> words(isWord ? values.size() : 0);
    for (size_t i = 0; i < values.size() / 2; ++i) {
        const char *sample = frames.data() + static_cast<qint64>(i) * frameBytes + channelOffset;
        for (size_t part = 0; part < (type.isComplex ? 2U : 1U); ++part) {
            const char *value = sample + static_cast<qint64>(part) * type.bytes;
            if (isWord) {
                words[2 * i + part] = numberAt<qint16>(value, type.bigEndian);
            } else {
                values[2 * i + part] = valueAt(value, type);
            }
        }
    }
    if (isWord) {
        decodeWords(SampleCoding::A, std::as_bytes(std::span(words)), 1, values);
    }
    if (!type.isComplex) {
        for (size_t i = 1; i < values.size(); i += 2) {
            values[i] = 0;
        }
    }
}

} // namespace

SigmfFileAccess::SigmfFileAccess(QObject *parent)
    : ReadControl(parent)
{
}

bool SigmfFileAccess::open(const QString &fileName)
{
    m_file.close();
    m_metadata = SigmfMetadata();
    m_clipped = ClipCount();
    if (!QFileInfo(fileName).isFile()) {
        return Tracer::fail(QString("There is no file '%1'.").arg(fileName));
    }
    const bool isPair = fileName.endsWith(MetaSuffix, Qt::CaseInsensitive) ||
                        fileName.endsWith(DataSuffix, Qt::CaseInsensitive);
    if (!isPair && !fileName.endsWith(".sigmf", Qt::CaseInsensitive)) {
        return Tracer::fail(QString("The name '%1' is none of a SigMF recording; permitted: "
                                    ".sigmf-meta, .sigmf-data, .sigmf")
                                .arg(fileName));
    }
    return (isPair ? openPair(fileName) : openArchive(fileName)) && locateSamples();
}

bool SigmfFileAccess::openPair(const QString &fileName)
{
    const QString stem = fileName.chopped(MetaSuffix.size());
    QFile meta(fileName.endsWith(MetaSuffix, Qt::CaseInsensitive) ? fileName : stem + MetaSuffix);
    if (!QFileInfo(meta.fileName()).isFile() || !meta.open(QIODevice::ReadOnly)) {
        return Tracer::fail(QString("Cannot open the SigMF metadata '%1'.").arg(meta.fileName()));
    }
    if (!readMetadata(meta, meta.size())) {
        return false;
    }
    QString data =
        fileName.endsWith(DataSuffix, Qt::CaseInsensitive) ? fileName : stem + DataSuffix;
    if (!m_metadata.dataset.isEmpty()) {
        // A name alone, by the standard: the file lies beside the metadata.
        data = QFileInfo(fileName).absolutePath() + '/' + QFileInfo(m_metadata.dataset).fileName();
    }
    m_file.setFileName(data);
    if (!QFileInfo(data).isFile() || !m_file.open(QIODevice::ReadOnly)) {
        return Tracer::fail(QString("Cannot open the SigMF data '%1'.").arg(data));
    }
    m_dataStart = 0;
    m_dataBytes = m_file.size();
    return true;
}

bool SigmfFileAccess::openArchive(const QString &fileName)
{
    m_file.setFileName(fileName);
    if (!m_file.open(QIODevice::ReadOnly)) {
        return Tracer::fail(QString("Cannot open the SigMF archive '%1'.").arg(fileName));
    }
    const std::optional<QList<TarEntry>> entries = tarEntries(m_file);
    if (!entries) {
        return false;
    }
    QStringList recordings;
    for (const TarEntry &entry : *entries) {
        if (entry.name.endsWith(MetaSuffix)) {
            recordings << entry.name.chopped(MetaSuffix.size());
        }
    }
    if (recordings.size() != 1) {
        return Tracer::fail(
            QString("The archive holds %1 SigMF recordings instead of one%2")
                .arg(recordings.size())
                .arg(recordings.isEmpty()
                         ? "."
                         : ": " + recordings.join(", ") + ". Unpack it and import one of them."));
    }
    const auto find = [&](const QString &name) {
        return std::find_if(entries->begin(), entries->end(),
                            [&](const TarEntry &entry) { return entry.name == name; });
    };
    const auto meta = find(recordings.first() + MetaSuffix);
    const auto data = find(recordings.first() + DataSuffix);
    if (data == entries->end()) {
        return Tracer::fail("The archive holds no data for " + recordings.first() + '.');
    }
    m_dataStart = data->position;
    m_dataBytes = data->size;
    return m_file.seek(meta->position) && readMetadata(m_file, meta->size);
}

bool SigmfFileAccess::readMetadata(QIODevice &device, qint64 size)
{
    if (size > LargestMetadata) {
        return Tracer::fail(QString("The SigMF metadata are too large: %1 bytes, at most %2 can be "
                                    "read.")
                                .arg(size)
                                .arg(LargestMetadata));
    }
    const QByteArray text = device.read(size);
    if (text.size() != size) {
        return Tracer::fail("Cannot read the SigMF metadata.");
    }
    const std::optional<SigmfMetadata> metadata = parseSigmfMetadata(text);
    if (metadata) {
        m_metadata = *metadata;
    }
    return metadata.has_value();
}

qint64 SigmfFileAccess::frameBytes() const
{
    return static_cast<qint64>(m_metadata.type.bytes) * (m_metadata.type.isComplex ? 2 : 1) *
           m_metadata.channels;
}

bool SigmfFileAccess::locateSamples()
{
    qint64 bytes = m_dataBytes;
    const auto take = [&bytes](qint64 count) {
        bytes = count <= bytes ? bytes - count : -1;
        return bytes >= 0;
    };
    bool fits = take(m_metadata.trailingBytes);
    for (const SigmfMetadata::Capture &capture : m_metadata.captures) {
        fits = fits && take(capture.headerBytes);
    }
    if (!fits) {
        return Tracer::fail("The SigMF data are shorter than the headers that the metadata state.");
    }
    m_samples = bytes / frameBytes();
    if (bytes % frameBytes() != 0) {
        Tracer::Trace(Tracer::Warning, QString("The SigMF data end within a sample: %1 bytes are "
                                               "left over.")
                                           .arg(bytes % frameBytes()));
    }
    return true;
}

bool SigmfFileAccess::readSamples(BufferedIO &stream, int channel, qint64 limit)
{
    m_clipped = ClipCount();
    if (!stream.writeHeader(BufferedIO::DataHeader)) {
        return Tracer::fail("Cannot write to temporary file.");
    }
    const qint64 frame = frameBytes();
    const qint64 channelOffset = frame / m_metadata.channels * (channel - 1);
    const qint64 total = limit > 0 ? std::min(limit, m_samples) : m_samples;
    ProgressClock progress = startProgress();
    QCryptographicHash hash(QCryptographicHash::Sha512);
    // Many channels make long frames.
    const qint64 blockSamples = std::clamp<qint64>(16 * 1024 * 1024 / frame, 1, BlockSamples);
    std::vector<char> bytes(static_cast<size_t>(std::min(total, blockSamples) * frame));
    std::vector<float> values(2 * bytes.size() / static_cast<size_t>(frame));
    qint64 position = m_dataStart;
    qsizetype capture = 0;
    for (qint64 done = 0; done < total;) {
        if (progress.shouldStop(done, total)) {
            return Tracer::fail("Action aborted by user.");
        }
        // All captures that begin here; their headers stand one behind the other.
        while (capture < m_metadata.captures.size() &&
               m_metadata.captures.at(capture).begin <= done) {
            position += m_metadata.captures.at(capture++).headerBytes;
        }
        qint64 count = std::min(total - done, blockSamples);
        if (capture < m_metadata.captures.size()) {
            count = std::min(count, m_metadata.captures.at(capture).begin - done);
        }
        const qint64 wanted = count * frame;
        if (!m_file.seek(position) || m_file.read(bytes.data(), wanted) != wanted) {
            return Tracer::fail("Cannot read the SigMF data.");
        }
        const auto block = std::span(values).first(2 * static_cast<size_t>(count));
        hash.addData(QByteArrayView(bytes.data(), wanted));
        convert(bytes, m_metadata.type, frame, channelOffset, block);
        countClipped(block, m_clipped);
        if (!stream.writeBytes(static_cast<int>(block.size_bytes()), block.data())) {
            return Tracer::fail("Cannot write to temporary file.");
        }
        position += wanted;
        done += count;
    }
    if (total * frame == m_dataBytes) {
        checkHash(hash.result().toHex());
    }
    return true;
}

void SigmfFileAccess::checkHash(const QByteArray &hash) const
{
    if (!m_metadata.sha512.isEmpty() && m_metadata.sha512 != hash) {
        Tracer::Trace(Tracer::Warning, "The SigMF data aren't those that the metadata were made "
                                       "for: core:sha512 differs.");
    }
}

bool SigmfFileAccess::writeMarkers(BufferedIO &stream, qint64 samples) const
{
    struct Change
    {
        qint64 position;
        int marker;
        int step; ///< 1: one more annotation begins, -1: one ends
    };
    std::vector<Change> changes;
    changes.reserve(2 * m_metadata.marks.size());
    for (const SigmfMetadata::Mark &mark : m_metadata.marks) {
        const qint64 begin = std::min(mark.begin, samples);
        const qint64 rest = samples - begin;
        const qint64 count = mark.count < 0 ? rest : std::min(mark.count, rest);
        changes.push_back({begin, mark.marker, 1});
        changes.push_back({begin + count, mark.marker, -1});
    }
    std::sort(changes.begin(), changes.end(),
              [](const Change &one, const Change &other) { return one.position < other.position; });
    std::array<int, MarkerCount> depths{};
    std::vector<char> block(static_cast<size_t>(std::min(samples, BlockSamples)));
    const auto fill = [&](qint64 from, qint64 to) {
        char byte = 0;
        for (size_t marker = 0; marker < depths.size(); ++marker) {
            byte = static_cast<char>(byte | (depths.at(marker) > 0 ? 1 << marker : 0));
        }
        std::fill(block.begin(), block.end(), byte);
        for (qint64 count = 0; from < to; from += count) {
            count = std::min<qint64>(to - from, static_cast<qint64>(block.size()));
            if (!stream.writeBytes(static_cast<int>(count), block.data())) {
                return Tracer::fail("Cannot write to temporary marker buffer.");
            }
        }
        return true;
    };
    qint64 done = 0;
    for (const Change &change : changes) {
        if (change.position > done) {
            if (!fill(done, change.position)) {
                return false;
            }
            done = change.position;
        }
        depths.at(static_cast<size_t>(change.marker - 1)) += change.step;
    }
    return fill(done, samples) && stream.restartAtBegining();
}
