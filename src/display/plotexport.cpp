// SPDX-License-Identifier: Apache-2.0
#include "plotexport.h"

#include "SpectrumPainter.h"
#include "base/OutputFile.h"
#include "log/Tracer.h"

#include <QBuffer>
#include <QFileInfo>
#include <QImage>
#include <QPageSize>
#include <QPainter>
#include <QPdfWriter>
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

constexpr int ScreenDpi = 96; ///< of the texts' measures

QByteArray svgOf(const QSize &size, double ratio, const std::function<void(QPainter &)> &paint)
{
    QBuffer buffer;
    QSvgGenerator generator;
    generator.setOutputDevice(&buffer);
    generator.setResolution(ScreenDpi);
    generator.setSize(QSizeF(QSizeF(size) * ratio).toSize());
    generator.setViewBox(QRect(QPoint(), size));
    generator.setTitle("Corvane");
    QPainter painter(&generator);
    paint(painter);
    painter.end();
    return buffer.data();
}

QByteArray pdfOf(const QSize &size, double ratio, const std::function<void(QPainter &)> &paint)
{
    QBuffer buffer;
    buffer.open(QIODevice::WriteOnly);
    QPdfWriter writer(&buffer);
    writer.setResolution(ScreenDpi);
    writer.setTitle("Corvane");
    constexpr double PointsPerPixel = 72.0 / ScreenDpi;
    writer.setPageSize(QPageSize(QSizeF(size) * ratio * PointsPerPixel, QPageSize::Point, {},
                                 QPageSize::ExactMatch));
    writer.setPageMargins({});
    QPainter painter(&writer);
    painter.scale(ratio, ratio);
    paint(painter);
    painter.end();
    return buffer.data();
}

QByteArray pngOf(const QSize &size, double ratio, const std::function<void(QPainter &)> &paint)
{
    QImage image(QSizeF(QSizeF(size) * ratio).toSize(), QImage::Format_RGB32);
    if (image.isNull()) {
        return {};
    }
    image.setDevicePixelRatio(ratio);
    QPainter painter(&image);
    paint(painter);
    painter.end();
    QBuffer buffer;
    return image.save(&buffer, "PNG") ? buffer.data() : QByteArray();
}

} // namespace

QStringList pictureSuffixes()
{
    return {"png", "svg", "pdf"};
}

QByteArray plotPicture(const QString &suffix, const QSize &size, double ratio,
                       const std::function<void(QPainter &)> &paint)
{
    if (suffix == "svg") {
        return svgOf(size, ratio, paint);
    }
    return suffix == "pdf" ? pdfOf(size, ratio, paint) : pngOf(size, ratio, paint);
}

bool savePlotPicture(const QString &fileName, const QSize &size, double ratio,
                     const std::function<void(QPainter &)> &paint)
{
    const QString suffix = QFileInfo(fileName).suffix().toLower();
    if (!pictureSuffixes().contains(suffix)) {
        return Tracer::fail(
            QString("Cannot write '%1': a picture's name ends in .png, .svg or .pdf.")
                .arg(fileName));
    }
    // Lines and texts of drawings have no pixels of a screen.
    const QByteArray bytes = plotPicture(suffix, size, suffix == "png" ? ratio : 1, paint);
    if (bytes.isEmpty()) {
        return Tracer::fail(QString("Cannot make the picture for '%1'.").arg(fileName));
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
    const bool hasClock = scene.clockHz > 0;
    const auto frequency = [&](std::size_t point, std::size_t points) {
        const double share = static_cast<double>(point) / static_cast<double>(points) - 0.5;
        return QString::number(hasClock ? share * scene.clockHz : share, 'g', SampleDigits);
    };
    constexpr int Digits = 6;
    if (scene.mode == SpectrumMode::Ccdf) {
        stream << "over_mean_db,probability\n";
        for (const CcdfPoint &point : scene.figures.ccdf) {
            stream << point.overMeanDb << ','
                   << QString::number(point.probability, 'g', SampleDigits) << '\n';
        }
        return;
    }
    if (scene.mode == SpectrumMode::Spectrum) {
        const SpectrumTrace &trace = scene.trace;
        stream << (hasClock ? "frequency_hz" : "frequency") << ",level_db"
               << (trace.maximum.empty() ? "" : ",max_db") << '\n';
        for (std::size_t point = 0; point < trace.level.size(); ++point) {
            stream << frequency(point, trace.level.size()) << ','
                   << QString::number(trace.level[point], 'g', Digits);
            if (!trace.maximum.empty()) {
                stream << ',' << QString::number(trace.maximum[point], 'g', Digits);
            }
            stream << '\n';
        }
        return;
    }
    constexpr std::size_t Bins = SpectrumLines::FrameSize;
    stream << "sample";
    for (std::size_t bin = 0; bin < Bins; ++bin) {
        stream << ',' << frequency(bin, Bins);
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
