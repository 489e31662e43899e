// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "view/IqSample.h"
#include "view/SignalFigures.h"

#include <QGroupBox>
#include <QTimer>

#include <optional>
#include <vector>

class QLabel;

/// What is measured of the samples on view: levels, crest factor, DC, occupied bandwidth, and the
/// power in a band if there is one. Follows a view that moves when it comes to rest.
class FiguresBox : public QGroupBox
{
    Q_OBJECT

public:
    explicit FiguresBox(QWidget *parent = nullptr);

    void setSamples(const IqList &samples, double clockHz);
    void setBand(const std::optional<FrequencyBand> &band);
    void clear();

private:
    void measure();

    IqList m_samples;
    double m_clockHz = 0;
    std::optional<FrequencyBand> m_band;
    QTimer m_rest;
    std::vector<QLabel *> m_values;
};
