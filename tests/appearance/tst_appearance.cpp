// SPDX-License-Identifier: Apache-2.0
#include "appearance/ColorSet.h"
#include "appearance/QtColorTriangle.h"
#include "appearance/StyleSheet.h"
#include "appearance/lineicon.h"
#include "appearance/ui/DlgColors.h"
#include "display/QtNumericEdit.h"
#include "log/Tracer.h"
#include "support/files.h"
#include "support/modals.h"
#include "support/rows.h"

#include <QAbstractButton>
#include <QApplication>
#include <QComboBox>
#include <QDir>
#include <QFile>
#include <QFileDialog>
#include <QLineEdit>
#include <QListWidget>
#include <QSettings>
#include <QSignalSpy>
#include <QTabWidget>
#include <QTest>

#include <cmath>

using enum ColorSlot;

class TestAppearance : public QObject
{
    Q_OBJECT

private slots:
    void init();
    void presetsCanBeRead();
    void brightnessAndContrast();
    void storesAreRead();
    void setsComeBackFromFiles();
    void firstStartFollowsTheDesktop();
    void rulesCoverAllClasses();
    void iconsFollowTheSet();
    void dialogEditsAndSaves();
    void triangleShowsAndPicks();

private:
    TestFolder m_folder;
};

void TestAppearance::init()
{
    QSettings empty(m_folder.path("none.ini"), QSettings::IniFormat);
    loadColors(empty);
}

void TestAppearance::presetsCanBeRead()
{
    // Luminance by a formula of its own: the power law that the standard's curve stands for.
    const auto ratio = [](ColorSlot above, ColorSlot below) {
        const auto luminance = [](const QColor &c) {
            return 0.2126 * std::pow(c.redF(), 2.2) + 0.7152 * std::pow(c.greenF(), 2.2) +
                   0.0722 * std::pow(c.blueF(), 2.2);
        };
        const double a = luminance(colorOf(above));
        const double b = luminance(colorOf(below));
        return (std::max(a, b) + 0.05) / (std::min(a, b) + 0.05);
    };
    const auto check = [&](ColorSlot above, const QList<ColorSlot> &grounds, double least) {
        for (const ColorSlot below : grounds) {
            const double found =
                std::min(ratio(above, below), contrastRatio(colorOf(above), colorOf(below)));
            QVERIFY2(found >= least, qPrintable(QString("%1 on %2: %3 to 1")
                                                    .arg(colorSlotName(static_cast<int>(above)),
                                                         colorSlotName(static_cast<int>(below)))
                                                    .arg(found)));
        }
    };
    for (int preset = 0; preset < ColorPresetCount; ++preset) {
        setColorPreset(static_cast<ColorPreset>(preset));
        check(AppText,
              {WindowBackground, ButtonBase, TextBackground, Selection, LcdBackground1,
               LcdBackground2},
              4.5);
        check(Text, {PanelBackground, MarkedBackground, TextboxBackground}, 4.5);
        check(AppTextDisabled, {WindowBackground, TextBackground}, 3);
        for (int slot = static_cast<int>(TriggerSymbol); slot <= static_cast<int>(Ref4); ++slot) {
            check(static_cast<ColorSlot>(slot), {PanelBackground}, 3);
        }
        for (const ColorSlot ground : {WindowBackground, ButtonBase, TextBackground, Selection}) {
            QVERIFY2(contrastRatio(accentColor(), colorOf(ground)) >= 3,
                     qPrintable(colorSlotName(static_cast<int>(ground))));
        }
        check(GridLines, {PanelBackground}, 2);
        check(Borders, {WindowBackground, TextBackground}, 1.7);
        // Of a field during typing.
        QVERIFY(std::max(ratio(AppText, EntryEdit), ratio(TextBackground, EntryEdit)) >= 4.5);
    }
}

void TestAppearance::brightnessAndContrast()
{
    // The last value is a percentage: above 0 lighter, below 0 darker, 0 unchanged.
    // k = trunc(0.255 * weight * -100): 25 behind, -25 upon it, -12 of a trace
    forRows({{"neutral", 0, 0.0, AppText, 0},
             {"brighter", 30, 0.0, ButtonBase, 130},
             {"brighter than any", 500, 0.0, ButtonBase, 200},
             {"darker than any", -999999, 0.0, ButtonBase, -200},
             {"contrast behind", 0, 0.255, ButtonBase, -125},
             {"contrast upon", 0, 0.255, GridLines, 125},
             {"contrast of a trace", 0, 0.255, PeakTrace, 112},
             {"both", 10, 0.1, ButtonBase, 0},
             {"no number", 0, std::nan(""), ButtonBase, 0},
             {"beyond integers", 0, 1e300, ButtonBase, -200}},
            [this](int brightness, double contrast, ColorSlot slot, int percent) {
                init();
                setColorBrightness(brightness);
                setColorContrast(contrast);
                const QColor plain = presetColor(ColorPreset::Copper, static_cast<int>(slot));
                const QColor expected = percent == 0  ? plain
                                        : percent > 0 ? plain.lighter(percent)
                                                      : plain.darker(-percent);
                QCOMPARE(colorOf(slot).rgb(), expected.rgb());
                QCOMPARE(colorOf(slot, false), plain);
            });
}

void TestAppearance::storesAreRead()
{
    const QRgb copper = presetColor(ColorPreset::Copper, static_cast<int>(ButtonBase)).rgb();
    const QRgb chalk = presetColor(ColorPreset::Chalk, static_cast<int>(ButtonBase)).rgb();
    const QRgb red = qRgb(255, 0, 0);
    forRows({{"empty", "", ColorPreset::Copper, copper},
             {"preset beyond the last", "_colorset_=9", ColorPreset::Copper, copper},
             {"preset is a word", "_colorset_=blue", ColorPreset::Copper, copper},
             {"preset of white paper", "_colorset_=3", ColorPreset::Chalk, chalk},
             {"user", "_colorset_=6\nApp.Button.Base=#102030", ColorPreset::User, qRgb(16, 32, 48)},
             {"damaged color", "_colorset_=6\nApp.Button.Base=#10203", ColorPreset::User, red},
             {"color is a list", "_colorset_=6\nApp.Button.Base=1, 2", ColorPreset::User, red},
             {"user without a color", "_colorset_=6\n_brightness_=x\n_contrast_=y",
              ColorPreset::User, copper}},
            [this](const QByteArray &text, ColorPreset preset, QRgb button) {
                init();
                QVERIFY(m_folder.store("store.ini", "[General]\n" + text + '\n'));
                QSettings store(m_folder.path("store.ini"), QSettings::IniFormat);
                loadColors(store);
                QCOMPARE(colorPreset(), preset);
                QCOMPARE(colorOf(ButtonBase).rgb(), button);
                QCOMPARE(colorBrightness(), 0);
                QCOMPARE(colorContrast(), 0.0);
            });
}

void TestAppearance::setsComeBackFromFiles()
{
    setColorPreset(ColorPreset::Sky);
    fillDefaults();
    setColorPreset(ColorPreset::User);
    setUserColor(static_cast<int>(Trace8), QColor(1, 2, 3));
    setColorBrightness(-12);
    setColorContrast(0.35);
    QList<QRgb> before;
    for (int slot = 0; slot < ColorSlotCount; ++slot) {
        before.append(colorOf(slot).rgb());
    }
    QSettings file(m_folder.path("mine.col"), QSettings::IniFormat);
    saveColors(file);
    file.sync();
    QCOMPARE(file.allKeys().size(), ColorSlotCount + 3);
    QCOMPARE(file.value("Trace8").toString(), "#010203");
    QCOMPARE(file.value("GridLines").toString(),
             presetColor(ColorPreset::Sky, static_cast<int>(GridLines)).name());

    init();
    QSettings again(file.fileName(), QSettings::IniFormat);
    loadColors(again);
    for (int slot = 0; slot < ColorSlotCount; ++slot) {
        QCOMPARE(colorOf(slot).rgb(), before.at(slot));
    }
    QCOMPARE(colorOf(ColorSlotCount).rgb(), qRgb(200, 200, 200));
}

void TestAppearance::firstStartFollowsTheDesktop()
{
    for (const bool dark : {true, false}) {
        QApplication::setPalette(QPalette(dark ? Qt::black : Qt::white));
        QSettings store(m_folder.path("first.ini"), QSettings::IniFormat);
        startColors(store);
        const double ground = colorOf(WindowBackground).lightnessF();
        QCOMPARE(ground < 0.5, dark);
        QVERIFY(store.allKeys().isEmpty()); // so that it goes on following
    }
    qApp->setStyleSheet({});
}

void TestAppearance::rulesCoverAllClasses()
{
    const QStringList classes =
        QString("QFrame QWidget QDialog QMainWindow QMenuBar QMenu QToolBar QStatusBar QPushButton "
                "QToolButton QComboBox QSpinBox QLineEdit QTextEdit QTabBar QTabWidget QTreeView "
                "QTreeWidget QListWidget QTableWidget QHeaderView QScrollBar QSplitter "
                "QProgressBar QCheckBox QRadioButton QGroupBox QDockWidget QMdiArea QtCustomLabel "
                "QtCustomHorLine QtNumericEdit")
            .split(' ');
    for (int preset = 0; preset < ColorPresetCount; ++preset) {
        setColorPreset(static_cast<ColorPreset>(preset));
        const QString sheet = applicationStyleSheet();
        for (const QString &name : classes) {
            const QRegularExpression selector("(^|, )" + name + "\\b",
                                              QRegularExpression::MultilineOption);
            QVERIFY2(sheet.contains(selector), qPrintable(name));
        }
        QVERIFY(!sheet.contains('%'));
        QVERIFY(sheet.contains(colorOf(WindowBackground).name()));
        QRegularExpressionMatchIterator pictures =
            QRegularExpression("url\\(([^)]*)\\)").globalMatch(sheet);
        applyColors();
        while (pictures.hasNext()) {
            const QString picture = pictures.next().captured(1);
            QVERIFY2(QFile::exists(picture), qPrintable(picture));
        }
    }
    // A field during typing is shown by its own rule.
    setColorPreset(ColorPreset::Classic);
    applyColors();
    QtNumericEdit field;
    field.resize(100, 30);
    field.show();
    QVERIFY(QTest::qWaitForWindowExposed(&field));
    const auto ground = [&field] { return field.grab().toImage().pixel(90, 8); };
    QCOMPARE(ground(), colorOf(TextBackground).rgb());
    QTest::keyClick(&field, Qt::Key_1);
    QCOMPARE(ground(), qRgb(200, 200, 230));
    qApp->setStyleSheet({});
}

void TestAppearance::iconsFollowTheSet()
{
    (void)lineIcon("copy"); // makes the drawings known
    const QStringList drawings = QDir(":/icons").entryList();
    QVERIFY(drawings.size() > 50);
    const auto has = [](const QImage &picture, const QColor &color) {
        for (int i = 0; i < picture.width() * picture.height(); ++i) {
            if (picture.pixel(i % picture.width(), i / picture.width()) == color.rgb()) {
                return true;
            }
        }
        return false;
    };
    const QStringList lamps{"cancel", "device_offline", "redflag", "yellowled"};
    for (const QString &drawing : drawings) {
        const QIcon icon = lineIcon(drawing.chopped(4));
        for (const ColorPreset preset : {ColorPreset::Copper, ColorPreset::Chalk}) {
            setColorPreset(preset);
            const QImage shown = icon.pixmap(QSize(16, 16), 2.0).toImage();
            QCOMPARE(shown.size(), QSize(32, 32));
            QVERIFY2(has(shown, colorOf(AppText)) || has(shown, accentColor()) ||
                         lamps.contains(drawing.chopped(4)),
                     qPrintable(drawing));
            const QImage dimmed = icon.pixmap(QSize(16, 16), 2.0, QIcon::Disabled).toImage();
            QVERIFY2(has(dimmed, colorOf(AppTextDisabled)), qPrintable(drawing));
            QVERIFY2(!has(dimmed, colorOf(AppText)) && !has(dimmed, accentColor()),
                     qPrintable(drawing));
        }
    }
    (void)Tracer::takeEntries();
    QVERIFY(lineIcon("nothing").isNull());
    QCOMPARE(Tracer::takeEntries().size(), 1);
}

void TestAppearance::dialogEditsAndSaves()
{
    const QString path = m_folder.path("Corvane-colors.ini");
    DlgColors dialog(std::make_unique<QSettings>(path, QSettings::IniFormat));
    const QSignalSpy changes(&dialog, &DlgColors::colorsChanged);
    dialog.show();
    QVERIFY(QTest::qWaitForWindowExposed(&dialog));
    const auto field = [&dialog](const char *name) { return dialog.findChild<QLineEdit *>(name); };
    const auto type = [&field](const char *name, const QString &text) {
        field(name)->setFocus();
        field(name)->selectAll();
        QTest::keyClicks(field(name), text);
        QTest::keyClick(field(name), Qt::Key_Return);
    };
    QTest::keyClick(dialog.findChild<QComboBox *>("cb_preset"), Qt::Key_Home);
    QCOMPARE(colorPreset(), ColorPreset::Classic);
    QCOMPARE(changes.count(), 1);
    QVERIFY(!field("le_r")->isEnabled());
    dialog.findChild<QAbstractButton *>("pb_takeover")->click();
    QCOMPARE(colorPreset(), ColorPreset::User);

    auto *tabs = dialog.findChild<QTabWidget *>("tw_colors");
    tabs->setCurrentIndex(1);
    auto *list = qobject_cast<QListWidget *>(tabs->currentWidget());
    list->setCurrentRow(1);
    QCOMPARE(field("le_b")->text(), "255"); // of the peak trace, (80, 190, 255)
    type("le_b", "20");
    QCOMPARE(colorOf(PeakTrace).rgb(), qRgb(80, 190, 20));
    type("le_h", "240");
    type("le_s", "100");
    type("le_v", "50");
    QCOMPARE(colorOf(PeakTrace).rgb(), qRgb(0, 0, 128));
    type("le_contrast", "0.25");
    QCOMPARE(colorOf(ButtonBase).rgb(), colorOf(ButtonBase, false).darker(125).rgb());

    // A file of something else is refused, the set stays.
    QVERIFY(m_folder.store("other.ini", "[General]\nsize=3\n"));
    const auto choose = [](const QString &file) {
        return [file](QWidget &box) {
            auto *files = qobject_cast<QFileDialog *>(&box);
            files->findChild<QLineEdit *>()->setText(file);
            QMetaObject::invokeMethod(files, "accept");
        };
    };
    const auto click = [&dialog](const char *name) {
        return [&dialog, name] { dialog.findChild<QAbstractButton *>(name)->click(); };
    };
    QVERIFY(withModal(click("pb_load"), choose(m_folder.path("other.ini"))));
    QCOMPARE(colorContrast(), 0.25);
    QVERIFY(withModal(click("pb_saveas"), choose(m_folder.path("dark"))));
    type("le_contrast", "0");
    QVERIFY(withModal(click("pb_load"), choose(m_folder.path("dark.col"))));
    QCOMPARE(colorContrast(), 0.25);

    QVERIFY(!QFile::exists(path));
    dialog.close();
    init();
    QSettings store(path, QSettings::IniFormat);
    loadColors(store);
    QCOMPARE(colorPreset(), ColorPreset::User);
    QCOMPARE(colorOf(PeakTrace, false).rgb(), qRgb(0, 0, 128));
}

void TestAppearance::triangleShowsAndPicks()
{
    QtColorTriangle triangle;
    triangle.resize(204, 204);
    const QSignalSpy picks(&triangle, &QtColorTriangle::colorChanged);
    for (const QRgb color : {qRgb(200, 30, 90), qRgb(3, 250, 128), qRgb(77, 77, 77)}) {
        triangle.setColor(QColor(color));
        QCOMPARE(triangle.color().rgb(), color);
    }
    QCOMPARE(picks.count(), 0);
    // The ring at twelve o'clock is a quarter turn from red; the triangle's hue corner follows it.
    triangle.setColor(Qt::red);
    QTest::mouseClick(&triangle, Qt::LeftButton, {}, {102, 10});
    QCOMPARE(triangle.color().hsvHue(), 90);
    QTest::mouseClick(&triangle, Qt::LeftButton, {}, {102, 20});
    QVERIFY(triangle.color().hsvSaturation() > 240 && triangle.color().value() > 240);
    // In the middle all three corners have a third: full hue and white make two thirds of value.
    QTest::mouseClick(&triangle, Qt::LeftButton, {}, {102, 102});
    QVERIFY(std::abs(triangle.color().value() - 170) <= 3);
    QVERIFY(std::abs(triangle.color().hsvSaturation() - 128) <= 4);
    QTest::keyClick(&triangle, Qt::Key_PageUp);
    QCOMPARE(picks.count(), 4);
}

QTEST_MAIN(TestAppearance)
#include "tst_appearance.moc"
