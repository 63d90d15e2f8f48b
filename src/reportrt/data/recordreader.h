#pragma once

#include "reportrt/data/recordset.h"
#include "reportrt/formula/formulaexpr.h"

#include <QSqlDatabase>
#include <QString>
#include <QVariant>
#include <memory>
#include <optional>
#include <vector>

namespace reportrt {

/// Runs a statement and keeps the records that every condition selects.
class RecordReader {
public:
    struct Column {
        QString name; // "Orders.ID", for messages and for matching by name
        ValueType type = ValueType::String;
    };

    struct Request {
        QSqlDatabase database;
        QString sql;
        std::vector<Column> columns;
        /// Match result columns by name (SQL command tables) instead of by position.
        bool matchByName = false;
        /// Evaluated in order on each record; a record is kept when all are True.
        std::vector<const FormulaExpr*> conditions;
        QString formulaName = QStringLiteral("Record Selection");
    };

    struct Result {
        RecordSet records;
        int recordsRead = 0;
    };

    /// Raises Error::ServerError when the statement fails or a value does not fit its
    /// field's type, Error::FormulaError when a condition fails on a record.
    static Result read(const Request& request);

    /// Converts a database value to a field type; nullopt when it does not fit.
    static std::optional<Value> convert(const QVariant& value, ValueType type);

    /// The records of saved data that every condition selects.
    static RecordSet select(const RecordSet& records,
        const std::vector<const FormulaExpr*>& conditions, const QString& formulaName);
};

} // namespace reportrt
