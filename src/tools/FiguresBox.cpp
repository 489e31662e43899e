// SPDX-License-Identifier: Apache-2.0
#include "FiguresBox.h"

#include "base/EngineeringNumber.h"
#include "jobs/MeasureJob.h"

#include <QGridLayout>
#include <QLabel>

#include <cmath>
#include <utility>

namespace {

QString shortText(const NamedFigure &figure)
{
    const QString unit = figure.unit;
    if (!std::isfinite(figure.value)) {
        return "---";
    }
    if (unit == "dB") {
        return QString::number(figure.value, 'f', 2) + " dB";
    }
    return unit == "Hz" ? formatNumber(figure.value, NumberFormat{.unit = unit, .precision = 3})
                        : QString::number(figure.value, 'f', 5);
}

/// The number of samples stands elsewhere in the window.
std::vector<NamedFigure> shownFigures(const SignalFigures &figures)
{
    std::vector<NamedFigure> all = namedFigures(figures);
    all.erase(all.begin());
    return all;
}

} // namespace

FiguresBox::FiguresBox(QWidget *parent)
    : QGroupBox("Measured on View", parent)
{
    auto *grid = new QGridLayout(this);
    int row = 0;
    for (const NamedFigure &figure : shownFigures({})) {
        const QString label = figure.label;
        grid->addWidget(new QLabel(label, this), row, 0);
        auto *value = new QLabel("---", this);
        value->setObjectName(QString("l_") + figure.name);
        value->setAlignment(Qt::AlignRight | Qt::AlignVCenter);
        value->setTextInteractionFlags(Qt::TextSelectableByMouse);
        value->setToolTip(label + " of the samples on view");
        value->setMinimumWidth(value->fontMetrics().horizontalAdvance("-888.888 MHz"));
        grid->addWidget(value, row, 1);
        m_values.push_back(value);
        ++row;
    }
    constexpr int RestMs = 80; // between two steps of a view that is being moved
    m_rest.setInterval(RestMs);
    m_rest.setSingleShot(true);
    connect(&m_rest, &QTimer::timeout, this, &FiguresBox::measure);
}

void FiguresBox::setSamples(const IqList &samples, double clockHz)
{
    m_samples = samples;
    m_clockHz = clockHz;
    m_rest.start();
}

void FiguresBox::setBand(const std::optional<FrequencyBand> &band)
{
    m_band = band;
    m_rest.start();
}

void FiguresBox::clear()
{
    m_samples.clear();
    m_rest.stop();
    for (QLabel *value : m_values) {
        value->setText("---");
    }
}

void FiguresBox::measure()
{
    if (m_samples.isEmpty()) {
        return;
    }
    MemorySource source(std::as_const(m_samples));
    const auto figures = measureFigures(source, m_clockHz, m_band);
    if (!figures) {
        return;
    }
    std::size_t row = 0;
    for (const NamedFigure &figure : shownFigures(*figures)) {
        m_values[row++]->setText(shortText(figure));
    }
}
