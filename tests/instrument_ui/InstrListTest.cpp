// SPDX-License-Identifier: Apache-2.0
#include "InstrListTest.h"

#include "appearance/lineicon.h"
#include "instrument/LogRecorder.h"

#include <QFile>
#include <QLineEdit>
#include <QPushButton>
#include <QSettings>
#include <QTest>

InstrConfigEntry entry(const QString &model, const QString &serial, const QString &resource)
{
    return {.enabled = true,
            .model = model,
            .serial = serial,
            .resource = resource,
            .interface = resource.section("::", 0, 0),
            .comment = {},
            .folder = "GPIB Scan"};
}

QString stateOf(const QTreeWidgetItem *item)
{
    const QImage shown = item->icon(0).pixmap(16, 16).toImage();
    for (const char *state : {"online", "busy", "offline"}) {
        if (shown == lineIcon(QString("device_%1").arg(state)).pixmap(16, 16).toImage()) {
            return state;
        }
    }
    return "unknown picture";
}

void InstrListTest::init()
{
    // Scripted instruments set it.
    qunsetenv("CORVANE_VISA_LIBRARY");
    m_simulator = std::make_unique<SimulatorProcess>();
    QVERIFY2(m_simulator->startConfig("[a]\nmodel=TGX-870\nserial=100001\nroot=%ROOT%/a\n"
                                      "gateway=0\ngpib=28\n"
                                      "[b]\nmodel=TGX-810\nserial=200002\nroot=%ROOT%/b\n"
                                      "gateway=0\ngpib=5\n",
                                      2),
             qPrintable(m_simulator->errorOutput()));
    QVERIFY(m_folder.store("visa.ini", "[GPIB0]\nhost=127.0.0.1\naddresses=5,9,28\nport=" +
                                           QByteArray::number(m_simulator->gatewayPort()) + '\n'));
    qputenv("CORVANE_VISA_CONFIG", QFile::encodeName(m_folder.path("visa.ini")));
    QFile::remove(iniFile());

    m_dialog = std::make_unique<DlgInstrConfig>();
    m_changes = std::make_unique<QSignalSpy>(m_dialog.get(), &DlgInstrConfig::updateInstruments);
    m_dialog->show();
    m_dialog->activateWindow();
    QVERIFY(QTest::qWaitForWindowActive(m_dialog.get()));
    (void)takeLog();
}

void InstrListTest::cleanup()
{
    m_dialog.reset();
    m_simulator.reset();
}

void InstrListTest::fill(const QList<InstrConfigEntry> &entries)
{
    InstrumentList list;
    for (const InstrConfigEntry &each : entries) {
        list.add(each);
    }
    QSettings settings(iniFile(), QSettings::IniFormat);
    settings.beginGroup("InstrConfig");
    list.write(settings);
    settings.endGroup();
    m_dialog->readSettings(settings);
    m_changes->clear();
}

void InstrListTest::type(const QString &text)
{
    QLineEdit *line = inputLine();
    line->setFocus();
    line->selectAll();
    QTest::keyClicks(line, text);
    QTest::keyClick(line, Qt::Key_Return);
}

void InstrListTest::click(const char *button)
{
    QTest::mouseClick(m_dialog->findChild<QPushButton *>(button), Qt::LeftButton);
}

QStringList InstrListTest::rows() const
{
    QStringList texts;
    for (int row = 0; row < tree()->topLevelItemCount(); ++row) {
        const QTreeWidgetItem *each = item(row);
        texts.append(
            QStringList{stateOf(each), each->text(0), each->text(1), each->text(2)}.join('|'));
    }
    return texts;
}

QStringList InstrListTest::childRows(int row) const
{
    QStringList texts;
    for (int i = 0; i < item(row)->childCount(); ++i) {
        texts.append(item(row)->child(i)->text(0) + '|' + item(row)->child(i)->text(1));
    }
    return texts;
}

QLineEdit *InstrListTest::inputLine() const
{
    return m_dialog->findChild<QLineEdit *>("le_manual");
}
