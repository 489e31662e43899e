// SPDX-License-Identifier: Apache-2.0
#include "cli/CliRun.h"
#include "support/files.h"
#include "support/modals.h"
#include "support/rows.h"
#include "support/wvbytes.h"
#include "toolwindow.h"

#include "display/QtNumericEdit.h"
#include "tools/DlgExport.h"
#include "tools/DlgFilter.h"
#include "tools/DlgMarker.h"
#include "tools/DlgPolar.h"
#include "tools/DlgResample.h"
#include "tools/DlgRescale.h"
#include "tools/DlgView.h"
#include "tools/DlgWrapAround.h"
#include "tools/DlgWvCreate.h"
#include "tools/ViewFrame.h"

#include <QComboBox>
#include <QLabel>
#include <QLineEdit>
#include <QMenu>
#include <QPushButton>
#include <QTest>
#include <QTextEdit>

#include <cmath>
#include <functional>

using namespace toolwindow;

namespace {

/// Answers the question for a file with a name.
Answer chooseFile(const QString &name)
{
    return [name](QWidget &window) {
        auto *field = window.findChild<QLineEdit *>("fileNameEdit");
        QVERIFY(field != nullptr);
        field->setText(name);
        QTest::keyClick(field, Qt::Key_Return);
    };
}

} // namespace

/// The window and the command line write the same file for the same wish.
class TestDialogAndCommand : public QObject
{
    Q_OBJECT

private slots:
    void create();
    void resample();
    void edits();
    void markers();
    void levels();
    void presets();
    void selections();
    void exports();

private:
    /// Runs a command that writes "command.wv", and compares that with "dialog.wv", but for the
    /// time at which each was written.
    void compareWith(const QStringList &arguments) const
    {
        const CliRun run =
            CliRun::in(m_folder.path(), arguments + QStringList{"--force", "-o", "command.wv"});
        QVERIFY2(run.exitCode == 0, qPrintable(run.lastLine()));
        const auto undated = [&](const QString &name) {
            QByteArray file = m_folder.load(name);
            return file.replace("{DATE:" + tag(file, "DATE") + '}', "");
        };
        QVERIFY(!undated("dialog.wv").isEmpty());
        QVERIFY(undated("dialog.wv") == undated("command.wv"));
        QVERIFY(QFile::remove(m_folder.path("dialog.wv")));
    }

    /// Of a tool that names its file itself.
    [[nodiscard]] bool takeFile(const QString &name) const
    {
        QFile::remove(m_folder.path("dialog.wv"));
        return QFile::rename(m_folder.path(name), m_folder.path("dialog.wv"));
    }

    TestFolder m_folder;
};

void TestDialogAndCommand::create()
{
    // All fields at their start values; noise and carriers are random.
    forRows({{"function", "Function", 2, QStringList{"function", "--shape", "triangular"}},
             {"am", "AM", 3, QStringList{"am", "--mode", "lsb+c"}},
             {"pm", "PM", -1, QStringList{"pm"}},
             {"fm", "FM", 1, QStringList{"fm", "--tones", "2"}},
             {"sweep", "FM Sweep", 1, QStringList{"sweep", "--shape", "sine"}},
             {"pulse", "Pulse", 0, QStringList{"pulse"}},
             {"chirp", "Pulse", 1, QStringList{"chirp"}}},
            [&](const QString &waveform, int variant, const QStringList &arguments) {
                DlgWvCreate dialog;
                dialog.show();
                child<QComboBox>(dialog, "cb_waveform")->setCurrentText(waveform);
                child<QComboBox>(dialog, "cb_wtype")->setCurrentIndex(variant);
                for (int page = 0; page < 3; ++page) {
                    click(dialog, "pb_next");
                }
                type(child<QLineEdit>(dialog, "le_outfile"), m_folder.path("dialog.wv"));
                click(dialog, "pb_next");
                compareWith(QStringList{"create"} + arguments);
            });
}

void TestDialogAndCommand::resample()
{
    QVERIFY(m_folder.store("tone.wv", toneFile(4000)));
    DlgResample dialog;
    QVERIFY(dialog.startModule(m_folder.path("tone.wv")));
    dialog.show();
    click(dialog, "pb_next");
    type(child<QtNumericEdit>(dialog, "le_target_clock"), "1.7M");
    click(dialog, "pb_next");
    type(child<QLineEdit>(dialog, "le_outfile"), m_folder.path("dialog.wv"));
    click(dialog, "pb_next");
    compareWith({"resample", "tone.wv", "--clock", "1.7M"});
}

void TestDialogAndCommand::edits()
{
    QVERIFY(m_folder.store("tone.wv", toneFile(4321)));
    const QString source = m_folder.path("tone.wv");
    const auto throughPages = [&](DlgBase &dialog, const std::function<void()> &setFields) {
        QVERIFY(dialog.startModule(source));
        dialog.show();
        click(dialog, "pb_next");
        setFields();
        click(dialog, "pb_next");
        type(child<QLineEdit>(dialog, "le_outfile"), m_folder.path("dialog.wv"));
    };
    {
        DlgFilter dialog;
        throughPages(dialog, [&dialog] {
            child<QComboBox>(dialog, "cb_filtertype")->setCurrentText("Root Cosine");
            child<QComboBox>(dialog, "cb_windowtype")->setCurrentText("Hann");
            type(child<QtNumericEdit>(dialog, "le_filterfreq"), "200k");
            type(child<QtNumericEdit>(dialog, "le_filterlength"), "101");
        });
        click(dialog, "pb_next");
        compareWith({"filter", "tone.wv", "--type", "root-cosine", "--window", "hann",
                     "--bandwidth", "200k", "--length", "101"});
    }
    {
        DlgWrapAround dialog;
        throughPages(dialog, [&dialog] {
            type(child<QtNumericEdit>(dialog, "le_filterrange"), "50");
            type(child<QtNumericEdit>(dialog, "le_filterfreq"), "20k");
        });
        click(dialog, "pb_next");
        compareWith({"wrap", "tone.wv", "--range", "50", "--cutoff", "20k"});
    }
    DlgPolar dialog;
    throughPages(dialog,
                 [&dialog] { type(child<QtNumericEdit>(dialog, "le_am_amplitude"), "0.5"); });
    type(child<QLineEdit>(dialog, "le_outfile_2"), m_folder.path("amplitude.wv"));
    click(dialog, "pb_next");
    const CliRun run = CliRun::in(m_folder.path(), {"polar", "tone.wv", "--gain", "0.5", "--phase",
                                                    "p.wv", "--amplitude", "a.wv"});
    QCOMPARE(run.exitCode, 0);
    QVERIFY(sampleWords(m_folder.load("dialog.wv")) == sampleWords(m_folder.load("p.wv")));
    QVERIFY(sampleWords(m_folder.load("amplitude.wv")) == sampleWords(m_folder.load("a.wv")));
    QCOMPARE(tag(m_folder.load("amplitude.wv"), "LEVEL OFFS"),
             tag(m_folder.load("a.wv"), "LEVEL OFFS"));
}

void TestDialogAndCommand::markers()
{
    QVERIFY(m_folder.store("tone.wv", toneFile(4321)));
    DlgMarker dialog;
    dialog.resize(960, 700);
    QVERIFY(dialog.startModule(m_folder.path("tone.wv")));
    dialog.show();
    const auto apply = [&](const QString &marker, const QString &action, const QString &first,
                           const QString &last) {
        type(child<QtNumericEdit>(dialog, "le_mkrpos_1"), first);
        type(child<QtNumericEdit>(dialog, "le_mkrpos_2"), last);
        child<QComboBox>(dialog, "cb_markers")->setCurrentText(marker);
        child<QComboBox>(dialog, "cb_maction")->setCurrentText(action);
        click(dialog, "pb_apply");
    };
    const auto shown = [&](qsizetype from, qsizetype count) {
        QByteArray bytes;
        for (const quint8 marker :
             child<ViewFrame>(dialog, "w_view")->window().markers().mid(from, count)) {
            bytes += static_cast<char>('0' + marker);
        }
        return bytes;
    };
    QCOMPARE(shown(0, 8), "11111111");
    apply("M 3", "Toggle 1010...", "8", "2");
    QCOMPARE(shown(0, 9), "151515151");
    apply("M 1", "Pattern", "1", "7");
    QCOMPARE(shown(0, 9), "151515151"); // no pattern yet
    type(child<QLineEdit>(dialog, "le_pattern"), "1x10");
    apply("M 1", "Pattern", "1", "7");
    QCOMPARE(shown(0, 9), "150514151");
    apply("M 1", "Low", "1", "4321");
    click(dialog, "rb_before");
    QCOMPARE(shown(0, 9), "111111111");
    click(dialog, "rb_after");
    QCOMPARE(shown(0, 9), "040404040");
    click(dialog, "pb_undo");
    QCOMPARE(shown(0, 9), "150514151");
    click(dialog, "pb_run");
    QVERIFY(takeFile("tone_mkr.wv"));
    compareWith({"markers", "tone.wv",  "--marker", "3",        "--from",    "2",      "--to",
                 "8",       "--action", "toggle",   "--marker", "1",         "--from", "1",
                 "--to",    "7",        "--action", "pattern",  "--pattern", "110"});
}

void TestDialogAndCommand::levels()
{
    // 1000 samples at half of full scale, then 3000 at a quarter.
    const QByteArray half = words(QList<int>{16384, 0}).repeated(1000);
    const QByteArray quarter = words(QList<int>{8192, 0}).repeated(3000);
    QVERIFY(m_folder.store("steps.wv", wvFile("{TYPE:TGX-WV, 0}{CLOCK:1000000}{SAMPLES:4000}"
                                              "{LEVEL OFFS:7.5,6}",
                                              half + quarter)));
    DlgRescale dialog;
    QVERIFY(dialog.startModule(m_folder.path("steps.wv")));
    dialog.resize(960, 700);
    dialog.show();
    auto *peak = child<QtNumericEdit>(dialog, "le_peak");
    auto *crest = child<QtNumericEdit>(dialog, "le_pkrms");
    auto *warning = child<QLabel>(dialog, "l_warn");
    const double fullRms = 20 * std::log10(1 / std::sqrt((0.25 + 3 * 0.0625) / 4));
    QVERIFY(std::abs(peak->getVal() + 6.0206) < 1e-3);
    QVERIFY(std::abs(crest->getVal() - (fullRms - 6.0206)) < 1e-3);
    QVERIFY(warning->text().isEmpty());
    // Samples 1001 to 4000, in either order.
    type(child<QtNumericEdit>(dialog, "le_mkrpostime_1"), "4m");
    type(child<QtNumericEdit>(dialog, "le_mkrpos_2"), "1001");
    QCOMPARE(child<QtNumericEdit>(dialog, "le_mkrpos_1")->getValInt(), 4000);
    click(dialog, "pb_update");
    QCOMPARE(peak->getVal(), -6.0);
    QVERIFY(std::abs(crest->getVal() - (12.0412 - 7.5)) < 1e-3);
    QVERIFY(warning->text().startsWith("Warning: The crest factor"));
    type(crest, "-1");
    QVERIFY(warning->text().contains("below 0 dB"));
    type(peak, "-3");
    type(crest, "2.5");
    click(dialog, "pb_run");
    QVERIFY(takeFile("steps_rescale.wv"));
    QCOMPARE(tag(m_folder.load("dialog.wv"), "LEVEL OFFS"), "5.500000,3.000000");
    compareWith({"level", "steps.wv", "--peak", "-3", "--pkrms", "2.5"});
}

void TestDialogAndCommand::presets()
{
    QVERIFY(m_folder.store("tone.wv", toneFile(4000)));
    const QString file = m_folder.path("filter.ini");
    const auto choosePreset = [&](DlgFilter &dialog, int action) {
        auto *button = child<QPushButton>(dialog, "pb_preset");
        return withModal([&] { button->menu()->actions().at(action)->trigger(); },
                         chooseFile(file));
    };
    constexpr int Load = 0;
    constexpr int Save = 1;
    DlgFilter dialog;
    QVERIFY(dialog.startModule(m_folder.path("tone.wv")));
    dialog.show();
    click(dialog, "pb_next");
    auto *length = child<QtNumericEdit>(dialog, "le_filterlength");
    auto *type = child<QComboBox>(dialog, "cb_filtertype");
    length->setVal(77);
    child<QtNumericEdit>(dialog, "le_filterfreq")->setVal(25e3);
    type->setCurrentIndex(type->findData(static_cast<int>(FilterKind::Cosine)));
    QVERIFY(choosePreset(dialog, Save));
    const auto written = [&](const QString &options) {
        const CliRun run = CliRun::in(
            m_folder.path(),
            ("filter tone.wv -o made.wv --force " + options).split(' ', Qt::SkipEmptyParts));
        return run.exitCode == 0 ? sampleWords(m_folder.load("made.wv")) : QByteArray();
    };
    const QByteArray made = written("--preset filter.ini");
    QVERIFY(!made.isEmpty());
    QVERIFY(made == written("--length 77 --bandwidth 25k --type cosine"));

    QVERIFY(!written("--type gauss --length 40 --save-preset filter.ini").isEmpty());
    QVERIFY(choosePreset(dialog, Load));
    QCOMPARE(length->getVal(), 40.0);
    QCOMPARE(type->currentData().toInt(), static_cast<int>(FilterKind::Gauss));
    QCOMPARE(child<QLineEdit>(dialog, "le_infile")->text(), m_folder.path("tone.wv"));
    QVERIFY(m_folder.store("filter.ini", "[Polar]\ngain=1\n"));
    Seen seen;
    QVERIFY(withModals(
        [&] { child<QPushButton>(dialog, "pb_preset")->menu()->actions().at(Load)->trigger(); },
        {chooseFile(file), answer("OK", seen)}));
    QVERIFY2(seen.text.startsWith("The file holds no settings of this tool."),
             qPrintable(seen.text));
}

void TestDialogAndCommand::selections()
{
    QVERIFY(m_folder.store("tone.wv", toneFile(4000)));
    DlgView view;
    QVERIFY(view.startModule(m_folder.path("tone.wv")));
    view.show();
    auto *button = child<QPushButton>(view, "pb_save_selection");
    QVERIFY(!button->isEnabled());
    auto *frame = child<ViewFrame>(view, "w_view");
    frame->set_csr_data(2999, 0, 0);
    click(view, "pb_fix_ref");
    frame->set_csr_data(1000, 0, 0);
    QVERIFY(button->isEnabled());
    for (const char *name : {"piece.wv", "piece.cs16"}) {
        Seen seen;
        QVERIFY(withModals([&] { button->click(); },
                           {chooseFile(m_folder.path(name)), answer("OK", seen)}));
        QVERIFY2(seen.text.contains("2000"), qPrintable(seen.text));
    }
    const CliRun run = CliRun::in(m_folder.path(), {"dump", "tone.wv", "--from", "1000", "--count",
                                                    "2000", "--format", "ci16"});
    QCOMPARE(run.exitCode, 0);
    QVERIFY(sampleWords(m_folder.load("piece.wv")) == run.output);
    QVERIFY(m_folder.load("piece.cs16") == run.output);
}

void TestDialogAndCommand::exports()
{
    QVERIFY(m_folder.store("tone.wv", toneFile(4000)));
    DlgExport dialog;
    QVERIFY(dialog.startModule(m_folder.path("tone.wv")));
    dialog.show();
    auto *target = child<QLineEdit>(dialog, "le_outfile");
    auto *report = child<QTextEdit>(dialog, "te_result");
    auto *values = child<QComboBox>(dialog, "cb_type");
    QCOMPARE(target->text(), m_folder.path("tone.wav"));
    QCOMPARE(values->currentText(), "16 bit");
    type(child<QtNumericEdit>(dialog, "le_from"), "3000");
    values->setCurrentText("24 bit");
    click(dialog, "pb_run");
    QVERIFY2(report->toPlainText().contains("Export completed"), qPrintable(report->toPlainText()));
    const CliRun run = CliRun::in(m_folder.path(), {"export", "tone.wv", "--from", "3000", "--type",
                                                    "s24", "-o", "command.wav"});
    QCOMPARE(run.exitCode, 0);
    QVERIFY(m_folder.load("tone.wav") == m_folder.load("command.wav"));
    target->setText(m_folder.path("tone.csv"));
    QVERIFY(!values->isEnabled());
    target->setText(m_folder.path("tone.doc"));
    click(dialog, "pb_run");
    QVERIFY(report->toPlainText().contains("doesn't tell the format"));
}

QTEST_MAIN(TestDialogAndCommand)
#include "tst_dialogandcommand.moc"
