#include "automation/classbuilder.h"
#include "automation/registry.h"
#include "automation/tables_p.h"
#include "runtime/report.h"

namespace automation {

using runtime::Report;

// The runtime's report object, which MoxReport115.C_Report hands to hosts and the
// component's own code reaches by member name.
void registerRuntimeReport(Registry& registry)
{
    ClassBuilder<Report> c(QStringLiteral("Report"), QStringLiteral("IReport"));
    c.outsideTypeLibrary();
    c.property(QStringLiteral("RecordSelectionFormula"), 1, &Report::recordSelectionFormula,
        &Report::setRecordSelectionFormula);
    c.property(
        QStringLiteral("SQLQueryString"), 2, &Report::sqlQueryString, &Report::setSqlQueryString);
    registry.add(c.take());
}

} // namespace automation
