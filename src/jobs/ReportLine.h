// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <QList>
#include <QString>

#include <utility>

/// One line of a tool's report. It says what it is; the window and the terminal decide how that
/// looks.
struct ReportLine
{
    enum class Kind {
        Heading, ///< a step begins; stands off from the lines before it
        Text,
        Row,     ///< a label and its value
        Warning, ///< the result isn't all that was asked for
        Success, ///< the last line of a job that has done its work
        Failure, ///< the last line of a job that has stopped
    };

    /// The usual width of labels, for which rows of one report stand below each other.
    static constexpr qsizetype LabelWidth = 12;

    Kind kind = Kind::Text;
    QString text;  ///< of a row: its label with the colon, padded to its width
    QString value; ///< of a row

    [[nodiscard]] static ReportLine heading(QString text)
    {
        return {Kind::Heading, std::move(text), {}};
    }
    [[nodiscard]] static ReportLine plain(QString text)
    {
        return {Kind::Text, std::move(text), {}};
    }
    [[nodiscard]] static ReportLine row(const QString &label, QString value,
                                        qsizetype width = LabelWidth)
    {
        return {Kind::Row, (label + ':').leftJustified(width), std::move(value)};
    }
    [[nodiscard]] static ReportLine warning(QString text)
    {
        return {Kind::Warning, std::move(text), {}};
    }
    [[nodiscard]] static ReportLine success(QString text)
    {
        return {Kind::Success, std::move(text), {}};
    }
    [[nodiscard]] static ReportLine failure(QString text)
    {
        return {Kind::Failure, std::move(text), {}};
    }

    friend bool operator==(const ReportLine &, const ReportLine &) = default;
};

using ReportLines = QList<ReportLine>;
