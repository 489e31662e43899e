// SPDX-License-Identifier: Apache-2.0
#include "import/ui/ContentTree.h"
#include "import/ui/DlgWvFromData.h"
#include "import/ui/DlgWvFromMat.h"
#include "import/ui/DlgWvFromRiq.h"
#include "import/ui/DlgWvFromSigmf.h"
#include "import/ui/DlgWvFromWav.h"
#include "support/files.h"
#include "support/logreader.h"
#include "tools/toolwindow.h"
#include "wvfile/HvFileIO.h"

#include "display/QtNumericEdit.h"

#include <QComboBox>
#include <QLabel>
#include <QPlainTextEdit>
#include <QProcess>
#include <QPushButton>
#include <QSettings>
#include <QStackedWidget>
#include <QTest>
#include <QTextEdit>

using namespace toolwindow;

namespace {

constexpr char madeByOthers[] = R"(
import numpy as np, scipy.io as io, struct, wave
z = 0.5 * np.exp(2j * np.pi * np.arange(1000) / 50)
w = np.round(np.c_[z.real, z.imag] * 32768).astype('<i2')
io.savemat('a.mat', {'abc': z, 'ab': z, 'real': z.real}, do_compression=True)
io.savemat('plain.mat', {'abc': z})
np.savetxt('d_i.txt', z.real)
np.savetxt('d_q.txt', z.imag)
np.savetxt('tags.csv', np.c_[z.real, z.imag], delimiter=',',
           header='COMMENT=from text\nCLOCKRATE=2e6', comments='#')
with wave.open('a.wav', 'wb') as f:
    f.setnchannels(2); f.setsampwidth(2); f.setframerate(48000); f.writeframes(w.tobytes())
z.astype('<c8').tofile('a.sigmf-data')
open('a.sigmf-meta', 'w').write('''{"global": {"core:datatype": "cf32_le", "core:version": "1.0.0",
"core:sample_rate": 250000, "core:description": "a tone"}, "captures": [{"core:sample_start": 0}],
"annotations": []}''')
def block(rate):
    return (struct.pack('>ihhhhihhhbbI', 0xC4D70, 1, 0, 0, 0, 0, 901, 0, 1000, 0, 56, 0x80000000)
            + struct.pack('>hhiIihhhhqqIiq', 0, 4, rate, 100000000, 80000, 0, 0, 0, 0, 0, 0, 0, 0,
                          1700000000 * 10**9) + w.astype('>i2').tobytes())
open('a.riq', 'wb').write(block(1000000) + block(2000000))
)";

int page(QWidget &wizard)
{
    return child<QStackedWidget>(wizard, "sw_assist")->currentIndex();
}

QString report(QWidget &wizard)
{
    return child<QTextEdit>(wizard, "te_result")->toPlainText();
}

} // namespace

class TestImportWizards : public QObject
{
    Q_OBJECT

private slots:
    void initTestCase();
    void init() { static_cast<void>(takeLog()); }
    void importsData();
    void importsTwoFiles();
    void importsMatlab();
    void importsRiq();
    void importsWav();
    void importsSigmf();
    void tellsWhatCannotBeRead();

private:
    void openOn(DlgBase &wizard, const QString &file);
    void goOn(QWidget &wizard);
    void runToTheEnd(QWidget &wizard, const QString &name, double clockHz, double peakOffset);

    TestFolder m_folder;
};

void TestImportWizards::initTestCase()
{
    QProcess python;
    python.setWorkingDirectory(m_folder.path());
    python.setProcessChannelMode(QProcess::ForwardedChannels);
    python.start("/usr/bin/python3", {"-c", madeByOthers});
    QVERIFY(python.waitForFinished(60000));
    QCOMPARE(python.exitCode(), 0);
}

void TestImportWizards::openOn(DlgBase &wizard, const QString &file)
{
    QVERIFY(wizard.startModule(m_folder.path(file)));
    wizard.show();
    QVERIFY(QTest::qWaitForWindowExposed(&wizard));
    QCOMPARE(page(wizard), 0);
    QCOMPARE(child<QLineEdit>(wizard, "le_infile1")->text(), m_folder.path(file));
}

void TestImportWizards::goOn(QWidget &wizard)
{
    const int before = page(wizard);
    click(wizard, "pb_next");
    QCOMPARE(page(wizard), before + 1);
}

/// From the page before the preview to the file, which holds the tone of 1000 samples.
void TestImportWizards::runToTheEnd(QWidget &wizard, const QString &name, double clockHz,
                                    double peakOffset)
{
    goOn(wizard);
    QCOMPARE(child<QLabel>(wizard, "l_info")->text(), "1000 samples evaluated.");
    goOn(wizard);
    QCOMPARE(child<QPushButton>(wizard, "pb_next")->text(), "&Run");
    const QString output = m_folder.path(name + "_out.wv");
    type(child<QLineEdit>(wizard, "le_outfile"), output);
    goOn(wizard);
    QTRY_VERIFY(report(wizard).contains("Import completed"));
    WvFileSummary summary;
    QVERIFY(HvFileIO().readWaveformInfo(output, &summary));
    QCOMPARE(summary.samples, 1000);
    QCOMPARE(summary.clock, clockHz);
    QVERIFY(qAbs(summary.peakOffset - peakOffset) < 1e-3);
}

void TestImportWizards::importsData()
{
    DlgWvFromData wizard;
    openOn(wizard, "tags.csv");
    goOn(wizard);
    // A comment character makes the guess binary; the user knows better.
    QVERIFY(child<QAbstractButton>(wizard, "rb_ft_bin")->isChecked());
    QVERIFY(child<QTextEdit>(wizard, "te_preview")->toPlainText().startsWith("23 43 4F"));
    click(wizard, "rb_ft_txt");
    QVERIFY(child<QTextEdit>(wizard, "te_preview")->toPlainText().startsWith("#COMMENT"));
    auto *format = child<QComboBox>(wizard, "cb_fmt");
    format->setFocus();
    QTest::keyClick(format, Qt::Key_Down);
    QCOMPARE(child<QComboBox>(wizard, "cb_prec")->currentText(), "Single (32 Bit)");
    QVERIFY(!child<QComboBox>(wizard, "cb_sign")->isEnabled());
    runToTheEnd(wizard, "data", 2e6, 6.0206);
    QCOMPARE(child<QPlainTextEdit>(wizard, "te_comment")->toPlainText(), "from text");
}

void TestImportWizards::importsTwoFiles()
{
    DlgWvFromData wizard;
    openOn(wizard, "d_i.txt");
    QVERIFY(child<QAbstractButton>(wizard, "cb_secin")->isChecked());
    QCOMPARE(child<QLineEdit>(wizard, "le_infile2")->text(), m_folder.path("d_q.txt"));
    goOn(wizard);
    child<QComboBox>(wizard, "cb_fmt")->setCurrentIndex(1);
    runToTheEnd(wizard, "two", 100e6, 6.0206);
    // The next window begins with the same settings.
    QSettings settings(m_folder.path("settings.ini"), QSettings::IniFormat);
    wizard.writeSettings(settings);
    DlgWvFromData next;
    next.readSettings(settings);
    QCOMPARE(next.preset().job.file1, m_folder.path("d_i.txt"));
    QCOMPARE(next.preset().job.format.dataFormat, DataFormat::Rational);
    QCOMPARE(next.preset().clockHz, 100e6);
}

void TestImportWizards::importsMatlab()
{
    DlgWvFromMat wizard;
    openOn(wizard, "a.mat");
    auto *tree = child<ContentTree>(wizard, "tw_content");
    QCOMPARE(tree->topLevelItemCount(), 3);
    auto *next = child<QPushButton>(wizard, "pb_next");
    QVERIFY(!next->isEnabled());
    // A click beside the box, and on one that can't be had, checks nothing.
    const auto clickBox = [tree](int index) {
        const QRect row = tree->visualItemRect(tree->topLevelItem(index));
        QTest::mouseClick(tree->viewport(), Qt::LeftButton, {},
                          {row.left() + 10, row.center().y()});
    };
    clickBox(1);
    QVERIFY(!next->isEnabled());
    clickBox(0);
    QCOMPARE(tree->checkedKey().toString(), "abc");
    QVERIFY(next->isEnabled());
    runToTheEnd(wizard, "mat", 100e6, 6.0206);
}

void TestImportWizards::importsRiq()
{
    DlgWvFromRiq wizard;
    openOn(wizard, "a.riq");
    auto *tree = child<ContentTree>(wizard, "tw_content");
    QCOMPARE(tree->topLevelItemCount(), 2);
    QCOMPARE(tree->topLevelItem(1)->child(1)->text(1), "2000 kHz");
    tree->check(1);
    tree->check(2);
    QCOMPARE(tree->topLevelItem(0)->checkState(0), Qt::Unchecked);
    runToTheEnd(wizard, "riq", 2e6, 6.0206);
    QCOMPARE(child<QPlainTextEdit>(wizard, "te_comment")->toPlainText(),
             "RF=100.000000 MHz, Bandwidth=80.000000 kHz");
}

void TestImportWizards::importsWav()
{
    DlgWvFromWav wizard;
    openOn(wizard, "a.wav");
    QCOMPARE(child<QtNumericEdit>(wizard, "le_samples")->getValInt(), 1000);
    QCOMPARE(child<QtNumericEdit>(wizard, "le_dataclock")->getVal(), 48000.0);
    click(wizard, "pb_next");
    click(wizard, "rb_sc_auto");
    click(wizard, "pb_prev");
    runToTheEnd(wizard, "wav", 48000, 0);
}

void TestImportWizards::importsSigmf()
{
    DlgWvFromSigmf wizard;
    openOn(wizard, "a.sigmf-meta");
    QCOMPARE(child<QtNumericEdit>(wizard, "le_samples")->getValInt(), 1000);
    QCOMPARE(child<QLabel>(wizard, "l_type")->text(), "cf32_le");
    goOn(wizard);
    click(wizard, "pb_prev");
    runToTheEnd(wizard, "sigmf", 250e3, 6.0206);
    QCOMPARE(child<QPlainTextEdit>(wizard, "te_comment")->toPlainText(), "a tone");
}

void TestImportWizards::tellsWhatCannotBeRead()
{
    DlgWvFromWav wav;
    openOn(wav, "a.mat");
    QVERIFY(child<QLabel>(wav, "l_error")->text().startsWith("Cannot evaluate .wav file header."));
    QVERIFY(!child<QPushButton>(wav, "pb_next")->isEnabled());

    DlgWvFromRiq riq;
    openOn(riq, "a.wav");
    QCOMPARE(child<ContentTree>(riq, "tw_content")->topLevelItem(0)->text(0),
             "Cannot read content.");

    // An array without compression is listed, and refused with what to do about it.
    DlgWvFromMat mat;
    openOn(mat, "plain.mat");
    child<ContentTree>(mat, "tw_content")->check("abc");
    click(mat, "pb_next");
    QCOMPARE(page(mat), 0);
    QVERIFY(child<QLabel>(mat, "l_problem")->text().contains("save -v7"));
    QVERIFY(takeMessages(Tracer::Error)
                .contains("TO DO: !!! Evaluate data of uncompressed elements !!!"));
}

QTEST_MAIN(TestImportWizards)
#include "tst_importwizards.moc"
