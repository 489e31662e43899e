// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "PlotStyle.h"
#include "plotdraw.h"
#include "view/IqSample.h"

#include <QImage>
#include <QWidget>

class QMenu;
class QTextStream;

/// The common base of the painted displays. It holds the palette, the font and the margins of the
/// plot, and offers what all of them need: values as text, powers in dB, flags and value boxes, and
/// a context menu that copies and saves the picture and saves the data behind it.
///
/// It draws nothing itself: a derived class draws into whatever painter drawPlot is handed, which
/// is the screen, a picture or a file.
class CWidgetBase : public QWidget
{
    Q_OBJECT

public:
    using IQData = IqSample;

    explicit CWidgetBase(QWidget *parent = nullptr);

    /// Takes the palette from the colour set; to be called again when the set has changed.
    virtual void setColors(int colorSet);

    /// A power as text: with linearPower in watts with a prefix, else in dB, see powerText.
    [[nodiscard]] virtual QString formatPower(double value, bool relative) const;

    /// A power in watts as dBm; unchanged with linearPower.
    [[nodiscard]] virtual double powerToLog(double value) const;
    /// The vector form; zeros in `in` are replaced by the value before them. A plain copy with
    /// linearPower.
    virtual void powerToLog(double *out, double *in, int count) const;

    virtual void drawFlag(QPainter &painter, double x, double y, FlagShape shape, double size,
                          const QColor &color) const;

    /// The box writers put the box below the anchor, at its right or at its left.
    virtual void drawValueBox(QPainter &painter, const QPointF &anchor,
                              const QStringList &lines) const;
    virtual void drawValueBoxRight(QPainter &painter, const QPointF &anchor,
                                   const QStringList &lines) const;
    virtual void drawValueBoxLeft(QPainter &painter, const QPointF &anchor,
                                  const QStringList &lines) const;

    /// Shows powers in watts instead of dB.
    void setLinearPower(bool linear);
    [[nodiscard]] bool isLinearPower() const { return m_linearPower; }

    /// The plot as it is shown now, at the resolution of the screen.
    [[nodiscard]] QImage picture();

    /// Saves the plot; the suffix decides between PNG and SVG. False, and a line in the log, if
    /// that fails; an existing file is then left as it was.
    [[nodiscard]] bool savePicture(const QString &fileName);

    /// Saves the shown data as CSV. Same failures.
    [[nodiscard]] bool saveData(const QString &fileName);

    [[nodiscard]] QSize sizeHint() const override { return {400, 300}; }
    [[nodiscard]] QSize minimumSizeHint() const override { return {200, 120}; }

    /// The name, without suffix, that the dialogs for saving propose.
    void setExportName(const QString &name) { m_exportName = name; }

signals:
    /// A double click asks for the whole room, or for the place of before.
    void enlargeRequested();

public slots:
    void copyPicture();
    void choosePictureFile();
    void chooseDataFile();

protected:
    /// Draws the whole display into a part of any painter.
    virtual void drawPlot(QPainter &painter, const QRectF &area) = 0;

    /// Writes the shown data as CSV with a header line; nothing when there are none.
    virtual void writeData(QTextStream &stream);
    [[nodiscard]] virtual bool hasData() const { return false; }

    /// Forgets the place of the mouse, which no saved picture shows.
    virtual void dropHover() {}

    /// Adds the entries of the derived display above those of the base.
    virtual void extendContextMenu(QMenu &menu);

    void paintEvent(QPaintEvent *event) override;
    void contextMenuEvent(QContextMenuEvent *event) override;

    [[nodiscard]] const PlotStyle &plotStyle() const { return m_style; }
    void setPlotMargins(const QMargins &margins);
    /// The part of the widget within the margins.
    [[nodiscard]] QRectF plotRect() const;

private:
    void drawBox(QPainter &painter, const QPointF &anchor, const QStringList &lines,
                 BoxSide side) const;

    int m_top = 0;
    int m_bottom = 0;
    int m_left = 0;
    int m_right = 0;
    bool m_linearPower = false;
    int m_colorSet = 0;
    QString m_exportName;
    PlotStyle m_style; ///< palette and font
};
