// SPDX-License-Identifier: Apache-2.0
#include "plotexport.h"

#include "SpectrumPainter.h"
#include "base/OutputFile.h"
#include "log/Tracer.h"

#include <QBuffer>
#include <QFileInfo>
#include <QImage>
#include <QPainter>
#include <QSvgGenerator>
#include <QTextStream>

namespace {

constexpr int SampleDigits = 9; ///< a 32-bit float comes back unchanged

bool writeFile(const QString &fileName, const QByteArray &bytes)
{
    OutputFile file(fileName);
    if (file.open() && file.write(bytes) && file.commit()) {
        return true;
    }
    Tracer::Trace(Tracer::Error,
                  QString("Cannot write '%1': %2.").arg(fileName, file.errorString()));
    return false;
}

QByteArray svgOf(const QSize &size, const std::function<void(QPainter &)> &paint)
{
    QBuffer buffer;
    QSvgGenerator generator;
    generator.setOutputDevice(&buffer);
    generator.setSize(size);
    generator.setViewBox(QRect(QPoint(), size));
    generator.setTitle("Corvane");
    QPainter painter(&generator);
    paint(painter);
    painter.end();
    return buffer.data();
}

QByteArray pngOf(const QSize &size, double ratio, const std::function<void(QPainter &)> &paint)
{
    QImage image(QSizeF(QSizeF(size) * ratio).toSize(), QImage::Format_RGB32);
    image.setDevicePixelRatio(ratio);
    QPainter painter(&image);
    paint(painter);
    painter.end();
    QBuffer buffer;
    return image.save(&buffer, "PNG") ? buffer.data() : QByteArray();
}

} // namespace

bool savePlotPicture(const QString &fileName, const QSize &size, double ratio,
                     const std::function<void(QPainter &)> &paint)
{
    const QString suffix = QFileInfo(fileName).suffix().toLower();
    if (suffix != "png" && suffix != "svg") {
        Tracer::Trace(
            Tracer::Error,
            QString("Cannot write '%1': a picture's name ends in .png or .svg.").arg(fileName));
        return false;
    }
    const QByteArray bytes = suffix == "svg" ? svgOf(size, paint) : pngOf(size, ratio, paint);
    if (bytes.isEmpty()) {
        Tracer::Trace(Tracer::Error, QString("Cannot make the picture for '%1'.").arg(fileName));
        return false;
    }
    return writeFile(fileName, bytes);
}

bool savePlotData(const QString &fileName, const std::function<void(QTextStream &)> &write)
{
    QByteArray bytes;
    QTextStream stream(&bytes);
    write(stream);
    stream.flush();
    return writeFile(fileName, bytes);
}

void writeSampleTable(QTextStream &stream, std::span<const IqSample> samples,
                      std::span<const quint8> markers, qint64 first)
{
    stream << "sample,i,q,markers\n";
    for (std::size_t k = 0; k < samples.size(); ++k) {
        stream << first + static_cast<qint64>(k) << ','
               << QString::number(samples[k].i, 'g', SampleDigits) << ','
               << QString::number(samples[k].q, 'g', SampleDigits) << ','
               << static_cast<int>(k < markers.size() ? markers[k] : 0) << '\n';
    }
}

void writeSpectrumTable(QTextStream &stream, const SpectrumScene &scene)
{
    constexpr int Bins = SpectrumLines::FrameSize;
    constexpr int Digits = 6;
    const bool hasClock = scene.clockHz > 0;
    const auto frequency = [&](int bin) {
        const double share = static_cast<double>(bin) / Bins - 0.5;
        return QString::number(hasClock ? share * scene.clockHz : share, 'g', SampleDigits);
    };
    if (scene.mode == SpectrumMode::Spectrum) {
        stream << (hasClock ? "frequency_hz" : "frequency") << ",level_db\n";
        for (int bin = 0; bin < Bins && !scene.mean.empty(); ++bin) {
            stream << frequency(bin) << ','
                   << QString::number(scene.mean[static_cast<std::size_t>(bin)], 'g', Digits)
                   << '\n';
        }
        return;
    }
    stream << "sample";
    for (int bin = 0; bin < Bins; ++bin) {
        stream << ',' << frequency(bin);
    }
    stream << '\n';
    for (const SpectrumLines::Line &line : scene.lines.lines()) {
        stream << line.position;
        for (const double level : line.level) {
            stream << ',' << QString::number(level, 'g', Digits);
        }
        stream << '\n';
    }
}

QString withSuffix(const QString &fileName, const QString &suffix, const QStringList &known)
{
    const QString present = QFileInfo(fileName).suffix().toLower();
    return present == suffix || known.contains(present) ? fileName : fileName + '.' + suffix;
}
