// SPDX-License-Identifier: Apache-2.0
#include "StyleSheet.h"

#include "ColorSet.h"
#include "lineicon.h"

#include <QApplication>
#include <QColor>
#include <QSettings>

#include <algorithm>
#include <array>
#include <cmath>
#include <vector>

// Outside the namespace, as the macro wants it.
static void initResources()
{
    Q_INIT_RESOURCE(stylesheet);
}

namespace {

using enum ColorSlot;

struct Rule
{
    const char *format; ///< with a number for each of the colours, and @ for the folder of pictures
    std::vector<ColorSlot> colors;
};

const std::vector<Rule> &rules()
{
    static const std::vector<Rule> all{
        {"QWidget { background-color: %1; color: %2; selection-background-color: %3; "
         "selection-color: %2; }",
         {WindowBackground, AppText, Selection}},
        {"QWidget:disabled { color: %1; }", {AppTextDisabled}},
        {"QMainWindow, QDialog { background-color: %1; }", {WindowBackground}},
        {"QMainWindow::separator { background: %1; width: 5px; height: 5px; }", {WindowBackground}},
        {"QLabel, QCheckBox, QRadioButton { background: transparent; }", {}},
        {"QToolTip { background-color: %1; color: %2; border: 1px solid %3; padding: 2px; }",
         {TextBackground, AppText, Borders}},
        {"QFrame { border-color: %1; }", {Borders}},
        {"QFrame[frameShape=\"HLine\"], QtCustomHorLine { border: none; background-color: %1; "
         "max-height: 1px; }",
         {Borders}},
        {"QFrame[frameShape=\"VLine\"] { border: none; background-color: %1; max-width: 1px; }",
         {Borders}},
        {"QtCustomLabel { color: %1; background: qlineargradient(x1:0, y1:0, x2:0, y2:1, stop:0 "
         "%2, stop:1 %3); border: 1px solid %4; border-radius: 3px; padding: 4px 8px; }",
         {AppText, LcdBackground1, LcdBackground2, LcdGrid}},
        // Menus and bars
        {"QMenuBar { background-color: %1; border-bottom: 1px solid %2; }",
         {WindowBackground, Borders}},
        {"QMenuBar::item { background: transparent; padding: 4px 9px; border-radius: 3px; }", {}},
        {"QMenuBar::item:selected, QMenuBar::item:pressed { background-color: %1; }", {Selection}},
        {"QMenu { background-color: %1; border: 1px solid %2; padding: 3px; }",
         {TextBackground, Borders}},
        {"QMenu::item { background: transparent; padding: 4px 24px 4px 8px; border-radius: 3px; }",
         {}},
        {"QMenu::icon { padding-left: 6px; }", {}},
        {"QMenu::item:selected { background-color: %1; color: %2; }", {Selection, AppText}},
        {"QMenu::item:disabled { color: %1; }", {AppTextDisabled}},
        {"QMenu::separator { height: 1px; background: %1; margin: 4px 6px; }", {Borders}},
        {"QMenu::indicator { width: 14px; height: 14px; margin-left: 6px; }", {}},
        {"QMenu::indicator:checked { image: url(@/check.svg); }", {}},
        {"QMenu::right-arrow { image: url(@/right.svg); width: 10px; height: 10px; }", {}},
        {"QToolBar { background-color: %1; border: none; spacing: 3px; padding: 2px; }",
         {WindowBackground}},
        {"QStatusBar { background: qlineargradient(x1:0, y1:0, x2:0, y2:1, stop:0 %1, stop:1 %2); "
         "border-top: 1px solid %3; color: %4; }",
         {LcdBackground1, LcdBackground2, LcdGrid, AppText}},
        {"QStatusBar::item { border: none; }", {}},
        {"QSizeGrip { background: transparent; }", {}},
        // Buttons
        {"QPushButton { background-color: %1; border: 1px solid %2; border-radius: 3px; padding: "
         "4px 12px; min-height: 17px; }",
         {ButtonBase, Borders}},
        {"QToolButton { background-color: %1; border: 1px solid %2; border-radius: 3px; padding: "
         "3px; }",
         {ButtonBase, Borders}},
        {"QPushButton:hover, QToolButton:hover, QPushButton:focus, QToolButton:focus, "
         "QPushButton:default { border-color: %1; }",
         {AppText}},
        {"QPushButton:pressed, QToolButton:pressed, QPushButton:checked, QToolButton:checked { "
         "background-color: %1; }",
         {Selection}},
        {"QPushButton:disabled, QToolButton:disabled { background-color: %1; color: %2; "
         "border-color: %3; }",
         {WindowBackground, AppTextDisabled, Borders}},
        {"QToolButton[autoRaise=\"true\"]:!hover:!checked { background: transparent; border-color: "
         "transparent; }",
         {}},
        {"QToolButton::menu-indicator, QPushButton::menu-indicator { image: url(@/down.svg); "
         "width: 8px; height: 8px; }",
         {}},
        {"QPushButton::menu-indicator { subcontrol-origin: padding; subcontrol-position: center "
         "right; right: 5px; }",
         {}},
        // Fields
        {"QLineEdit, QTextEdit, QPlainTextEdit, QSpinBox, QDoubleSpinBox, QAbstractSpinBox { "
         "background-color: %1; color: %2; border: 1px solid %3; border-radius: 2px; padding: 2px "
         "4px; }",
         {TextBackground, AppText, Borders}},
        {"QLineEdit:focus, QTextEdit:focus, QPlainTextEdit:focus, QAbstractSpinBox:focus, "
         "QComboBox:focus { border-color: %1; }",
         {AppText}},
        {"QLineEdit[readOnly=\"true\"], QLineEdit:disabled, QAbstractSpinBox:disabled, "
         "QTextEdit:disabled { background-color: %1; }",
         {WindowBackground}},
        {"QLineEdit:disabled, QAbstractSpinBox:disabled, QComboBox:disabled { color: %1; }",
         {AppTextDisabled}},
        {"QtNumericEdit[edit_mode=\"false\"] { background-color: %1; }", {TextBackground}},
        {"QtNumericEdit[edit_mode=\"false\"]:disabled, QtNumericEdit[readOnly=\"true\"] { "
         "background-color: %1; }",
         {WindowBackground}},
        {"QSpinBox::up-button, QDoubleSpinBox::up-button { subcontrol-origin: border; "
         "subcontrol-position: top right; width: 18px; border: none; }",
         {}},
        {"QSpinBox::down-button, QDoubleSpinBox::down-button { subcontrol-origin: border; "
         "subcontrol-position: bottom right; width: 18px; border: none; }",
         {}},
        {"QSpinBox::up-arrow, QDoubleSpinBox::up-arrow { image: url(@/up.svg); width: 8px; height: "
         "8px; }",
         {}},
        {"QSpinBox::down-arrow, QDoubleSpinBox::down-arrow { image: url(@/down.svg); width: 8px; "
         "height: 8px; }",
         {}},
        {"QComboBox { background-color: %1; border: 1px solid %2; border-radius: 3px; padding: 2px "
         "22px 2px 7px; min-height: 17px; }",
         {ButtonBase, Borders}},
        {"QComboBox:hover { border-color: %1; }", {AppText}},
        {"QComboBox:editable { background-color: %1; }", {TextBackground}},
        {"QComboBox:disabled { background-color: %1; }", {WindowBackground}},
        {"QComboBox QLineEdit { border: none; padding: 0; }", {}},
        {"QComboBox::drop-down { subcontrol-origin: border; subcontrol-position: center right; "
         "width: 20px; border: none; }",
         {}},
        {"QComboBox::down-arrow { image: url(@/down.svg); width: 10px; height: 10px; }", {}},
        {"QComboBox QAbstractItemView { background-color: %1; border: 1px solid %2; }",
         {TextBackground, Borders}},
        {"QCheckBox, QRadioButton { spacing: 6px; }", {}},
        {"QCheckBox::indicator, QRadioButton::indicator, QGroupBox::indicator, "
         "QAbstractItemView::indicator { width: 13px; height: 13px; border: 1px solid %1; "
         "background-color: %2; }",
         {Borders, TextBackground}},
        {"QCheckBox::indicator, QGroupBox::indicator, QAbstractItemView::indicator { "
         "border-radius: 2px; }",
         {}},
        {"QRadioButton::indicator { border-radius: 7px; }", {}},
        {"QCheckBox::indicator:checked, QGroupBox::indicator:checked, "
         "QAbstractItemView::indicator:checked { image: url(@/check.svg); }",
         {}},
        {"QCheckBox::indicator:indeterminate, QAbstractItemView::indicator:indeterminate { image: "
         "url(@/dash.svg); }",
         {}},
        {"QRadioButton::indicator:checked { image: url(@/dot.svg); }", {}},
        {"QCheckBox::indicator:focus, QRadioButton::indicator:focus, QCheckBox::indicator:hover, "
         "QRadioButton::indicator:hover { border-color: %1; }",
         {AppText}},
        {"QCheckBox::indicator:disabled, QRadioButton::indicator:disabled { background-color: %1; "
         "}",
         {WindowBackground}},
        {"QSlider:horizontal { min-height: 20px; }", {}},
        {"QSlider::groove:horizontal { height: 4px; background: %1; border-radius: 2px; }",
         {Borders}},
        {"QSlider::handle:horizontal { width: 12px; margin: -6px 0; background: %1; border: 1px "
         "solid %2; border-radius: 3px; }",
         {ButtonBase, AppText}},
        {"QSlider::handle:focus { background: %1; }", {Selection}},
        // Containers
        {"QGroupBox { border: 1px solid %1; border-radius: 4px; margin-top: 9px; padding-top: 6px; "
         "}",
         {Borders}},
        {"QGroupBox::title { subcontrol-origin: margin; subcontrol-position: top left; left: 9px; "
         "padding: 0 4px; color: %1; }",
         {AppText}},
        {"QTabWidget::pane { border: 1px solid %1; top: -1px; }", {Borders}},
        {"QTabBar { background: transparent; }", {}},
        {"QTabBar::tab { background-color: %1; color: %2; border: 1px solid %3; padding: 4px 12px; "
         "border-top-left-radius: 3px; border-top-right-radius: 3px; margin-right: 2px; }",
         {ButtonBase, AppText, Borders}},
        {"QTabBar::tab:selected { background-color: %1; }", {Selection}},
        {"QTabBar::tab:focus { border-color: %1; }", {AppText}},
        {"QTabBar::tab:disabled { color: %1; }", {AppTextDisabled}},
        {"QSplitter::handle { background-color: %1; }", {WindowBackground}},
        {"QSplitter::handle:hover { background-color: %1; }", {Borders}},
        {"QDockWidget { color: %1; }", {AppText}},
        {"QDockWidget::title { background-color: %1; padding: 4px; }", {ButtonBase}},
        {"QMdiArea { background-color: %1; }", {WindowBackground}},
        {"QScrollArea { background-color: %1; }", {WindowBackground}},
        // Lists and tables
        {"QTreeView, QTreeWidget, QListView, QListWidget, QTableView, QTableWidget { "
         "background-color: %1; alternate-background-color: %2; border: 1px solid %3; "
         "gridline-color: %3; }",
         {TextBackground, LcdBackground1, Borders}},
        {"QTreeView:focus, QListView:focus, QTableView:focus { border-color: %1; }", {AppText}},
        {"QTreeView::item:selected, QListView::item:selected, QTableView::item:selected, "
         "QTreeView::branch:selected { background-color: %1; color: %2; }",
         {Selection, AppText}},
        {"QTreeView::item:disabled, QListView::item:disabled { color: %1; }", {AppTextDisabled}},
        {"QTreeView::branch:has-children:closed { image: url(@/branch-right.svg); }", {}},
        {"QTreeView::branch:has-children:open { image: url(@/branch-down.svg); }", {}},
        {"QHeaderView { background-color: %1; }", {ButtonBase}},
        {"QHeaderView::section { background-color: %1; color: %2; border: none; border-right: 1px "
         "solid %3; border-bottom: 1px solid %3; padding: 3px 6px; }",
         {ButtonBase, AppText, Borders}},
        {"QHeaderView::up-arrow { image: url(@/up.svg); width: 9px; height: 9px; "
         "subcontrol-position: center right; right: 4px; }",
         {}},
        {"QHeaderView::down-arrow { image: url(@/down.svg); width: 9px; height: 9px; "
         "subcontrol-position: center right; right: 4px; }",
         {}},
        {"QTableCornerButton::section { background-color: %1; border: none; }", {ButtonBase}},
        {"QScrollBar { background-color: %1; border: none; margin: 0; }", {TextBackground}},
        {"QScrollBar:vertical { width: 13px; }", {}},
        {"QScrollBar:horizontal { height: 13px; }", {}},
        {"QScrollBar::handle { background-color: %1; border-radius: 4px; margin: 2px; }",
         {Borders}},
        {"QScrollBar::handle:hover { background-color: %1; }", {AppTextDisabled}},
        {"QScrollBar::handle:vertical { min-height: 24px; }", {}},
        {"QScrollBar::handle:horizontal { min-width: 24px; }", {}},
        {"QScrollBar::add-line, QScrollBar::sub-line { width: 0; height: 0; }", {}},
        {"QScrollBar::add-page, QScrollBar::sub-page { background: transparent; }", {}},
        {"QProgressBar { background: qlineargradient(x1:0, y1:0, x2:0, y2:1, stop:0 %1, stop:1 "
         "%2); border: 1px solid %3; border-radius: 3px; color: %4; text-align: center; }",
         {LcdBackground1, LcdBackground2, LcdGrid, AppText}},
        {"QProgressBar::chunk { background-color: %1; border-radius: 2px; }", {Selection}},
    };
    return all;
}

/// Of the set's darkest and lightest text colours the one that is read better on this one.
QColor readableOn(const QColor &ground)
{
    const QColor text = colorOf(AppText);
    const QColor other = colorOf(TextBackground);
    return contrastRatio(text, ground) >= contrastRatio(other, ground) ? text : other;
}

double luminance(const QColor &color)
{
    const auto linear = [](double share) {
        return share <= 0.04045 ? share / 12.92 : std::pow((share + 0.055) / 1.055, 2.4);
    };
    return 0.2126 * linear(color.redF()) + 0.7152 * linear(color.greenF()) +
           0.0722 * linear(color.blueF());
}

bool isDark(const QPalette &palette)
{
    return luminance(palette.color(QPalette::Window)) <
           luminance(palette.color(QPalette::WindowText));
}

} // namespace

double contrastRatio(const QColor &a, const QColor &b)
{
    const double first = luminance(a);
    const double second = luminance(b);
    return (std::max(first, second) + 0.05) / (std::min(first, second) + 0.05);
}

QString applicationStyleSheet()
{
    QString sheet;
    for (const auto &[format, colors] : rules()) {
        QString rule = QString::fromLatin1(format);
        for (const ColorSlot slot : colors) {
            rule = rule.arg(colorOf(slot).name());
        }
        sheet += rule + '\n';
    }
    // The one rule of a plot colour: a field that holds typed text that isn't taken yet.
    const QColor edited = colorOf(EntryEdit);
    sheet += QString("QtNumericEdit[edit_mode=\"true\"] { background-color: %1; color: %2; "
                     "border-color: %2; }\n")
                 .arg(edited.name(), readableOn(edited).name());
    // The pictures are drawn for dark grounds and for light ones.
    const bool dark = isDark(applicationPalette());
    return sheet.replace("@", dark ? ":/Stylesheet/dark" : ":/Stylesheet/light");
}

QPalette applicationPalette()
{
    const QColor text = colorOf(AppText);
    const QColor borders = colorOf(Borders);
    QPalette palette(text, colorOf(ButtonBase), colorOf(ButtonBase).lighter(120), borders.darker(),
                     borders, text, text, colorOf(TextBackground), colorOf(WindowBackground));
    palette.setColor(QPalette::AlternateBase, colorOf(LcdBackground1));
    palette.setColor(QPalette::Highlight, colorOf(Selection));
    palette.setColor(QPalette::HighlightedText, text);
    palette.setColor(QPalette::ToolTipBase, colorOf(TextBackground));
    palette.setColor(QPalette::ToolTipText, text);
    palette.setColor(QPalette::PlaceholderText, colorOf(AppTextDisabled));
    palette.setColor(QPalette::Link, accentColor());
    for (const auto role : {QPalette::WindowText, QPalette::Text, QPalette::ButtonText}) {
        palette.setColor(QPalette::Disabled, role, colorOf(AppTextDisabled));
    }
    return palette;
}

void startColors(QSettings &store)
{
    const bool dark = isDark(QApplication::palette());
    fillDefaults();
    loadColors(store);
    if (!store.contains("_colorset_")) {
        setColorPreset(dark ? DefaultColorPreset : ColorPreset::Chalk);
    }
    applyColors();
}

void applyColors()
{
    initResources();
    QApplication::setPalette(applicationPalette());
    qApp->setStyleSheet(applicationStyleSheet());
}
