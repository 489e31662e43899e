// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "CWidgetBase.h"
#include "SpectrumPainter.h"

/// Shows the frequency content of a stretch of samples, as a waterfall or as a mean spectrum.
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

    [[nodiscard]] const SpectrumScene &scene();

public slots:
    void clear();
    void col_rainbow();
    void col_blackwhite();
    void col_blue();
    void col_noise();
    void zoomInY();
    void zoomOutY();

protected:
    void drawPlot(QPainter &painter, const QRectF &area) override;
    void writeData(QTextStream &stream) override;
    [[nodiscard]] bool hasData() const override
    {
        return m_samples.size() >= SpectrumLines::FrameSize;
    }
    void extendContextMenu(QMenu &menu) override;
    void mouseMoveEvent(QMouseEvent *event) override;
    void leaveEvent(QEvent *event) override;

private:
    void updateLines();
    void zoomY(int direction);

    QList<CWidgetBase::IQData> m_samples;
    qint64 m_first = 0;
    bool m_dirty = false;
    SpectrumScene m_scene;
};
