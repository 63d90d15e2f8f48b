#include "reportrt/data/recordreader.h"

#include "reportrt/base/invarianttext.h"
#include "reportrt/base/runtimeerror.h"
#include "reportrt/formula/formulaevaluator.h"

#include <QSet>
#include <QSqlDriver>
#include <QSqlError>
#include <QSqlQuery>
#include <QSqlRecord>
#include <sqlite3.h>

namespace reportrt {

namespace {
[[noreturn]] void serverError(const QString& details)
{
    raiseError(Error::ServerError,
        QStringLiteral("Failed to retrieve data from the database. Details: %1").arg(details));
}

bool keep(const std::vector<const FormulaExpr*>& conditions, const Value* record,
    const QString& formulaName, qsizetype index)
{
    try {
        for (const FormulaExpr* c : conditions) {
            if (!FormulaEvaluator::isTrue(c, record))
                return false;
        }
        return true;
    } catch (const FormulaException& error) {
        FormulaError e = error.error();
        if (e.formulaName.isEmpty())
            e.formulaName = formulaName;
        raiseError(
            Error::FormulaError, QStringLiteral("%1 (record %2)").arg(e.describe()).arg(index + 1));
    }
}

std::optional<bool> booleanText(const QString& text)
{
    const QString t = text.trimmed().toLower();
    if (t == u"true" || t == u"t" || t == u"yes" || t == u"1" || t == u"-1")
        return true;
    if (t == u"false" || t == u"f" || t == u"no" || t == u"0")
        return false;
    return std::nullopt;
}
} // namespace

std::optional<Value> RecordReader::convert(const QVariant& value, ValueType type)
{
    if (value.isNull())
        return Value();
    const int id = value.typeId();
    const bool integral = id == QMetaType::Int || id == QMetaType::UInt || id == QMetaType::LongLong
        || id == QMetaType::ULongLong || id == QMetaType::Short || id == QMetaType::UShort
        || id == QMetaType::Long || id == QMetaType::ULong || id == QMetaType::Char
        || id == QMetaType::UChar;
    const bool floating = id == QMetaType::Double || id == QMetaType::Float;
    switch (type) {
    case ValueType::Null:
        return Value();
    case ValueType::Number:
        if (integral || floating)
            return Value::number(value.toDouble());
        if (id == QMetaType::Bool)
            return Value::number(value.toBool() ? 1 : 0);
        if (id == QMetaType::QString) {
            if (const auto n = invarianttext::parseNumber(value.toString()))
                return Value::number(*n);
        }
        return std::nullopt;
    case ValueType::Currency:
        if (integral && id != QMetaType::ULongLong) {
            const qlonglong n = value.toLongLong();
            if (n > 922337203685477LL || n < -922337203685477LL)
                return std::nullopt;
            return Value::currency(n * 10000);
        }
        if (floating) {
            if (const auto scaled = invarianttext::currencyFromDouble(value.toDouble()))
                return Value::currency(*scaled);
            return std::nullopt;
        }
        if (id == QMetaType::QString) {
            if (const auto scaled = invarianttext::parseCurrency(value.toString()))
                return Value::currency(*scaled);
            if (const auto n = invarianttext::parseNumber(value.toString())) {
                if (const auto scaled = invarianttext::currencyFromDouble(*n))
                    return Value::currency(*scaled);
            }
        }
        return std::nullopt;
    case ValueType::String:
        if (id == QMetaType::QString)
            return Value::string(value.toString());
        if (integral || floating)
            return Value::string(invarianttext::formatNumber(value.toDouble()));
        if (id == QMetaType::Bool)
            return Value::string(value.toBool() ? QStringLiteral("True") : QStringLiteral("False"));
        if (id == QMetaType::QDate)
            return Value::string(invarianttext::formatDate(value.toDate().toJulianDay()));
        if (id == QMetaType::QByteArray) {
            // Text stored as a blob: accepted only when it is valid UTF-8.
            const QByteArray bytes = value.toByteArray();
            const QString text = QString::fromUtf8(bytes);
            if (text.toUtf8() == bytes)
                return Value::string(text);
        }
        return std::nullopt;
    case ValueType::Boolean:
        if (id == QMetaType::Bool)
            return Value::boolean(value.toBool());
        if (integral)
            return Value::boolean(value.toLongLong() != 0);
        if (floating)
            return Value::boolean(value.toDouble() != 0);
        if (id == QMetaType::QString) {
            if (const auto b = booleanText(value.toString()))
                return Value::boolean(*b);
        }
        return std::nullopt;
    case ValueType::Date:
        if (id == QMetaType::QDate)
            return Value::fromDate(value.toDate());
        if (id == QMetaType::QDateTime)
            return Value::fromDate(value.toDateTime().date());
        if (id == QMetaType::QString) {
            const QString text = value.toString().trimmed();
            if (const auto day = invarianttext::parseDate(text))
                return Value::date(*day);
            if (const auto ms = invarianttext::parseDateTime(text))
                return Value::fromDate(Value::dateTime(*ms).toQDate());
        }
        return std::nullopt;
    case ValueType::Time:
        if (id == QMetaType::QTime)
            return Value::fromTime(value.toTime());
        if (id == QMetaType::QDateTime)
            return Value::fromTime(value.toDateTime().time());
        if (id == QMetaType::QString) {
            const QString text = value.toString().trimmed();
            if (const auto ms = invarianttext::parseTime(text))
                return Value::time(*ms);
            if (const auto ms = invarianttext::parseDateTime(text))
                return Value::fromTime(Value::dateTime(*ms).toQTime());
        }
        return std::nullopt;
    case ValueType::DateTime:
        if (id == QMetaType::QDateTime) {
            const QDateTime dt = value.toDateTime();
            return Value::fromDateTime(QDateTime(dt.date(), dt.time()));
        }
        if (id == QMetaType::QDate)
            return Value::dateTime(value.toDate().toJulianDay() * Value::msecsPerDay);
        if (id == QMetaType::QString) {
            if (const auto ms = invarianttext::parseDateTime(value.toString().trimmed()))
                return Value::dateTime(*ms);
        }
        return std::nullopt;
    case ValueType::Binary:
        if (id == QMetaType::QByteArray)
            return Value::binary(value.toByteArray());
        if (id == QMetaType::QString)
            return Value::binary(value.toString().toUtf8());
        return std::nullopt;
    }
    return std::nullopt;
}

namespace {
// Rows of a statement through Qt's SQL interface: any driver.
class QtRows {
public:
    QtRows(const QSqlDatabase& database, const QString& sql)
        : m_query(database)
    {
        m_query.setForwardOnly(true);
        if (!m_query.exec(sql))
            serverError(m_query.lastError().text());
        m_layout = m_query.record();
    }
    int columnCount() const { return m_layout.count(); }
    QString columnName(int column) const { return m_layout.fieldName(column); }
    bool next()
    {
        if (m_query.next())
            return true;
        if (m_query.lastError().isValid())
            serverError(m_query.lastError().text());
        return false;
    }
    QVariant value(int column) const { return m_query.value(column); }

private:
    QSqlQuery m_query;
    QSqlRecord m_layout;
};

// Rows of a SQLite connection straight from SQLite: the values Qt's driver would give
// (integers, doubles, text, blobs, Null), without its cache of variants for every row,
// which costs more than SQLite itself.
class SqliteRows {
public:
    SqliteRows(sqlite3* database, const QString& sql)
        : m_database(database)
    {
        if (sqlite3_prepare16_v2(
                database, sql.utf16(), static_cast<int>(sql.size() * 2), &m_statement, nullptr)
            != SQLITE_OK)
            fail();
        if (!m_statement)
            serverError(QStringLiteral("the statement is empty"));
    }
    ~SqliteRows() { sqlite3_finalize(m_statement); }
    SqliteRows(const SqliteRows&) = delete;
    SqliteRows& operator=(const SqliteRows&) = delete;

    int columnCount() const { return sqlite3_column_count(m_statement); }
    // As Qt's driver names them: without quotes and without a table in front.
    QString columnName(int column) const
    {
        QString name = QString::fromUtf8(sqlite3_column_name(m_statement, column));
        name.remove(u'"');
        return name.mid(name.lastIndexOf(u'.') + 1);
    }
    bool next()
    {
        const int result = sqlite3_step(m_statement);
        if (result == SQLITE_ROW)
            return true;
        if (result != SQLITE_DONE)
            fail();
        return false;
    }
    QVariant value(int column) const
    {
        switch (sqlite3_column_type(m_statement, column)) {
        case SQLITE_INTEGER:
            return QVariant(static_cast<qlonglong>(sqlite3_column_int64(m_statement, column)));
        case SQLITE_FLOAT:
            return QVariant(sqlite3_column_double(m_statement, column));
        case SQLITE_NULL:
            return QVariant();
        case SQLITE_BLOB:
            return QVariant(
                QByteArray(static_cast<const char*>(sqlite3_column_blob(m_statement, column)),
                    sqlite3_column_bytes(m_statement, column)));
        default:
            return QVariant(QString::fromUtf8(
                reinterpret_cast<const char*>(sqlite3_column_text(m_statement, column)),
                sqlite3_column_bytes(m_statement, column)));
        }
    }

private:
    [[noreturn]] void fail() const { serverError(QString::fromUtf8(sqlite3_errmsg(m_database))); }

    sqlite3* m_database;
    sqlite3_stmt* m_statement = nullptr;
};

// The connection's own SQLite handle when Qt's SQLite driver serves it.
sqlite3* sqliteHandle(const QSqlDatabase& database)
{
    if (!database.driver() || database.driverName() != u"QSQLITE")
        return nullptr;
    const QVariant handle = database.driver()->handle();
    if (!handle.isValid() || qstrcmp(handle.typeName(), "sqlite3*") != 0)
        return nullptr;
    return *static_cast<sqlite3* const*>(handle.constData());
}

template <typename Rows>
RecordReader::Result readRows(Rows& rows, const RecordReader::Request& request)
{
    RecordReader::Result result { RecordSet(static_cast<int>(request.columns.size())), 0 };
    const int columnCount = static_cast<int>(request.columns.size());
    std::vector<int> source(request.columns.size());
    for (int i = 0; i < columnCount; ++i) {
        if (request.matchByName) {
            const QString& name = request.columns[static_cast<size_t>(i)].name;
            const QString bare = name.mid(name.lastIndexOf(u'.') + 1);
            int found = -1;
            for (int k = 0; k < rows.columnCount() && found < 0; ++k) {
                if (rows.columnName(k).compare(bare, Qt::CaseInsensitive) == 0
                    || rows.columnName(k).compare(name, Qt::CaseInsensitive) == 0)
                    found = k;
            }
            if (found < 0)
                serverError(QStringLiteral("the statement has no column %1").arg(bare));
            source[static_cast<size_t>(i)] = found;
        } else {
            if (i >= rows.columnCount())
                serverError(QStringLiteral(
                    "the statement gives %1 columns; the report reads %2 (%3 is missing)")
                                .arg(rows.columnCount())
                                .arg(columnCount)
                                .arg(request.columns[static_cast<size_t>(i)].name));
            source[static_cast<size_t>(i)] = i;
        }
    }
    // Text columns of a report repeat (a status, a city, a name per group): each distinct
    // text is kept once and shared by the records that hold it, which saves most of the
    // memory of large reads. A column with too many distinct texts stops sharing.
    constexpr qsizetype sharedTextLimit = 4096;
    std::vector<QSet<QString>> sharedTexts(static_cast<size_t>(columnCount));
    qsizetype index = 0;
    while (rows.next()) {
        Value* record = result.records.append();
        for (int i = 0; i < columnCount; ++i) {
            const QVariant v = rows.value(source[static_cast<size_t>(i)]);
            auto converted = RecordReader::convert(v, request.columns[static_cast<size_t>(i)].type);
            if (converted && converted->type() == ValueType::String) {
                QSet<QString>& shared = sharedTexts[static_cast<size_t>(i)];
                if (shared.size() < sharedTextLimit) {
                    const auto found = shared.constFind(converted->text());
                    if (found != shared.constEnd())
                        *converted = Value::string(*found);
                    else
                        shared.insert(converted->text());
                }
            }
            if (!converted)
                serverError(
                    QStringLiteral("the value \"%1\" of %2 in record %3 is not a %4 value")
                        .arg(v.toString().left(60), request.columns[static_cast<size_t>(i)].name)
                        .arg(index + 1)
                        .arg(valueTypeName(request.columns[static_cast<size_t>(i)].type)));
            record[i] = std::move(*converted);
        }
        if (!keep(request.conditions, record, request.formulaName, index))
            result.records.removeLast();
        ++index;
    }
    result.recordsRead = static_cast<int>(std::min<qsizetype>(index, INT32_MAX));
    result.records.shrinkToFit();
    return result;
}
} // namespace

RecordReader::Result RecordReader::read(const Request& request)
{
    if (sqlite3* handle = sqliteHandle(request.database)) {
        SqliteRows rows(handle, request.sql);
        return readRows(rows, request);
    }
    QtRows rows(request.database, request.sql);
    return readRows(rows, request);
}

RecordSet RecordReader::select(const RecordSet& records,
    const std::vector<const FormulaExpr*>& conditions, const QString& formulaName)
{
    RecordSet result(records.columnCount());
    for (qsizetype i = 0; i < records.size(); ++i) {
        if (!keep(conditions, records.record(i), formulaName, i))
            continue;
        Value* target = result.append();
        for (int c = 0; c < records.columnCount(); ++c)
            target[c] = records.record(i)[c];
    }
    return result;
}

} // namespace reportrt
