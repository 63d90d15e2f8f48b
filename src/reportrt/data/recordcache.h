#pragma once

#include "reportrt/data/queryplan.h"
#include "reportrt/data/recordset.h"
#include "reportrt/data/sqlconnection.h"

#include <map>
#include <memory>
#include <optional>
#include <vector>

namespace reportrt {

/// The records a report read last, with the connection they came through.
///
/// Records stay as saved data: reading again reuses them while the plan's signature (the
/// statement, the formula, the parameter values and the connection) and columns are the
/// same, and reads anew when any of them changed. One connection is kept open, to the
/// database of the last read.
class RecordCache {
public:
    struct Saved {
        RecordSet records;
        std::vector<QString> columns;
        int recordsRead = 0;
        QString signature;
    };

    RecordCache() = default;
    ~RecordCache();
    RecordCache(const RecordCache&) = delete;
    RecordCache& operator=(const RecordCache&) = delete;

    const std::optional<Saved>& saved() const { return m_saved; }
    void keep(Saved saved) { m_saved = std::move(saved); }
    void forget() { m_saved.reset(); }

    /// Whether the records kept were read with this plan's statement and columns.
    bool matches(const QueryPlan& plan) const;
    /// Reads the plan's records (replacing those kept). Raises Error::RuntimeFailure for
    /// a report without tables or with tables in different databases, and
    /// Error::TableConnectionFailed when the database cannot be opened.
    void read(const QueryPlan& plan);

private:
    SqlConnection& connection(const std::vector<ConnectionProperty>& properties);

    std::optional<Saved> m_saved;
    std::map<QString, std::unique_ptr<SqlConnection>> m_connections;
};

} // namespace reportrt
