// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <QList>
#include <QPaintDevice>
#include <QPaintEngine>
#include <QRectF>
#include <QString>
#include <QTransform>

/// A paint device that keeps the places of all texts drawn on it and nothing else.
class TextRecorder : public QPaintDevice
{
public:
    struct Text
    {
        QString words;
        QRectF place;
    };

    explicit TextRecorder(const QSize &size)
        : m_size(size)
        , m_engine(m_texts)
    {
    }

    QPaintEngine *paintEngine() const override { return &m_engine; }
    const QList<Text> &texts() const { return m_texts; }

protected:
    int metric(PaintDeviceMetric which) const override
    {
        switch (which) {
        case PdmWidth:
            return m_size.width();
        case PdmHeight:
            return m_size.height();
        case PdmDpiX:
        case PdmDpiY:
        case PdmPhysicalDpiX:
        case PdmPhysicalDpiY:
            return 96;
        case PdmDepth:
            return 32;
        case PdmDevicePixelRatio:
            return 1;
        case PdmDevicePixelRatioScaled:
            return static_cast<int>(devicePixelRatioFScale());
        default:
            return 0;
        }
    }

private:
    class Engine : public QPaintEngine
    {
    public:
        explicit Engine(QList<Text> &texts)
            : QPaintEngine(AllFeatures)
            , m_texts(texts)
        {
        }
        bool begin(QPaintDevice *) override { return true; }
        bool end() override { return true; }
        void updateState(const QPaintEngineState &changes) override
        {
            if ((changes.state() & DirtyTransform) != 0) {
                m_transform = changes.transform();
            }
        }
        void drawPixmap(const QRectF &, const QPixmap &, const QRectF &) override {}
        void drawImage(const QRectF &, const QImage &, const QRectF &,
                       Qt::ImageConversionFlags) override
        {
        }
        void drawRects(const QRectF *, int) override {}
        void drawRects(const QRect *, int) override {}
        void drawPath(const QPainterPath &) override {}
        void drawPolygon(const QPointF *, int, PolygonDrawMode) override {}
        void drawPolygon(const QPoint *, int, PolygonDrawMode) override {}
        void drawEllipse(const QRectF &) override {}
        void drawTextItem(const QPointF &base, const QTextItem &item) override
        {
            const QRectF place(base.x(), base.y() - item.ascent(), item.width(),
                               item.ascent() + item.descent());
            m_texts += {item.text(), m_transform.mapRect(place)};
        }
        Type type() const override { return User; }

    private:
        QList<Text> &m_texts;
        QTransform m_transform;
    };

    QSize m_size;
    QList<Text> m_texts;
    mutable Engine m_engine;
};
