// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "CWidgetBase.h"
#include "SpectrumPainter.h"

/// Shows the frequency content of a stretch of samples, as a waterfall or as a spectrum, or the
/// distribution of its power.
///
/// The wheel zooms the spectrum's frequencies about the mouse, over the level axis it moves the
/// reference level, over the colour bar the range of levels. Dragging moves a zoomed spectrum, a
/// click sets the marker, a double click on an axis resets it.
class CWidgetSpectrum : public CWidgetBase
{
    Q_OBJECT

public:
    explicit CWidgetSpectrum(QWidget *parent = nullptr);

    /// The samples from position `first` to position `last` of one waveform. Transforms of earlier
    /// calls are used again where they cover the same frames; -1 for both forgets them.
    void setData(const QList<CWidgetBase::IQData> &samples, qint64 first, qint64 last);
    void setData(const QList<CWidgetBase::IQData> &samples);

    /// One of the modes of SpectrumMode; any other number is ignored.
    void setView(int mode);
    [[nodiscard]] int view() const { return static_cast<int>(m_scene.mode); }
    /// One of the modes of ColorMode; any other number is ignored.
    void setColorMode(int mode);
    [[nodiscard]] int colorMode() const { return static_cast<int>(m_scene.colors.mode()); }
    /// Clock rate in Hz, the width of the frequency axis; 0 labels it in shares of the clock.
    void setClock(double hz);
    /// How the spectrum is made of the samples.
    void setSettings(const SpectrumSettings &settings);
    [[nodiscard]] const SpectrumSettings &settings() const { return m_settings; }
    /// Sample of the measuring cursor, shown in the waterfall; nothing shows none.
    void setCursorSample(const std::optional<qint64> &sample);

    /// Frequencies (Hz) between the marker and the reference marker; nothing unless both are set.
    [[nodiscard]] std::optional<FrequencyBand> markedBand() const;

    [[nodiscard]] const SpectrumScene &scene();

signals:
    void markersChanged();

public slots:
    void clear();
    void col_rainbow();
    void col_blackwhite();
    void col_blue();
    void col_noise();
    void col_viridis();
    void zoomInY();
    void zoomOutY();
    /// Whether the colours of the waterfall follow the levels of the data; else they run from -150
    /// to 0 dB or where the wheel has moved them.
    void fitLevels(bool fit);
    void markPeak();
    void markNextPeak();
    /// Makes the marker the reference of the difference.
    void markReference();
    void clearMarkers();
    /// Shows the whole range of frequencies from 0 dB downwards.
    void resetScales();

protected:
    void drawPlot(QPainter &painter, const QRectF &area) override;
    void writeData(QTextStream &stream) override;
    [[nodiscard]] bool hasData() const override
    {
        return m_samples.size() >= SpectrumLines::FrameSize;
    }
    void extendContextMenu(QMenu &menu) override;
    void dropHover() override { m_scene.mouse.reset(); }
    void mouseMoveEvent(QMouseEvent *event) override;
    void mousePressEvent(QMouseEvent *event) override;
    void mouseReleaseEvent(QMouseEvent *event) override;
    void mouseDoubleClickEvent(QMouseEvent *event) override;
    void wheelEvent(QWheelEvent *event) override;
    void leaveEvent(QEvent *event) override;

private:
    void updateLines();
    void zoomY(int direction);
    void zoomFrequency(double factor, double x);
    void moveFrequency(double share);
    void changed();
    void setMarker(std::optional<double> share);

    QList<CWidgetBase::IQData> m_samples;
    qint64 m_first = 0;
    bool m_dirty = false;
    bool m_fitLevels = true;
    SpectrumSettings m_settings;
    SpectrumScene m_scene;
    std::optional<QPointF> m_pressed; ///< where a drag has begun
    bool m_dragged = false;
    int m_wheel = 0; ///< of a step, in eighths of a degree
};
