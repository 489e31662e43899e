// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <QDialog>
#include <QList>
#include <QSettings>

#include <array>
#include <memory>

class QComboBox;
class QLabel;
class QListWidget;
class QPushButton;
class QSlider;
class QTabWidget;
class QtColorTriangle;
class QtNumericEdit;

/// "Application Colors": chooses a preset of the colour set, edits the user's set, and shifts all
/// by brightness and contrast. Each change is made in the set at once and told by colorsChanged(),
/// whose receiver shows it. What was changed is saved when the window closes.
class DlgColors : public QDialog
{
    Q_OBJECT

public:
    /// Takes the store that the colours are saved in.
    explicit DlgColors(std::unique_ptr<QSettings> store, QWidget *parent = nullptr);

public slots:
    void tab_changed(int tab);
    void sel_color(int row);
    void slot_preset(int preset);
    void slot_brightness(int percent);
    void slot_brightness(double percent);
    void slot_contrast(int percent);
    void slot_contrast(double contrast);
    void slot_rgb(double value);
    void slot_hsv(double value);
    void slot_color_changed(const QColor &color);
    void slot_saveas();
    void slot_load();
    void slot_takeover(); ///< makes the user's set a copy of the preset
    void slot_pick();     ///< the toolkit's dialog of colours

signals:
    /// The colour set is another one now.
    void colorsChanged();

protected:
    void closeEvent(QCloseEvent *event) override;
    void done(int result) override;
    void showEvent(QShowEvent *event) override;

private:
    [[nodiscard]] QWidget *buildLists();
    [[nodiscard]] QWidget *buildEditor();
    [[nodiscard]] QWidget *buildOverall();
    [[nodiscard]] QWidget *buildButtons();
    [[nodiscard]] int currentSlot() const;
    void showAll();
    void showSlot();
    void showSwatches();
    void changed();
    void store();

    std::unique_ptr<QSettings> m_store;
    bool m_dirty = false;

    QComboBox *m_preset = nullptr;
    QPushButton *m_takeOver = nullptr;
    QTabWidget *m_tabs = nullptr;
    QList<QListWidget *> m_lists;
    QtColorTriangle *m_triangle = nullptr;
    QLabel *m_hint = nullptr;
    QLabel *m_swatch = nullptr;
    QPushButton *m_pick = nullptr;
    std::array<QtNumericEdit *, 3> m_rgb{};
    std::array<QtNumericEdit *, 3> m_hsv{};
    QSlider *m_brightness = nullptr;
    QSlider *m_contrast = nullptr;
    QtNumericEdit *m_brightnessEdit = nullptr;
    QtNumericEdit *m_contrastEdit = nullptr;
};
