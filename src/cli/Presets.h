// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <CLI/CLI.hpp>
#include <QList>
#include <QString>
#include <QStringList>
#include <QVariant>

#include <list>
#include <utility>

class QSettings;

/// An option of a command and the key under which the tool's dialog keeps the same field.
struct PresetField
{
    std::string option; ///< its long name
    QString key;
    QString unit = {};      ///< of a number
    QStringList names = {}; ///< of a choice: in the order of the stored numbers
    bool isText = false;
    /// Another key that has to have this value for the field to count, and that is stored with it.
    std::pair<QString, QVariant> condition = {};
    std::string unless = {}; ///< an option that takes this one's place when it is given
};

/// The texts of a new file, which dialogs keep as well.
[[nodiscard]] QList<PresetField> presetTexts();

/// The options --preset and --save-preset of the commands: files with the fields of a tool, as its
/// dialog reads and writes them.
class Presets
{
public:
    /// Adds both options to a command. `constants` is stored beside the fields. The command
    /// outlives the presets.
    void add(CLI::App &command, const QString &group, const QList<PresetField> &fields,
             const QList<std::pair<QString, QVariant>> &constants = {});

    /// To be called behind the parsing: gives the options of the parsed command that weren't given
    /// the values of its preset. Throws an error of the parser for a value that isn't permitted, or
    /// for a file that can't be read.
    void load();

    /// Saves the options of the parsed command, if that was asked for. False, with the reason
    /// logged, if it fails.
    [[nodiscard]] bool save() const;

private:
    struct Entry
    {
        CLI::App &command;
        QString group;
        QList<PresetField> fields;
        QList<std::pair<QString, QVariant>> constants;
        std::string loadFrom;
        std::string saveTo;
    };

    static void loadGroup(const Entry &entry, const QSettings &settings);

    std::list<Entry> m_entries; // a list, so that the options may point into it
};
