// SPDX-License-Identifier: Apache-2.0
#include "DlgColors.h"

#include "appearance/ColorSet.h"
#include "appearance/QtColorTriangle.h"
#include "appearance/QtCustomHorLine.h"
#include "appearance/QtCustomLabel.h"
#include "appearance/lineicon.h"
#include "display/QtNumericEdit.h"
#include "log/Tracer.h"

#include <QBoxLayout>
#include <QColorDialog>
#include <QComboBox>
#include <QDir>
#include <QFileDialog>
#include <QGridLayout>
#include <QLabel>
#include <QListWidget>
#include <QPainter>
#include <QPushButton>
#include <QSignalBlocker>
#include <QSlider>
#include <QTabWidget>

#include <cmath>
#include <cstddef>

namespace {

constexpr int SlotRole = Qt::UserRole;
constexpr int OverallRange = 100; // percent, both ways
constexpr double FullHue = 360;

struct Tab
{
    const char *title;
    int first; ///< slot
    int end;
};

constexpr std::array<Tab, 3> Tabs{{
    {"General", static_cast<int>(ColorSlot::EntryEdit), static_cast<int>(ColorSlot::AverageTrace)},
    {"Traces", static_cast<int>(ColorSlot::AverageTrace),
     static_cast<int>(ColorSlot::LcdBackground1)},
    {"Application", static_cast<int>(ColorSlot::LcdBackground1), ColorSlotCount},
}};

constexpr std::array<const char *, ColorSlotCount> SlotTitles{"Field during typing",
                                                              "Plot background",
                                                              "Marked part of a plot",
                                                              "Value box",
                                                              "Frame of value box",
                                                              "Grid lines",
                                                              "Trigger symbol",
                                                              "Plot text",
                                                              "Cursor line",
                                                              "Primary marker",
                                                              "Secondary marker",
                                                              "Average trace",
                                                              "Peak trace",
                                                              "Random trace",
                                                              "Trace 4",
                                                              "Trace 5",
                                                              "Trace 6",
                                                              "Trace 7",
                                                              "Trace 8",
                                                              "Reference 1",
                                                              "Reference 2",
                                                              "Reference 3",
                                                              "Reference 4",
                                                              "Display, upper end",
                                                              "Display, lower end",
                                                              "Display lines",
                                                              "Window",
                                                              "Button",
                                                              "Lists and fields",
                                                              "Selection",
                                                              "Text",
                                                              "Disabled text",
                                                              "Borders"};

QIcon swatchIcon(const QColor &color, const QColor &frame, qreal ratio)
{
    constexpr QSize Size(28, 14);
    QPixmap picture(QSizeF(QSizeF(Size) * ratio).toSize());
    picture.setDevicePixelRatio(ratio);
    picture.fill(color);
    QPainter painter(&picture);
    painter.setPen(frame);
    painter.drawRect(QRectF(QPointF(), QSizeF(Size)).adjusted(0.5, 0.5, -0.5, -0.5));
    QIcon icon(picture);
    icon.addPixmap(picture, QIcon::Selected); // untinted
    return icon;
}

QtNumericEdit *numberField(const QString &name, const QString &objectName, double min, double max,
                           double step, int precision)
{
    auto *field = new QtNumericEdit;
    field->setObjectName(objectName);
    field->setAccessibleName(name);
    field->setPrecision(precision);
    field->setMin(min);
    field->setMax(max);
    field->setStep(step);
    field->setName(name);
    field->setMaximumWidth(80);
    return field;
}

QSlider *overallSlider(const QString &name, const QString &objectName)
{
    auto *slider = new QSlider(Qt::Horizontal);
    slider->setObjectName(objectName);
    slider->setRange(-OverallRange, OverallRange);
    slider->setToolTip(name);
    slider->setAccessibleName(name);
    return slider;
}

/// Whether a file holds anything of a colour set; the toolkit reads any text as an INI file.
bool isColorFile(const QSettings &file)
{
    if (file.status() != QSettings::NoError) {
        return false;
    }
    bool known = file.contains("_colorset_");
    for (int slot = 0; slot < ColorSlotCount; ++slot) {
        known = known || file.contains(colorSlotName(slot));
    }
    return known;
}

} // namespace

DlgColors::DlgColors(std::unique_ptr<QSettings> store, QWidget *parent)
    : QDialog(parent)
    , m_store(std::move(store))
{
    setObjectName("DlgColors");
    setWindowTitle("Application Colors");
    auto *body = new QHBoxLayout;
    body->setSpacing(12);
    body->addWidget(buildLists(), 1);
    body->addWidget(buildEditor());
    auto *layout = new QVBoxLayout(this);
    layout->setSpacing(10);
    layout->addLayout(body, 1);
    layout->addWidget(new QtCustomHorLine);
    layout->addWidget(buildOverall());
    layout->addWidget(new QtCustomHorLine);
    layout->addWidget(buildButtons());
    for (QListWidget *list : std::as_const(m_lists)) {
        list->setCurrentRow(0);
    }
    showAll();
}

QWidget *DlgColors::buildLists()
{
    auto *page = new QWidget;
    auto *layout = new QVBoxLayout(page);
    layout->setContentsMargins(0, 0, 0, 0);
    m_preset = new QComboBox;
    m_preset->setObjectName("cb_preset");
    m_preset->setAccessibleName("Preset");
    for (int preset = 0; preset < ColorPresetCount; ++preset) {
        m_preset->addItem(colorPresetName(static_cast<ColorPreset>(preset)));
    }
    auto *label = new QLabel("&Preset:");
    label->setBuddy(m_preset);
    auto *row = new QHBoxLayout;
    row->addWidget(label);
    row->addWidget(m_preset, 1);
    layout->addLayout(row);
    m_takeOver = new QPushButton("&Use this Preset as User Color Set");
    m_takeOver->setObjectName("pb_takeover");
    layout->addWidget(m_takeOver);

    m_tabs = new QTabWidget;
    m_tabs->setObjectName("tw_colors");
    for (const Tab &tab : Tabs) {
        auto *list = new QListWidget;
        list->setAccessibleName(QString("Colours: %1").arg(tab.title));
        list->setIconSize({28, 14});
        list->setMinimumHeight(240);
        for (int slot = tab.first; slot < tab.end; ++slot) {
            auto *item = new QListWidgetItem(SlotTitles[static_cast<std::size_t>(slot)], list);
            item->setData(SlotRole, slot);
            item->setToolTip(colorSlotName(slot));
        }
        m_lists.append(list);
        m_tabs->addTab(list, tab.title);
        connect(list, &QListWidget::currentRowChanged, this, &DlgColors::sel_color);
    }
    layout->addWidget(m_tabs, 1);
    connect(m_preset, &QComboBox::currentIndexChanged, this, &DlgColors::slot_preset);
    connect(m_takeOver, &QPushButton::clicked, this, &DlgColors::slot_takeover);
    connect(m_tabs, &QTabWidget::currentChanged, this, &DlgColors::tab_changed);
    return page;
}

QWidget *DlgColors::buildEditor()
{
    auto *page = new QWidget;
    auto *layout = new QVBoxLayout(page);
    layout->setContentsMargins(0, 0, 0, 0);
    m_swatch = new QtCustomLabel;
    m_swatch->setObjectName("l_color");
    layout->addWidget(m_swatch);
    m_triangle = new QtColorTriangle;
    m_triangle->setObjectName("w_triangle");
    layout->addWidget(m_triangle, 1);

    auto *grid = new QGridLayout;
    const auto addField = [&grid](const QString &letter, QtNumericEdit *field, int row,
                                  int column) {
        auto *label = new QLabel('&' + letter + ':');
        label->setBuddy(field);
        grid->addWidget(label, row, 2 * column);
        grid->addWidget(field, row, 2 * column + 1);
    };
    constexpr std::array<const char *, 3> RgbNames{"Red", "Green", "Blue"};
    constexpr std::array<const char *, 3> HsvNames{"Hue", "Saturation", "Value"};
    for (int i = 0; i < 3; ++i) {
        const auto place = static_cast<std::size_t>(i);
        const QString rgb = RgbNames[place];
        const QString hsv = HsvNames[place];
        const double most = i == 0 ? FullHue : 100;
        m_rgb[place] = numberField(rgb, "le_" + rgb.left(1).toLower(), 0, 255, 1, 0);
        m_hsv[place] = numberField(hsv, "le_" + hsv.left(1).toLower(), 0, most, 1, 1);
        m_hsv[place]->setUnit(i == 0 ? QString::fromUtf8("°") : "%");
        addField(rgb.left(1), m_rgb[place], i, 0);
        addField(hsv.left(1), m_hsv[place], i, 1);
        connect(m_rgb[place], &QtNumericEdit::valueUpdated, this, &DlgColors::slot_rgb);
        connect(m_hsv[place], &QtNumericEdit::valueUpdated, this, &DlgColors::slot_hsv);
    }
    layout->addLayout(grid);
    m_pick = new QPushButton("Pic&k...");
    m_pick->setObjectName("pb_pick");
    m_pick->setToolTip("Pick a colour from a palette or from the screen");
    layout->addWidget(m_pick);
    m_hint = new QLabel("Presets stay as they are. Take one over as the user color set to edit "
                        "its colors.");
    m_hint->setWordWrap(true);
    layout->addWidget(m_hint);
    connect(m_triangle, &QtColorTriangle::colorChanged, this, &DlgColors::slot_color_changed);
    connect(m_pick, &QPushButton::clicked, this, &DlgColors::slot_pick);
    return page;
}

QWidget *DlgColors::buildOverall()
{
    auto *page = new QWidget;
    auto *grid = new QGridLayout(page);
    grid->setContentsMargins(0, 0, 0, 0);
    m_brightness = overallSlider("Overall Brightness Value", "sb_brightness");
    m_contrast = overallSlider("Overall Contrast Value", "sb_contrast");
    m_brightnessEdit =
        numberField("Overall Brightness Value", "le_brightness", -OverallRange, OverallRange, 1, 0);
    m_contrastEdit = numberField("Overall Contrast Value", "le_contrast", -1, 1, 0.01, 2);
    const auto addRow = [&grid](const QString &text, QSlider *slider, QtNumericEdit *field,
                                int row) {
        auto *label = new QLabel(text);
        label->setBuddy(slider);
        grid->addWidget(label, row, 0);
        grid->addWidget(slider, row, 1);
        grid->addWidget(field, row, 2);
    };
    addRow("Bright&ness:", m_brightness, m_brightnessEdit, 0);
    addRow("&Contrast:", m_contrast, m_contrastEdit, 1);
    connect(m_brightness, &QSlider::valueChanged, this,
            qOverload<int>(&DlgColors::slot_brightness));
    connect(m_contrast, &QSlider::valueChanged, this, qOverload<int>(&DlgColors::slot_contrast));
    connect(m_brightnessEdit, &QtNumericEdit::valueUpdated, this,
            qOverload<double>(&DlgColors::slot_brightness));
    connect(m_contrastEdit, &QtNumericEdit::valueUpdated, this,
            qOverload<double>(&DlgColors::slot_contrast));
    return page;
}

QWidget *DlgColors::buildButtons()
{
    auto *page = new QWidget;
    auto *row = new QHBoxLayout(page);
    row->setContentsMargins(0, 0, 0, 0);
    const auto addButton = [&row, this](const QString &icon, const QString &text,
                                        const QString &name, auto slot) {
        auto *button = new QPushButton(lineIcon(icon), text);
        button->setObjectName(name);
        button->setAutoDefault(false);
        row->addWidget(button);
        connect(button, &QPushButton::clicked, this, slot);
    };
    m_takeOver->setAutoDefault(false); // Enter in a field takes its text alone
    m_pick->setAutoDefault(false);
    addButton("open", "&Load...", "pb_load", &DlgColors::slot_load);
    addButton("save", "Save &as...", "pb_saveas", &DlgColors::slot_saveas);
    row->addStretch();
    addButton("close", "Close", "cb_close", &DlgColors::reject);
    return page;
}

int DlgColors::currentSlot() const
{
    const QListWidgetItem *item = m_lists.at(m_tabs->currentIndex())->currentItem();
    return item ? item->data(SlotRole).toInt() : 0;
}

void DlgColors::showAll()
{
    const QSignalBlocker preset(m_preset);
    const QSignalBlocker brightness(m_brightness);
    const QSignalBlocker contrast(m_contrast);
    m_preset->setCurrentIndex(static_cast<int>(colorPreset()));
    m_brightness->setValue(colorBrightness());
    m_brightnessEdit->setVal(colorBrightness());
    m_contrast->setValue(static_cast<int>(std::lround(colorContrast() * OverallRange)));
    m_contrastEdit->setVal(colorContrast());
    const bool isUser = colorPreset() == ColorPreset::User;
    m_takeOver->setEnabled(!isUser);
    m_hint->setVisible(!isUser);
    m_triangle->setEnabled(isUser);
    m_pick->setEnabled(isUser);
    for (const auto &fields : {m_rgb, m_hsv}) {
        for (QtNumericEdit *field : fields) {
            field->setEnabled(isUser);
        }
    }
    showSwatches();
    showSlot();
}

void DlgColors::showSlot()
{
    const int slot = currentSlot();
    const QColor color = colorOf(slot, false);
    m_swatch->setText(
        QString("%1  %2").arg(SlotTitles[static_cast<std::size_t>(slot)], color.name()));
    m_triangle->setColor(color);
    m_rgb[0]->setVal(color.red());
    m_rgb[1]->setVal(color.green());
    m_rgb[2]->setVal(color.blue());
    const QColor hsv = color.toHsv();
    if (hsv.hsvHueF() >= 0) { // a grey keeps the last hue
        m_hsv[0]->setVal(static_cast<double>(hsv.hsvHueF()) * FullHue);
    }
    m_hsv[1]->setVal(static_cast<double>(hsv.hsvSaturationF()) * 100);
    m_hsv[2]->setVal(static_cast<double>(hsv.valueF()) * 100);
}

void DlgColors::showSwatches()
{
    const QColor frame = colorOf(ColorSlot::Borders);
    for (const QListWidget *list : std::as_const(m_lists)) {
        for (int row = 0; row < list->count(); ++row) {
            QListWidgetItem *item = list->item(row);
            item->setIcon(swatchIcon(colorOf(item->data(SlotRole).toInt(), false), frame,
                                     devicePixelRatioF()));
        }
    }
}

void DlgColors::changed()
{
    m_dirty = true;
    showAll();
    emit colorsChanged();
}

void DlgColors::tab_changed(int /*tab*/)
{
    showSlot();
}

void DlgColors::sel_color(int /*row*/)
{
    showSlot();
}

void DlgColors::slot_preset(int preset)
{
    if (preset >= 0 && preset < ColorPresetCount) {
        setColorPreset(static_cast<ColorPreset>(preset));
        changed();
    }
}

void DlgColors::slot_takeover()
{
    fillDefaults();
    setColorPreset(ColorPreset::User);
    changed();
}

void DlgColors::slot_brightness(int percent)
{
    setColorBrightness(percent);
    changed();
}

void DlgColors::slot_brightness(double percent)
{
    slot_brightness(static_cast<int>(std::lround(percent)));
}

void DlgColors::slot_contrast(int percent)
{
    slot_contrast(static_cast<double>(percent) / OverallRange);
}

void DlgColors::slot_contrast(double contrast)
{
    setColorContrast(contrast);
    changed();
}

void DlgColors::slot_rgb(double /*value*/)
{
    const auto channel = [this](std::size_t i) { return static_cast<int>(m_rgb[i]->getValInt()); };
    slot_color_changed(QColor(channel(0), channel(1), channel(2)));
}

void DlgColors::slot_hsv(double /*value*/)
{
    const auto share = [this](std::size_t i, double full) {
        return static_cast<float>(m_hsv[i]->getVal() / full);
    };
    slot_color_changed(QColor::fromHsvF(share(0, FullHue), share(1, 100), share(2, 100)));
}

void DlgColors::slot_color_changed(const QColor &color)
{
    if (colorPreset() == ColorPreset::User && color.isValid()) {
        setUserColor(currentSlot(), color);
        changed();
    }
}

void DlgColors::slot_pick()
{
    const QColor color = QColorDialog::getColor(
        colorOf(currentSlot(), false), this, SlotTitles[static_cast<std::size_t>(currentSlot())]);
    slot_color_changed(color);
}

void DlgColors::slot_saveas()
{
    QFileDialog dialog(this, "Save color set", QDir::homePath(), "Color Sets(*.col)");
    dialog.setAcceptMode(QFileDialog::AcceptSave);
    dialog.setDefaultSuffix("col");
    if (dialog.exec() != QDialog::Accepted) {
        return;
    }
    const QString path = dialog.selectedFiles().value(0);
    QSettings file(path, QSettings::IniFormat);
    saveColors(file);
    file.sync();
    if (file.status() == QSettings::NoError) {
        Tracer::Trace(Tracer::Information, QString("Saved color set '%1'").arg(path));
    } else {
        Tracer::Trace(Tracer::Error, QString("The color set '%1' cannot be written.").arg(path));
    }
}

void DlgColors::slot_load()
{
    const QString path =
        QFileDialog::getOpenFileName(this, "Load color set", QDir::homePath(), "Color Sets(*.col)");
    if (path.isEmpty()) {
        return;
    }
    QSettings file(path, QSettings::IniFormat);
    if (!isColorFile(file)) {
        Tracer::Trace(Tracer::Error, QString("'%1' is no color set.").arg(path));
        return;
    }
    loadColors(file);
    changed();
}

void DlgColors::store()
{
    if (!m_dirty) {
        return;
    }
    m_dirty = false;
    saveColors(*m_store);
    m_store->sync();
    if (m_store->status() != QSettings::NoError) {
        Tracer::Trace(Tracer::Error,
                      QString("The colors cannot be saved in '%1'.").arg(m_store->fileName()));
    }
}

void DlgColors::closeEvent(QCloseEvent *event)
{
    store();
    QDialog::closeEvent(event);
}

void DlgColors::done(int result)
{
    store();
    QDialog::done(result);
}

void DlgColors::showEvent(QShowEvent *event)
{
    showAll();
    QDialog::showEvent(event);
}
