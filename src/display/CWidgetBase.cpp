// SPDX-License-Identifier: Apache-2.0
#include "CWidgetBase.h"

#include "appearance/lineicon.h"
#include "plotexport.h"
#include "view/plotscale.h"

#include <QApplication>
#include <QClipboard>
#include <QContextMenuEvent>
#include <QFileDialog>
#include <QMenu>
#include <QPainter>
#include <QTextStream>

#include <algorithm>
#include <cstddef>
#include <span>

CWidgetBase::CWidgetBase(QWidget *parent)
    : QWidget(parent)
    , m_style(PlotStyle::current())
{
    setAttribute(Qt::WA_OpaquePaintEvent); // drawPlot fills all of it
}

void CWidgetBase::setColors(int colorSet)
{
    m_colorSet = colorSet;
    m_style = PlotStyle::current();
    update();
}

QString CWidgetBase::formatPower(double value, bool relative) const
{
    return powerText(value, relative, m_linearPower);
}

double CWidgetBase::powerToLog(double value) const
{
    return m_linearPower ? value : powerToDbm(value);
}

void CWidgetBase::powerToLog(double *out, double *in, int count) const
{
    if (count < 1) {
        return;
    }
    if (m_linearPower) {
        std::copy_n(in, count, out);
        return;
    }
    const auto size = static_cast<std::size_t>(count);
    powerToDbm(std::span(in, size), std::span(out, size));
}

void CWidgetBase::drawFlag(QPainter &painter, double x, double y, FlagShape shape, double size,
                           const QColor &color) const
{
    ::drawFlag(painter, x, y, shape, size, color);
}

void CWidgetBase::drawValueBox(QPainter &painter, const QPointF &anchor,
                               const QStringList &lines) const
{
    drawBox(painter, anchor, lines, BoxSide::Centered);
}

void CWidgetBase::drawValueBoxRight(QPainter &painter, const QPointF &anchor,
                                    const QStringList &lines) const
{
    drawBox(painter, anchor, lines, BoxSide::Right);
}

void CWidgetBase::drawValueBoxLeft(QPainter &painter, const QPointF &anchor,
                                   const QStringList &lines) const
{
    drawBox(painter, anchor, lines, BoxSide::Left);
}

void CWidgetBase::drawBox(QPainter &painter, const QPointF &anchor, const QStringList &lines,
                          BoxSide side) const
{
    ValueBox box;
    box.lines = lines;
    box.side = side;
    ::drawValueBox(painter, m_style, anchor, box, QRectF(rect()));
}

void CWidgetBase::setLinearPower(bool linear)
{
    m_linearPower = linear;
    update();
}

QImage CWidgetBase::picture()
{
    dropHover();
    const double ratio = devicePixelRatioF();
    QImage image(QSizeF(QSizeF(size()) * ratio).toSize(), QImage::Format_RGB32);
    image.setDevicePixelRatio(ratio);
    QPainter painter(&image);
    drawPlot(painter, QRectF(rect()));
    return image;
}

bool CWidgetBase::savePicture(const QString &fileName)
{
    dropHover();
    return savePlotPicture(fileName, size(), devicePixelRatioF(),
                           [this](QPainter &painter) { drawPlot(painter, QRectF(rect())); });
}

bool CWidgetBase::saveData(const QString &fileName)
{
    return savePlotData(fileName, [this](QTextStream &stream) { writeData(stream); });
}

void CWidgetBase::copyPicture()
{
    QApplication::clipboard()->setImage(picture());
}

void CWidgetBase::choosePictureFile()
{
    QString filter;
    QString fileName = QFileDialog::getSaveFileName(
        this, tr("Save Picture"), m_exportName,
        tr("PNG picture (*.png);;SVG picture (*.svg);;PDF picture (*.pdf)"), &filter);
    if (!fileName.isEmpty()) {
        const QString suffix = filter.section("*.", 1).section(')', 0, 0);
        fileName = withSuffix(fileName, suffix, pictureSuffixes());
        (void)savePicture(fileName); // the log tells of a failure
    }
}

void CWidgetBase::chooseDataFile()
{
    const QString fileName =
        QFileDialog::getSaveFileName(this, tr("Save Data"), m_exportName, tr("CSV table (*.csv)"));
    if (!fileName.isEmpty()) {
        (void)saveData(withSuffix(fileName, "csv", {}));
    }
}

void CWidgetBase::writeData(QTextStream &) {}

void CWidgetBase::extendContextMenu(QMenu &) {}

void CWidgetBase::paintEvent(QPaintEvent *)
{
    QPainter painter(this);
    drawPlot(painter, QRectF(rect()));
}

void CWidgetBase::contextMenuEvent(QContextMenuEvent *event)
{
    auto *menu = new QMenu(this);
    menu->setAttribute(Qt::WA_DeleteOnClose);
    extendContextMenu(*menu);
    if (!menu->isEmpty()) {
        menu->addSeparator();
    }
    menu->addAction(lineIcon("copy"), tr("Copy Picture"), this, &CWidgetBase::copyPicture);
    menu->addAction(lineIcon("save"), tr("Save Picture..."), this, &CWidgetBase::choosePictureFile);
    menu->addAction(lineIcon("export"), tr("Save Data..."), this, &CWidgetBase::chooseDataFile)
        ->setEnabled(hasData());
    menu->popup(event->globalPos());
    event->accept();
}

void CWidgetBase::setPlotMargins(const QMargins &margins)
{
    m_top = margins.top();
    m_bottom = margins.bottom();
    m_left = margins.left();
    m_right = margins.right();
}

QRectF CWidgetBase::plotRect() const
{
    return QRectF(rect()).adjusted(m_left, m_top, -m_right, -m_bottom);
}
