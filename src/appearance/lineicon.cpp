// SPDX-License-Identifier: Apache-2.0
#include "lineicon.h"

#include "ColorSet.h"
#include "StyleSheet.h"

#include "log/Tracer.h"

#include <QFile>
#include <QHash>
#include <QIconEngine>
#include <QPainter>
#include <QPixmap>
#include <QPixmapCache>
#include <QSvgRenderer>

#include <utility>

// Outside the namespace, as the macro wants it.
static void initIcons()
{
    Q_INIT_RESOURCE(icons);
}

namespace {

using enum ColorSlot;

// The colours in the drawings, which so can be looked at with any viewer.
constexpr char DrawnInk[] = "#303030";
constexpr char DrawnAccent[] = "#1a6fd0";
constexpr const char *DrawnLamps[] = {"#009759", "#dcc319", "#c9232b"};

class LineIconEngine : public QIconEngine
{
public:
    LineIconEngine(QString name, QByteArray drawing)
        : m_name(std::move(name))
        , m_drawing(std::move(drawing))
    {
    }

    void paint(QPainter *painter, const QRect &rect, QIcon::Mode mode, QIcon::State state) override
    {
        const double ratio = painter->device()->devicePixelRatioF();
        painter->drawPixmap(
            rect, scaledPixmap((QSizeF(rect.size()) * ratio).toSize(), mode, state, ratio));
    }

    QPixmap pixmap(const QSize &size, QIcon::Mode mode, QIcon::State state) override
    {
        return scaledPixmap(size, mode, state, 1);
    }

    /// The size is in pixels of the device.
    QPixmap scaledPixmap(const QSize &size, QIcon::Mode mode, QIcon::State /*state*/,
                         qreal /*scale*/) override
    {
        const QColor ink = colorOf(mode == QIcon::Disabled ? AppTextDisabled : AppText);
        const bool oneColor = mode == QIcon::Disabled || mode == QIcon::Selected;
        const QColor accent = oneColor ? ink : accentColor();
        const QString key = QString("lineicon/%1/%2x%3/%4/%5/%6")
                                .arg(m_name)
                                .arg(size.width())
                                .arg(size.height())
                                .arg(mode)
                                .arg(ink.name(), accent.name());
        QPixmap picture;
        if (!QPixmapCache::find(key, &picture)) {
            picture = render(size, ink, accent, mode == QIcon::Disabled);
            QPixmapCache::insert(key, picture);
        }
        return picture;
    }

    QString key() const override { return "lineicon"; }

    QIconEngine *clone() const override { return new LineIconEngine(m_name, m_drawing); }

private:
    [[nodiscard]] QPixmap render(const QSize &size, const QColor &ink, const QColor &accent,
                                 bool withoutLamps) const
    {
        QByteArray drawing = m_drawing;
        drawing.replace(DrawnInk, ink.name().toLatin1());
        drawing.replace(DrawnAccent, accent.name().toLatin1());
        if (withoutLamps) {
            for (const char *lamp : DrawnLamps) {
                drawing.replace(lamp, ink.name().toLatin1());
            }
        }
        QPixmap picture(size);
        picture.fill(Qt::transparent);
        QSvgRenderer renderer(drawing);
        renderer.setAspectRatioMode(Qt::KeepAspectRatio);
        QPainter painter(&picture);
        painter.setRenderHint(QPainter::Antialiasing);
        renderer.render(&painter);
        return picture;
    }

    QString m_name;
    QByteArray m_drawing;
};

} // namespace

QIcon lineIcon(const QString &name)
{
    static QHash<QString, QIcon> icons; // a folder of an instrument asks for each of its entries
    initIcons();
    auto icon = icons.find(name);
    if (icon == icons.end()) {
        QFile file(":/icons/" + name + ".svg");
        if (!file.open(QIODevice::ReadOnly)) {
            Tracer::Trace(Tracer::Error, QString("There is no icon '%1'.").arg(name));
            return {};
        }
        icon = icons.insert(name, QIcon(new LineIconEngine(name, file.readAll())));
    }
    return *icon;
}

QColor accentColor()
{
    const bool dark = contrastRatio(colorOf(AppText), Qt::black) >
                      contrastRatio(colorOf(WindowBackground), Qt::black);
    return colorOf(dark ? PeakTrace : AverageTrace);
}
