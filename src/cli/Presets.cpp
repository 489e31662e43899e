// SPDX-License-Identifier: Apache-2.0
#include "Presets.h"

#include "CliOptions.h"

#include "log/Tracer.h"

#include <QFileInfo>
#include <QRegularExpression>
#include <QSettings>

namespace {

/// The value of an option as it would be typed; empty for what stands for no value.
std::string typedValue(const PresetField &field, const QVariant &stored)
{
    bool isNumber = false;
    if (!field.names.isEmpty()) {
        const int index = stored.toInt(&isNumber);
        return isNumber ? field.names.value(index).toStdString() : std::string();
    }
    // A text with commas comes back as a list.
    const QString text = stored.toStringList().join(", ");
    const double number = text.toDouble(&isNumber);
    if (field.isText || !isNumber) {
        return text.toLocal8Bit().toStdString();
    }
    constexpr int MostDecimals = 15; // options take no exponents
    static const QRegularExpression zeros("\\.?0+$");
    return QString::number(number, 'f', MostDecimals).remove(zeros).toStdString();
}

/// The value of an option as a dialog keeps it: numbers without prefixes and units, choices by
/// their number.
QVariant storedValue(const PresetField &field, const CLI::Option &option)
{
    const QString typed = QString::fromLocal8Bit(option.results().back());
    if (!field.names.isEmpty()) {
        return field.names.indexOf(typed);
    }
    const std::optional<double> number = field.isText ? std::nullopt : numberIn(typed, field.unit);
    return number ? QVariant(*number) : QVariant(typed);
}

} // namespace

QList<PresetField> presetTexts()
{
    return {{.option = "--comment", .key = "comment", .isText = true},
            {.option = "--copyright", .key = "copyright", .isText = true}};
}

void Presets::add(CLI::App &command, const QString &group, const QList<PresetField> &fields,
                  const QList<std::pair<QString, QVariant>> &constants)
{
    Entry &entry = m_entries.emplace_back(Entry{command, group, fields, constants, {}, {}});
    command
        .add_option("--preset", entry.loadFrom,
                    "Settings as saved by the dialog or --save-preset; options given win")
        ->type_name("FILE")
        ->group("Presets");
    command.add_option("--save-preset", entry.saveTo, "File to save the settings in")
        ->type_name("FILE")
        ->group("Presets");
}

void Presets::load()
{
    for (const Entry &entry : m_entries) {
        if (!entry.command.parsed() || entry.loadFrom.empty()) {
            continue;
        }
        const QString fileName = QString::fromLocal8Bit(entry.loadFrom);
        QSettings settings(fileName, QSettings::IniFormat);
        if (!QFileInfo(fileName).isReadable() || settings.status() != QSettings::NoError) {
            throw CLI::ValidationError("--preset: the file '" + entry.loadFrom +
                                       "' cannot be read");
        }
        settings.beginGroup(entry.group);
        if (settings.childKeys().isEmpty()) {
            throw CLI::ValidationError("--preset: the file '" + entry.loadFrom +
                                       "' holds no settings of this tool");
        }
        loadGroup(entry, settings);
    }
}

void Presets::loadGroup(const Entry &entry, const QSettings &settings)
{
    for (const PresetField &field : entry.fields) {
        CLI::Option *option = entry.command.get_option(field.option);
        const auto &[key, value] = field.condition;
        const bool isReplaced =
            !field.unless.empty() && entry.command.get_option(field.unless)->count() > 0;
        const bool counts =
            !isReplaced && (key.isEmpty() || settings.value(key).toString() == value.toString());
        if (option->count() > 0 || !settings.contains(field.key) || !counts) {
            continue;
        }
        const std::string typed = typedValue(field, settings.value(field.key));
        if (!typed.empty()) {
            option->add_result(typed);
            option->run_callback();
        }
    }
}

bool Presets::save() const
{
    for (const Entry &entry : m_entries) {
        if (!entry.command.parsed() || entry.saveTo.empty()) {
            continue;
        }
        const QString fileName = QString::fromLocal8Bit(entry.saveTo);
        QSettings settings(fileName, QSettings::IniFormat);
        settings.beginGroup(entry.group);
        for (const auto &[key, value] : entry.constants) {
            settings.setValue(key, value);
        }
        for (const PresetField &field : entry.fields) {
            const CLI::Option *option = entry.command.get_option(field.option);
            if (option->count() == 0) {
                continue;
            }
            settings.setValue(field.key, storedValue(field, *option));
            if (!field.condition.first.isEmpty()) {
                settings.setValue(field.condition.first, field.condition.second);
            }
        }
        settings.endGroup();
        settings.sync();
        if (settings.status() != QSettings::NoError) {
            return Tracer::fail("The settings file cannot be written: " + fileName);
        }
    }
    return true;
}
