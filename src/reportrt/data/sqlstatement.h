#pragma once

#include "reportrt/document/documentenvironment.h"
#include "reportrt/document/reportdocument.h"

#include <QString>
#include <vector>

namespace reportrt {

/// Writes the statement of a table-based report. Layout, lines joined by CR LF:
///
///     SELECT Orders.ID, Orders.Name
///     FROM Orders INNER JOIN Customers ON Orders.CustomerID = Customers.ID
///     WHERE
///         (Orders.Amount > 100) AND (Customers.Country COLLATE BINARY = 'DE')
///     ORDER BY Customers.Country, Orders.ID DESC
///
/// The WHERE lines are present only with a condition, the ORDER BY line only with keys.
/// Each condition of several is in parentheses. Tables are joined along the links starting
/// from the first table; a table no link reaches is joined with CROSS JOIN.
class SqlStatement {
public:
    struct OrderKey {
        QString sql; // a column
        bool descending = false;
    };

    static QString select(const std::vector<TableDefinition>& tables,
        const std::vector<TableLink>& links, const std::vector<RecordColumn>& columns,
        const std::vector<QString>& conditions, const std::vector<OrderKey>& order);

    /// "Orders.ID": the table's name (its alias in FROM) and the field, quoted as needed.
    static QString columnName(const TableDefinition& table, const FieldDefinition& field);

    static constexpr char16_t lineBreak[] = u"\r\n";
};

} // namespace reportrt
