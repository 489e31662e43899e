// SPDX-License-Identifier: Apache-2.0
#include "CompareView.h"

#include "LevelTable.h"

#include "display/CWidgetIQTrace.h"
#include "view/iqlevels.h"

#include <QButtonGroup>
#include <QHBoxLayout>
#include <QRadioButton>
#include <QVBoxLayout>

CompareView::CompareView(QWidget *parent)
    : QWidget(parent)
    , m_choice(new QHBoxLayout)
    , m_buttons(new QButtonGroup(this))
    , m_trace(new CWidgetIQTrace(this))
    , m_levels(new LevelTable(this))
{
    m_trace->setObjectName("w_iqtrace");
    m_trace->setMinimumHeight(130);
    m_levels->setObjectName("w_levels");
    auto *layout = new QVBoxLayout(this);
    layout->setContentsMargins(0, 0, 0, 0);
    layout->addLayout(m_choice);
    layout->addWidget(m_trace, 1);
    layout->addWidget(m_levels);
    connect(m_buttons, &QButtonGroup::idToggled, this, [this](int, bool on) {
        if (on) {
            refresh();
        }
    });
}

void CompareView::setSignals(const QStringList &names)
{
    for (int i = 0; i < names.size(); ++i) {
        auto *button = new QRadioButton(names[i], this);
        button->setObjectName(QString("rb_show_%1").arg(i + 1));
        button->setToolTip("Show this signal, at the same scales");
        m_buttons->addButton(button, i);
        m_choice->addWidget(button);
    }
    m_choice->addStretch(1);
    m_levels->setSignals(QStringList(names).replaceInStrings("&", ""));
    m_buttons->button(static_cast<int>(names.size()) - 1)->setChecked(true);
}

void CompareView::setClock(double hz)
{
    m_trace->setClock(hz);
}

void CompareView::setSamples(const QList<IqList> &samples)
{
    m_samples = samples;
    for (int i = 0; i < samples.size(); ++i) {
        m_levels->setLevels(i, levelsOf(samples[i]), samples[i].size());
    }
    refresh();
}

void CompareView::clear()
{
    m_samples.clear();
    m_levels->clear();
    m_trace->clear();
}

int CompareView::shown() const
{
    return m_buttons->checkedId();
}

void CompareView::refresh()
{
    if (shown() >= 0 && shown() < m_samples.size()) {
        m_trace->setData(m_samples[shown()]);
    }
}
