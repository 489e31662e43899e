// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <QTest>

#include <source_location>
#include <vector>

/// Runs `check` for each row of a table, and names the row where it fails; the rows after it aren't
/// run. A row is a plain struct that begins with its name, `const char *name`; `check` holds the
/// QCOMPAREs:
///
///     struct Row { const char *name; int a; int sum; };
///     forRows<Row>({{"nothing", 0, 1}, {"one", 1, 2}}, [](const Row &row) {
///         QCOMPARE(row.a + 1, row.sum);
///     });
template <typename Row, typename Check>
void forRows(const std::vector<Row> &rows, const Check &check,
             const std::source_location &place = std::source_location::current())
{
    for (const Row &row : rows) {
        check(row);
        if (QTest::currentTestFailed()) {
            const QByteArray text = "in the row '" + QByteArray(row.name) + '\'';
            QTest::qFail(text.constData(), place.file_name(), static_cast<int>(place.line()));
            return;
        }
    }
}
