// SPDX-License-Identifier: Apache-2.0
#include "display/QtNumericEdit.h"
#include "instrument/ui/DlgSpaImport.h"
#include "simulator/SimulatorProcess.h"
#include "support/files.h"
#include "support/modals.h"
#include "support/wvbytes.h"

#include <QComboBox>
#include <QLabel>
#include <QPlainTextEdit>
#include <QPushButton>
#include <QRadioButton>
#include <QSettings>
#include <QStackedWidget>
#include <QTest>
#include <QTextEdit>
#include <QTimer>
#include <QtEndian>

#include <cmath>
#include <complex>
#include <numbers>

class TestDlgSpaImport : public QObject
{
    Q_OBJECT

private slots:
    void initTestCase();
    void init();
    void capturesAndSaves();
    void samplesAndTime();
    void abortsAndRefuses();
    void asksBeforeARecordIsLost();

private:
    template <typename Widget>
    [[nodiscard]] Widget &child(const char *name) const
    {
        return *m_dialog->findChild<Widget *>(name);
    }
    void click(const char *button) const
    {
        QTest::mouseClick(&child<QAbstractButton>(button), Qt::LeftButton);
    }
    void type(const char *field, const QString &text) const;
    void offer(const QString &resource);
    [[nodiscard]] int page() const { return child<QStackedWidget>("sw_assist").currentIndex(); }
    [[nodiscard]] QString captured() const { return child<QTextEdit>("te_capture").toPlainText(); }

    TestFolder m_folder;
    SimulatorProcess m_simulator;
    std::unique_ptr<DlgSpaImport> m_dialog;
};

void TestDlgSpaImport::initTestCase()
{
    QVERIFY2(m_simulator.startConfig("[a]\nmodel=PAX-630\nserial=100002\noptions=PAX600-A1\n"
                                     "root=%ROOT%/a\ngateway=0\ngpib=20\n"
                                     "[b]\nmodel=TGX-870\nserial=100001\nroot=%ROOT%/b\n"
                                     "gateway=0\ngpib=28\n",
                                     2),
             qPrintable(m_simulator.errorOutput()));
    QVERIFY(
        m_folder.store("visa.ini", QString("[GPIB0]\nhost=127.0.0.1\nport=%1\naddresses=20,28\n")
                                       .arg(m_simulator.gatewayPort())
                                       .toLatin1()));
    qunsetenv("CORVANE_VISA_LIBRARY");
    qputenv("CORVANE_VISA_CONFIG", m_folder.path("visa.ini").toLocal8Bit());
}

void TestDlgSpaImport::init()
{
    m_dialog = std::make_unique<DlgSpaImport>();
    QSettings settings(m_folder.path("none.ini"), QSettings::IniFormat);
    m_dialog->readSettings(settings);
    QVERIFY(m_dialog->startModule(m_folder.path() + '/'));
    m_dialog->show();
    m_dialog->activateWindow();
    QVERIFY(QTest::qWaitForWindowActive(m_dialog.get()));
    offer("GPIB0::20::INSTR");
}

void TestDlgSpaImport::type(const char *field, const QString &text) const
{
    auto &edit = child<QLineEdit>(field);
    edit.setFocus();
    edit.selectAll();
    QTest::keyClicks(&edit, text);
    edit.clearFocus();
}

/// Offers one analyzer beside what is none or not enabled.
void TestDlgSpaImport::offer(const QString &resource)
{
    InstrConfigEntry analyzer;
    analyzer.model = "PAX-630";
    analyzer.serial = "100002";
    analyzer.resource = resource;
    InstrConfigEntry disabled = analyzer;
    disabled.enabled = false;
    InstrConfigEntry generator = analyzer;
    generator.model = "TGX-870";
    m_dialog->instrumentsUpdated({generator, disabled});
    QVERIFY(!child<QPushButton>("pb_next").isEnabled());
    m_dialog->instrumentsUpdated({generator, disabled, analyzer});
    QCOMPARE(child<QComboBox>("cb_device").count(), 1);
    QCOMPARE(child<QComboBox>("cb_device").currentText(), "PAX-630, 100002");
    click("pb_next");
    QCOMPARE(page(), 1);
    QVERIFY(!child<QPushButton>("pb_next").isEnabled());
}

void TestDlgSpaImport::capturesAndSaves()
{
    constexpr int Samples = 20'000;
    click("pb_prev");
    type("le_samples", QString::number(Samples));
    type("le_samplerate", "1 MHz");
    click("pb_next");
    click("pb_capture");
    QVERIFY2(captured().endsWith("Reading I/Q Data Complete."), qPrintable(captured()));
    QVERIFY(m_dialog->isWindowModified());
    click("pb_next");
    QCOMPARE(page(), 2);
    QCOMPARE(child<QLabel>("l_preview").text(), "Showing 10240 of 20000 Samples");
    click("rb_spectrum");
    QCOMPARE(child<QStackedWidget>("sw_preview").currentIndex(), 1);
    click("pb_next");
    QCOMPARE(child<QLineEdit>("le_outfile").text(), m_folder.path("imported.wv"));
    QCOMPARE(child<QtNumericEdit>("le_clockrate").getVal(), 1e6);
    QCOMPARE(child<QPlainTextEdit>("te_comment").toPlainText(),
             "Center=1 GHz, RBW=10 MHz, Ref Level=-10 dBm, Atten=10 dB");
    click("pb_next");
    const QString report = child<QTextEdit>("te_result").toPlainText();
    QVERIFY2(report.endsWith("Waveform File Created"), qPrintable(report));
    QVERIFY(!m_dialog->isWindowModified());

    const QByteArray file = m_folder.load("imported.wv");
    QCOMPARE(tag(file, "CLOCK").toDouble(), 1e6);
    QCOMPARE(tag(file, "SAMPLES").toInt(), Samples);
    const QByteArray words = sampleWords(file);
    QCOMPARE(words.size(), Samples * 4);
    // Of a single frequency, as a part of full scale.
    const auto level = [&](double frequencyHz) {
        std::complex<double> sum;
        for (int i = 0; i < Samples; ++i) {
            const char *sample = words.constData() + 4 * i;
            sum += std::complex<double>(qFromLittleEndian<qint16>(sample),
                                        qFromLittleEndian<qint16>(sample + 2)) *
                   std::polar(1.0, -2 * std::numbers::pi * frequencyHz * i / 1e6);
        }
        return std::abs(sum) / (32767.0 * Samples);
    };
    // The two tones of the simulated signal, 20 dB apart, and nothing a few bins beside them.
    constexpr double BinHz = 1e6 / Samples;
    const double carrier = level(62.5e3);
    const double spur = level(-93.75e3);
    QVERIFY2(carrier > 0.8 && carrier < 1, qPrintable(QString::number(carrier)));
    QVERIFY(std::abs(20 * std::log10(carrier / spur) - 20) < 0.2);
    QVERIFY(level(62.5e3 + 3 * BinHz) < carrier / 100);
    QVERIFY(level(-62.5e3) < carrier / 100);
}

void TestDlgSpaImport::samplesAndTime()
{
    click("pb_prev");
    QCOMPARE(child<QtNumericEdit>("le_samples").getVal(), 32768);
    QCOMPARE(child<QtNumericEdit>("le_time").getVal(), 0.032768);
    click("rb_time");
    type("le_time", "2m");
    QCOMPARE(child<QtNumericEdit>("le_samples").getVal(), 2000);
    type("le_samplerate", "2M");
    QCOMPARE(child<QtNumericEdit>("le_samples").getVal(), 4000);
    QCOMPARE(m_dialog->request().samples, 4000);
    QCOMPARE(m_dialog->request().triggerLevelDbm, -20);
    // What is written comes back.
    QSettings settings(m_folder.path("set.ini"), QSettings::IniFormat);
    m_dialog->writeSettings(settings);
    DlgSpaImport other;
    other.readSettings(settings);
    QCOMPARE(other.request().samples, 4000);
    QCOMPARE(other.request().sampleRateHz, 2e6);
}

void TestDlgSpaImport::abortsAndRefuses()
{
    click("pb_prev");
    child<QComboBox>("cb_triggersource").setCurrentIndex(1);
    click("pb_next");
    // No trigger will come.
    auto &abort = child<QPushButton>("pb_abort");
    QTimer user;
    connect(&user, &QTimer::timeout, this, [&] {
        if (captured().endsWith("Starting Sweep")) {
            user.stop();
            QTest::mouseClick(&abort, Qt::LeftButton);
        }
    });
    user.start(20);
    click("pb_capture");
    QVERIFY2(captured().endsWith("User Break. No Data Captured."), qPrintable(captured()));
    QVERIFY(!child<QPushButton>("pb_next").isEnabled());
    QVERIFY(!abort.isEnabled());
    // The address of the generator under the name of the analyzer.
    click("pb_prev");
    offer("GPIB0::28::INSTR");
    click("pb_capture");
    QVERIFY2(captured().endsWith("The Selected Device is not a Spectrum Analyzer."),
             qPrintable(captured()));
    QVERIFY(!m_dialog->isWindowModified());
}

void TestDlgSpaImport::asksBeforeARecordIsLost()
{
    click("pb_capture");
    QVERIFY(m_dialog->isWindowModified());
    Seen seen;
    QVERIFY(withModal([&] { click("cb_close"); }, answer("Yes", seen)));
    QCOMPARE(seen.title, "Spectrum Analyzer Import");
    QCOMPARE(seen.text, "Data was captured from the Spectrum Analyzer.\n"
                        "Do you want to save your changes?");
    QCOMPARE(page(), 3);
    QVERIFY(withModal([&] { click("cb_close"); }, press("No")));
    QVERIFY(!m_dialog->isVisible());
    QVERIFY(!m_dialog->isWindowModified());
}

QTEST_MAIN(TestDlgSpaImport)
#include "tst_dlgspaimport.moc"
