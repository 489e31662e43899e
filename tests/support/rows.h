// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <QTest>

#include <initializer_list>
#include <source_location>
#include <tuple>
#include <type_traits>
#include <utility>
#include <vector>

namespace rows {

template <typename Class, typename... Values>
std::tuple<const char *, std::decay_t<Values>...> rowOf(void (Class::*)(Values...) const);

/// The row that a lambda takes: its name, then a value for each parameter.
template <typename Check>
using RowOf = decltype(rowOf(&Check::operator()));

/// Says in which row the test has failed; false if it hasn't.
inline bool tellFailure(const char *name, const std::source_location &place)
{
    if (!QTest::currentTestFailed()) {
        return false;
    }
    const QByteArray text = "in the row '" + QByteArray(name) + '\'';
    QTest::qFail(text.constData(), place.file_name(), static_cast<int>(place.line()));
    return true;
}

} // namespace rows

/// Runs `check`, which holds the QCOMPAREs, for each row of a table: a name and a value for each
/// parameter of `check`. Names the row that fails; those after it aren't run.
///
///     forRows({{"nothing", 0, 1}, {"one", 1, 2}}, [](int value, int next) {
///         QCOMPARE(value + 1, next);
///     });
template <typename Check>
void forRows(std::initializer_list<rows::RowOf<Check>> table, const Check &check,
             const std::source_location &place = std::source_location::current())
{
    for (const auto &row : table) {
        std::apply([&check](const char *, const auto &...values) { check(values...); }, row);
        if (rows::tellFailure(std::get<0>(row), place)) {
            return;
        }
    }
}

/// As above for rows that are plain structs, for tables with many columns or made by a loop. The
/// first member is `const char *name`.
template <typename Row, typename Check>
void forRows(const std::vector<Row> &table, const Check &check,
             const std::source_location &place = std::source_location::current())
{
    for (const Row &row : table) {
        check(row);
        if (rows::tellFailure(row.name, place)) {
            return;
        }
    }
}
