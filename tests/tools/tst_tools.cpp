// SPDX-License-Identifier: Apache-2.0
#include "toolwindow.h"

#include "tools/DlgResample.h"
#include "tools/DlgView.h"
#include "tools/DlgWvCreate.h"
#include "tools/ViewFrame.h"

#include "display/CWidgetIQTrace.h"
#include "display/QtNumericEdit.h"
#include "log/Tracer.h"
#include "streams/TempStream.h"
#include "wvfile/HvFileIO.h"

#include <QComboBox>
#include <QLabel>
#include <QPushButton>
#include <QRadioButton>
#include <QSettings>
#include <QStackedWidget>
#include <QTemporaryDir>
#include <QTest>
#include <QTextEdit>

#include <cmath>
#include <numbers>

using namespace toolwindow;

namespace {

/// A whole number of cycles of a complex tone at 0.7 of full scale, with marker 1 high in the
/// first half.
void writeTone(const QString &fileName, int samples, double clockHz)
{
    WvWriteJob job;
    job.clock = clockHz;
    job.samples = samples;
    job.comment = "tone";
    for (int i = 0; i < samples; ++i) {
        const double phase = 2 * std::numbers::pi * 10 * i / samples;
        job.iSamples.append(static_cast<float>(0.7 * std::cos(phase)));
        job.qSamples.append(static_cast<float>(0.7 * std::sin(phase)));
        job.markers.append(i < samples / 2 ? 1 : 0);
    }
    QVERIFY(HvFileIO().writeWaveform(job, fileName, nullptr, nullptr, nullptr));
}

QStringList errors()
{
    QStringList lines;
    const QList<Tracer::Entry> entries = Tracer::takeEntries();
    for (const auto &[line, level] : entries) {
        if (level == Tracer::Error) {
            lines.append(line.mid(line.indexOf("  ") + 2));
        }
    }
    return lines;
}

} // namespace

class TestTools : public QObject
{
    Q_OBJECT

private slots:
    void init()
    {
        m_folder = std::make_unique<QTemporaryDir>();
        m_tone = m_folder->filePath("tone.wv");
        writeTone(m_tone, 4000, 1e6);
        static_cast<void>(Tracer::takeEntries());
    }

    void resampleFollowsTheFieldThatDecides()
    {
        DlgResample dialog;
        QVERIFY(dialog.startModule(m_tone));
        dialog.show();
        QCOMPARE(child<QLabel>(dialog, "l_src_samples")->text(), QString("4000"));
        QCOMPARE(child<QLineEdit>(dialog, "le_outfile")->text(),
                 m_folder->filePath("tone_resample.wv"));
        click(dialog, "pb_next");
        auto *clock = child<QtNumericEdit>(dialog, "le_target_clock");
        auto *samples = child<QtNumericEdit>(dialog, "le_target_samples");
        type(clock, "1.5M");
        QCOMPARE(samples->getValInt(), 6000); // 1.5 MHz / 1 MHz * 4000
        QVERIFY(!samples->isEnabled());
        click(dialog, "rb_samples");
        QVERIFY(!clock->isEnabled());
        type(samples, "2000");
        QCOMPARE(clock->getVal(), 500e3);
        QCOMPARE(child<QtNumericEdit>(dialog, "le_clockrate")->getVal(), 500e3);
    }

    void resampleWritesTheFileAndReports()
    {
        DlgResample dialog;
        QVERIFY(dialog.startModule(m_tone));
        dialog.show();
        click(dialog, "pb_next");
        type(child<QtNumericEdit>(dialog, "le_target_clock"), "2M");
        click(dialog, "pb_next");
        click(dialog, "pb_next");
        const QString report = child<QTextEdit>(dialog, "te_result")->toPlainText();
        QVERIFY2(report.contains("Resampling completed"), qPrintable(report));
        QVERIFY(report.contains(" OUT-samples: \t8000"));
        WvFileSummary summary;
        QVERIFY(HvFileIO().readWaveformInfo(m_folder->filePath("tone_resample.wv"), &summary));
        QCOMPARE(summary.samples, 8000);
        QCOMPARE(summary.clock, 2e6);
        QCOMPARE(summary.comment, QString("tone"));
        QVERIFY(summary.hasMarkers);
        // 0.7 of full scale, as in the source.
        QVERIFY(std::fabs(summary.peakOffset - 3.098) < 0.01);
    }

    void aFileThatCannotBeReadDoesNotStart_data()
    {
        QTest::addColumn<QByteArray>("content");
        QTest::addColumn<QString>("viewWords");
        QTest::newRow("empty") << QByteArray() << "No tag mark found! Probably incorrect format.";
        QTest::newRow("no type") << QByteArray("{SAMPLES:1}{CLOCK:1000}{WAVEFORM-5: #abcd}")
                                 << "Unsupported waveform file type!";
        QTest::newRow("cut samples") << QByteArray("{TYPE: TGX-WV,0}{CLOCK:1000}{WAVEFORM-41: #ab")
                                     << "Cannot read enough data from xWAVEFORM tag!";
    }

    void aFileThatCannotBeReadDoesNotStart()
    {
        QFETCH(QByteArray, content);
        QFETCH(QString, viewWords);
        const QString fileName = m_folder->filePath("bad.wv");
        QFile file(fileName);
        QVERIFY(file.open(QIODevice::WriteOnly) && file.write(content) == content.size());
        file.close();
        DlgView view;
        QVERIFY(!view.startModule(fileName));
        QCOMPARE(errors().value(0), viewWords);
    }

    void viewMovesAndZooms()
    {
        const QString fileName = m_folder->filePath("long.wv");
        writeTone(fileName, 20000, 1e6);
        DlgView view;
        QVERIFY(view.startModule(fileName));
        view.show();
        QCOMPARE(view.window().points(), 5000);
        click(view, "pb_forward");
        QCOMPARE(view.window().first(), 5000);
        click(view, "pb_forward_little");
        QCOMPARE(view.window().first(), 5250); // a twentieth of the view
        click(view, "pb_end");
        QCOMPARE(view.window().first(), 15000);
        click(view, "pb_forward"); // would lead beyond the file: the view stays
        QCOMPARE(view.window().first(), 15000);
        click(view, "pb_zoomin");
        QCOMPARE(view.window().points(), 2000);
        QCOMPARE(view.window().first(), 16500); // the middle, 17500, stays
        click(view, "pb_start");
        QCOMPARE(view.window().first(), 0);
    }

    void viewCursorsShowValuesAndDistance()
    {
        DlgView view;
        QVERIFY(view.startModule(m_tone));
        view.resize(1000, 720);
        view.show();
        QCOMPARE(child<QLabel>(view, "l_csr_time")->text(), QString("---"));
        child<ViewFrame>(view, "w_view")->set_csr_data(1000, 0.7, 0);
        click(view, "pb_fix_ref");
        child<ViewFrame>(view, "w_view")->set_csr_data(3000, 0, 0.7);
        QCOMPARE(child<QLabel>(view, "l_csr_sample")->text(), QString("3000"));
        QCOMPARE(child<QLabel>(view, "l_csr_time")->text(), QString("3 ms"));
        QCOMPARE(child<QLabel>(view, "l_csr_mag")->text(), QString("-3.10 dB"));
        QCOMPARE(child<QLabel>(view, "l_csr_phase")->text(), QString("90.00 deg"));
        QCOMPARE(child<QLabel>(view, "l_delta_samples")->text(), QString("2000"));
        QCOMPARE(child<QLabel>(view, "l_delta_time")->text(), QString("2 ms"));
        auto *trace = child<CWidgetIQTrace>(view, "w_iqtrace");
        QTest::mouseClick(trace, Qt::LeftButton, {}, trace->rect().center());
        QVERIFY(child<QLabel>(view, "l_csr_sample")->text() != "3000");
    }

    void viewShowsThreeSamples()
    {
        const QString fileName = m_folder->filePath("three.wv");
        writeTone(fileName, 3, 1e3);
        DlgView view;
        QVERIFY(view.startModule(fileName));
        view.show();
        QCOMPARE(view.window().points(), 3);
        QVERIFY(!view.grab().isNull());
        QVERIFY(errors().isEmpty());
    }

    void createOffersTheVariantsOfEachKind_data()
    {
        QTest::addColumn<QString>("waveform");
        QTest::addColumn<int>("variants");
        QTest::addColumn<QString>("page");
        QTest::newRow("function") << "Function" << 4 << "page_function";
        QTest::newRow("am") << "AM" << 8 << "page_am";
        QTest::newRow("pm") << "PM" << 0 << "page_pm";
        QTest::newRow("fm") << "FM" << 2 << "page_fm";
        QTest::newRow("sweep") << "FM Sweep" << 3 << "page_sweep";
        QTest::newRow("multi carrier") << "Multi Carrier" << 0 << "page_multicarrier";
        QTest::newRow("pulse") << "Pulse" << 2 << "page_pulse";
        QTest::newRow("noise") << "Noise" << 3 << "page_noise";
    }

    void createOffersTheVariantsOfEachKind()
    {
        QFETCH(QString, waveform);
        QFETCH(int, variants);
        QFETCH(QString, page);
        DlgWvCreate dialog;
        dialog.show();
        auto *box = child<QComboBox>(dialog, "cb_waveform");
        box->setFocus();
        box->setCurrentText(waveform);
        QCOMPARE(child<QComboBox>(dialog, "cb_wtype")->count(), variants);
        click(dialog, "pb_next");
        auto *pages = child<QStackedWidget>(dialog, "sw_assist");
        QCOMPARE(pages->currentWidget()->objectName(), page);
        click(dialog, "pb_next");
        QCOMPARE(pages->currentIndex(), 10);
        QVERIFY(child<QtNumericEdit>(dialog, "le_samples")->getVal() >= 512);
    }

    void createRefusesTooManySamples()
    {
        DlgWvCreate dialog;
        dialog.show();
        click(dialog, "pb_next");
        type(child<QtNumericEdit>(dialog, "le_freq"), "100");
        click(dialog, "cb_over");
        type(child<QtNumericEdit>(dialog, "le_over"), "100000");
        type(child<QtNumericEdit>(dialog, "le_freq"), "100");
        click(dialog, "pb_next"); // 100 000 samples at 10 MHz: fits
        auto *pages = child<QStackedWidget>(dialog, "sw_assist");
        QCOMPARE(pages->currentIndex(), 10);
        dialog.setFocus();
        click(dialog, "pb_prev");
        click(dialog, "pb_prev");
        type(child<QtNumericEdit>(dialog, "le_minclock"), "10M");
        type(child<QtNumericEdit>(dialog, "le_maxclock"), "600M");
        child<QComboBox>(dialog, "cb_waveform")->setCurrentText("Noise");
        click(dialog, "pb_next");
        type(child<QtNumericEdit>(dialog, "le_noisebw"), "20M");
        type(child<QtNumericEdit>(dialog, "le_noiseduration"), "1");
        click(dialog, "pb_next"); // 30 million samples
        QCOMPARE(pages->currentWidget()->objectName(), QString("page_noise"));
        QCOMPARE(errors().constLast(),
                 QString("Cannot configure waveform creation. Check settings."));
    }

    void createAsksBeforeOverwriting()
    {
        DlgWvCreate dialog;
        QVERIFY(dialog.startModule(m_tone));
        dialog.show();
        for (int page = 0; page < 3; ++page) {
            click(dialog, "pb_next");
        }
        QCOMPARE(child<QLineEdit>(dialog, "le_outfile")->text(), m_tone);
        QFile file(m_tone);
        QVERIFY(file.open(QIODevice::ReadOnly));
        const QByteArray before = file.readAll();
        file.close();
        QString question;
        answerNextQuestion(QMessageBox::No, &question);
        click(dialog, "pb_next");
        QCOMPARE(question,
                 QString("The target file already exists.\nDo you want to overwrite this file?"));
        QVERIFY(child<QTextEdit>(dialog, "te_result")->toPlainText().contains("Creation aborted"));
        QVERIFY(file.open(QIODevice::ReadOnly));
        QCOMPARE(file.readAll(), before);
        file.close();

        click(dialog, "pb_prev");
        answerNextQuestion(QMessageBox::Yes, &question);
        click(dialog, "pb_next");
        const QString report = child<QTextEdit>(dialog, "te_result")->toPlainText();
        QVERIFY2(report.contains("Signal creation completed"), qPrintable(report));
        WvFileSummary summary;
        QVERIFY(HvFileIO().readWaveformInfo(m_tone, &summary));
        QCOMPARE(summary.samples, 1000); // the 10 kHz sine of the start values
        QCOMPARE(summary.clock, 10e6);
    }

    void createKeepsItsSettings()
    {
        const QString store = m_folder->filePath("settings.ini");
        {
            DlgWvCreate dialog;
            dialog.show();
            child<QComboBox>(dialog, "cb_waveform")->setCurrentText("FM");
            child<QComboBox>(dialog, "cb_wtype")->setCurrentText("Two Tone");
            click(dialog, "pb_next");
            QVERIFY(child<QtNumericEdit>(dialog, "le_modfreq_2")->isEnabled());
            type(child<QtNumericEdit>(dialog, "le_modfreq"), "7k");
            QSettings settings(store, QSettings::IniFormat);
            dialog.writeSettings(settings);
            QCOMPARE(settings.value("WvCreate/ver").toDouble(), 1.0);
        }
        DlgWvCreate dialog;
        QSettings settings(store, QSettings::IniFormat);
        dialog.readSettings(settings);
        QCOMPARE(child<QComboBox>(dialog, "cb_waveform")->currentText(), QString("FM"));
        QCOMPARE(child<QComboBox>(dialog, "cb_wtype")->currentText(), QString("Two Tone"));
        QCOMPARE(child<QtNumericEdit>(dialog, "le_modfreq")->getVal(), 7000.0);
        QCOMPARE(child<QtNumericEdit>(dialog, "le_freq")->getVal(), 10000.0);
    }

private:
    std::unique_ptr<QTemporaryDir> m_folder;
    QString m_tone;
};

QTEST_MAIN(TestTools)
#include "tst_tools.moc"
