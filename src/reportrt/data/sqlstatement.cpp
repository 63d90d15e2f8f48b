#include "reportrt/data/sqlstatement.h"

#include "reportrt/data/sqltranslator.h"

#include <QStringList>
#include <deque>

namespace reportrt {

namespace {
QString tableReference(const TableDefinition& table)
{
    const QString location = table.location.isEmpty() ? table.name : table.location;
    if (location == table.name)
        return SqlTranslator::identifier(table.name);
    return SqlTranslator::qualifiedName(location) + u' ' + SqlTranslator::identifier(table.name);
}

QString joinKeyword(JoinType type)
{
    switch (type) {
    case JoinType::Inner:
        return QStringLiteral("INNER JOIN");
    case JoinType::LeftOuter:
        return QStringLiteral("LEFT OUTER JOIN");
    case JoinType::RightOuter:
        return QStringLiteral("RIGHT OUTER JOIN");
    case JoinType::FullOuter:
        return QStringLiteral("FULL OUTER JOIN");
    }
    return {};
}

int indexOf(const std::vector<TableDefinition>& tables, const QString& name)
{
    for (size_t i = 0; i < tables.size(); ++i) {
        if (tables[i].name.compare(name, Qt::CaseInsensitive) == 0)
            return static_cast<int>(i);
    }
    return -1;
}

const FieldDefinition* fieldNamed(const TableDefinition& table, const QString& name)
{
    for (const auto& f : table.fields) {
        if (f.name.compare(name, Qt::CaseInsensitive) == 0)
            return &f;
    }
    return nullptr;
}
} // namespace

QString SqlStatement::columnName(const TableDefinition& table, const FieldDefinition& field)
{
    return SqlTranslator::identifier(table.name) + u'.' + SqlTranslator::identifier(field.name);
}

QString SqlStatement::select(const std::vector<TableDefinition>& tables,
    const std::vector<TableLink>& links, const std::vector<RecordColumn>& columns,
    const std::vector<QString>& conditions, const std::vector<OrderKey>& order)
{
    QStringList selected;
    for (const RecordColumn& c : columns) {
        const TableDefinition& table = tables[static_cast<size_t>(c.table)];
        selected << columnName(table, table.fields[static_cast<size_t>(c.field)]);
    }
    if (selected.isEmpty() && !tables.empty() && !tables.front().fields.empty())
        selected << columnName(tables.front(), tables.front().fields.front());
    if (selected.isEmpty())
        selected << QStringLiteral("1");

    QString from;
    if (!tables.empty()) {
        std::vector<bool> joined(tables.size(), false);
        std::vector<bool> used(links.size(), false);
        from = tableReference(tables.front());
        joined[0] = true;
        // Breadth first from the first table, so each join's ON refers to joined tables.
        std::deque<int> queue;
        const auto visit = [&](int start) {
            queue.push_back(start);
            while (!queue.empty()) {
                const int current = queue.front();
                queue.pop_front();
                for (size_t i = 0; i < links.size(); ++i) {
                    if (used[i])
                        continue;
                    const TableLink& link = links[i];
                    const int a = indexOf(tables, link.fromTable);
                    const int b = indexOf(tables, link.toTable);
                    if (a < 0 || b < 0 || (a != current && b != current))
                        continue;
                    const bool forward = a == current;
                    const int other = forward ? b : a;
                    if (joined[static_cast<size_t>(other)])
                        continue;
                    used[i] = true;
                    JoinType type = link.join;
                    if (!forward && type == JoinType::LeftOuter)
                        type = JoinType::RightOuter;
                    else if (!forward && type == JoinType::RightOuter)
                        type = JoinType::LeftOuter;
                    QStringList on;
                    for (size_t k = 0; k < link.fromFields.size() && k < link.toFields.size();
                         ++k) {
                        const FieldDefinition* x
                            = fieldNamed(tables[static_cast<size_t>(a)], link.fromFields[k]);
                        const FieldDefinition* y
                            = fieldNamed(tables[static_cast<size_t>(b)], link.toFields[k]);
                        if (!x || !y)
                            continue;
                        const QString fromColumn = columnName(tables[static_cast<size_t>(a)], *x);
                        const QString toColumn = columnName(tables[static_cast<size_t>(b)], *y);
                        on << (forward ? fromColumn + u" = " + toColumn
                                       : toColumn + u" = " + fromColumn);
                    }
                    from += u' ' + joinKeyword(type) + u' '
                        + tableReference(tables[static_cast<size_t>(other)]) + u" ON "
                        + on.join(QStringLiteral(" AND "));
                    joined[static_cast<size_t>(other)] = true;
                    queue.push_back(other);
                }
            }
        };
        visit(0);
        for (size_t i = 1; i < tables.size(); ++i) {
            if (joined[i])
                continue;
            from += u" CROSS JOIN " + tableReference(tables[i]);
            joined[i] = true;
            visit(static_cast<int>(i));
        }
    }

    QString sql = u"SELECT " + selected.join(QStringLiteral(", ")) + QStringView(lineBreak)
        + u"FROM " + from;
    if (!conditions.empty()) {
        QStringList parts;
        for (const QString& c : conditions)
            parts << (conditions.size() == 1 ? c : u'(' + c + u')');
        sql += QStringView(lineBreak) + u"WHERE" + QStringView(lineBreak) + u"    "
            + SqlTranslator::join(std::move(parts), u" AND ");
    }
    if (!order.empty()) {
        QStringList keys;
        for (const OrderKey& k : order)
            keys << (k.descending ? k.sql + u" DESC" : k.sql);
        sql += QStringView(lineBreak) + u"ORDER BY " + keys.join(QStringLiteral(", "));
    }
    return sql;
}

} // namespace reportrt
