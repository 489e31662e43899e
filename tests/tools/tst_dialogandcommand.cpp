// SPDX-License-Identifier: Apache-2.0
#include "cli/CliRun.h"
#include "support/files.h"
#include "support/rows.h"
#include "support/wvbytes.h"
#include "toolwindow.h"

#include "display/QtNumericEdit.h"
#include "tools/DlgFilter.h"
#include "tools/DlgPolar.h"
#include "tools/DlgResample.h"
#include "tools/DlgWrapAround.h"
#include "tools/DlgWvCreate.h"

#include <QComboBox>
#include <QTest>
#include <QTextEdit>

#include <functional>

using namespace toolwindow;

namespace {

/// For a look at a window: its picture goes to the folder of CORVANE_PICTURES, if that is set.
void keepPicture(QWidget &window, const QString &name)
{
    if (const QString folder = qEnvironmentVariable("CORVANE_PICTURES"); !folder.isEmpty()) {
        QVERIFY(window.grab().save(folder + '/' + name + ".png"));
    }
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
            keepPicture(dialog, "filter");
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
            keepPicture(dialog, "wrap");
        });
        click(dialog, "pb_next");
        compareWith({"wrap", "tone.wv", "--range", "50", "--cutoff", "20k"});
    }
    DlgPolar dialog;
    throughPages(dialog, [&dialog] {
        type(child<QtNumericEdit>(dialog, "le_am_amplitude"), "0.5");
        keepPicture(dialog, "polar");
    });
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

QTEST_MAIN(TestDialogAndCommand)
#include "tst_dialogandcommand.moc"
