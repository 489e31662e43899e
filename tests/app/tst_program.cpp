// SPDX-License-Identifier: Apache-2.0
#include "guitesting.h"

#include <QDir>
#include <QFileInfo>
#include <QImage>
#include <QProcess>
#include <QTest>

namespace {

/// Runs a program with a home and settings of its own.
struct Run
{
    Run(const QString &program, const QStringList &arguments, const QString &home)
    {
        QProcess process;
        QProcessEnvironment environment = QProcessEnvironment::systemEnvironment();
        environment.insert("HOME", home);
        environment.insert("XDG_CONFIG_HOME", home + "/config");
        process.setProcessEnvironment(environment);
        process.start(qEnvironmentVariable("CORVANE_BIN") + "/" + program, arguments);
        finished = process.waitForFinished(60000) && process.exitStatus() == QProcess::NormalExit;
        status = process.exitCode();
        output = QString::fromLocal8Bit(process.readAllStandardOutput());
        errors = QString::fromLocal8Bit(process.readAllStandardError());
    }

    bool finished = false;
    int status = -1;
    QString output;
    QString errors;
};

} // namespace

class TestProgram : public QObject
{
    Q_OBJECT

private slots:
    void startsAndQuits();
    void offersNoInstrumentWithoutVisa();
    void complainsAboutAMissingFile();
    void answersWithoutADisplay_data();
    void answersWithoutADisplay();

private:
    QTemporaryDir m_home;
};

void TestProgram::startsAndQuits()
{
    const QString file = m_home.filePath("tone.wv");
    QVERIFY(writeTone(file));
    const QDir pictures(m_home.filePath("pictures"));
    const Run run("corvane-pictures", {pictures.path(), file}, m_home.path());
    QVERIFY2(run.finished && run.status == 0, qPrintable(run.errors));
    const QImage window(pictures.filePath("main-window.png"));
    QVERIFY(window.width() >= 700 && window.height() >= 500);
    QVERIFY(!QImage(pictures.filePath("waveform-info.png")).isNull());
    QVERIFY(run.output.startsWith("first paint "));
    // Nothing of the user's is touched.
    QVERIFY(!QFileInfo::exists(m_home.filePath("config/Halvorn")));
}

void TestProgram::offersNoInstrumentWithoutVisa()
{
    QVERIFY(QDir(m_home.path()).mkpath("config/Halvorn"));
    QVERIFY(writeText(m_home.filePath("config/Halvorn/Corvane.ini"),
                      "[InstrConfig]\nen0=true\nmodel0=TGX-870\nserial0=100001\n"
                      "instr0=GPIB0::28::INSTR\nintf0=GPIB0\ninstr1=\n"));
    const QDir pictures(m_home.filePath("no-visa"));
    const Run run("corvane-pictures", {"--no-visa", pictures.path()}, m_home.path());
    QVERIFY2(run.finished && run.status == 0, qPrintable(run.errors));
    // The instruments are pictured when the panes offer one.
    QCOMPARE(pictures.entryList(QDir::Files), QStringList({"colors.png", "main-window.png"}));
}

void TestProgram::complainsAboutAMissingFile()
{
    const Run run("corvane-pictures", {m_home.filePath("none"), "/no/such.wv"}, m_home.path());
    QVERIFY(run.finished);
    QCOMPARE(run.status, 1);
    QVERIFY(run.errors.contains("there is no file '/no/such.wv'"));
}

void TestProgram::answersWithoutADisplay_data()
{
    QTest::addColumn<QString>("argument");
    QTest::addColumn<QString>("answer");
    QTest::newRow("version") << "--version"
                             << "corvane ";
    QTest::newRow("help") << "--help"
                          << "Usage: ";
}

void TestProgram::answersWithoutADisplay()
{
    QFETCH(QString, argument);
    QFETCH(QString, answer);
    qputenv("QT_QPA_PLATFORM", "xcb");
    const Run run("corvane", {"--unknown", argument, "file"}, m_home.path());
    qputenv("QT_QPA_PLATFORM", "offscreen");
    QVERIFY(run.finished);
    QCOMPARE(run.status, 0);
    QVERIFY(run.output.startsWith(answer));
}

QTEST_GUILESS_MAIN(TestProgram)
#include "tst_program.moc"
