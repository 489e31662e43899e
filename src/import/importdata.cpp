// SPDX-License-Identifier: Apache-2.0
#include "importdata.h"

#include "log/Tracer.h"

#include <QFileInfo>
#include <QSettings>

namespace {

constexpr char PresetGroup[] = "WvImport";

/// A number of an enumeration whose last value is `last`; the old one if the key doesn't hold one.
template <typename T>
void readChoice(const QSettings &settings, const QString &key, T &value, T last)
{
    bool ok = false;
    const int number = settings.value(key).toInt(&ok);
    if (ok && number >= 0 && number <= static_cast<int>(last)) {
        value = static_cast<T>(number);
    }
}

void readText(const QSettings &settings, const QString &key, QString &text)
{
    const QVariant value = settings.value(key, text);
    // A text with commas comes back as a list when it was written by hand.
    text = value.toStringList().join(", ");
}

void readFlag(const QSettings &settings, const QString &key, bool &flag)
{
    flag = settings.value(key, flag).toBool();
}

} // namespace

void writePreset(QSettings &settings, const ImportPreset &preset)
{
    const WvImportJob &job = preset.job;
    settings.setValue("infile1", job.file1);
    settings.setValue("infile2", job.file2);
    settings.setValue("enfile2", job.useFile2);
    settings.setValue("binary", job.binary);
    settings.setValue("dataformat", static_cast<int>(job.format.dataFormat));
    settings.setValue("endianness", job.format.bigEndian ? 1 : 0);
    settings.setValue("precision", static_cast<int>(job.format.precision));
    settings.setValue("signedness", job.format.isSigned ? 1 : 0);
    settings.setValue("scaling", static_cast<int>(job.scaling));
    settings.setValue("outfile", preset.outputFile);
    settings.setValue("comment", preset.comment);
    settings.setValue("copyright", preset.copyright);
    settings.setValue("clock", preset.clockHz);
}

void readPreset(const QSettings &settings, ImportPreset &preset)
{
    WvImportJob &job = preset.job;
    readText(settings, "infile1", job.file1);
    readText(settings, "infile2", job.file2);
    readFlag(settings, "enfile2", job.useFile2);
    readFlag(settings, "binary", job.binary);
    readChoice(settings, "dataformat", job.format.dataFormat, DataFormat::Hexadecimal);
    readFlag(settings, "endianness", job.format.bigEndian);
    readChoice(settings, "precision", job.format.precision, DataPrecision::Bits64);
    readFlag(settings, "signedness", job.format.isSigned);
    readChoice(settings, "scaling", job.scaling, ImportScaling::Auto);
    readText(settings, "outfile", preset.outputFile);
    readText(settings, "comment", preset.comment);
    readText(settings, "copyright", preset.copyright);
    bool ok = false;
    const double clockHz = settings.value("clock").toDouble(&ok);
    preset.clockHz = ok ? clockHz : preset.clockHz;
}

bool savePreset(const QString &fileName, const ImportPreset &preset)
{
    QSettings settings(fileName, QSettings::IniFormat);
    settings.beginGroup(PresetGroup);
    writePreset(settings, preset);
    settings.endGroup();
    settings.sync();
    return settings.status() == QSettings::NoError ||
           Tracer::fail("The settings file cannot be written.\n" + fileName);
}

bool loadPreset(const QString &fileName, ImportPreset &preset)
{
    QSettings settings(fileName, QSettings::IniFormat);
    if (!QFileInfo(fileName).isReadable() || settings.status() != QSettings::NoError) {
        return Tracer::fail("The settings file cannot be read.\n" + fileName);
    }
    readPreset(settings, preset);
    settings.beginGroup(PresetGroup);
    readPreset(settings, preset);
    settings.endGroup();
    return true;
}
