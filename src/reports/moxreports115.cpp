#include "reports/moxreports115.h"

#include "core/comerror.h"
#include "core/text.h"
#include "engine/moxglobals.h"
#include "reports/moxreport115.h"

#include <algorithm>
#include <utility>

using namespace Qt::StringLiterals;

namespace reports {

MoxReports115::MoxReports115()
    : mCol(std::in_place)
{
    engine::TraceWrite(u"MoxReports_Initialize"_s, QString(), false);
}

MoxReports115::~MoxReports115()
{
    engine::TraceWrite(u"MoxReports_Terminate 1"_s, QString(), false);
    Destroy();
    engine::TraceWrite(u"MoxReports_Terminate 2"_s, QString(), false);
}

QString MoxReports115::className() const
{
    return u"MoxReports115"_s;
}

std::vector<MoxReports115::Entry>::iterator MoxReports115::find(const QString& ReportName)
{
    return std::find_if(mCol->begin(), mCol->end(), [&ReportName](const Entry& entry) {
        return core::text::equalsText(entry.key, ReportName);
    });
}

std::shared_ptr<MoxReport115> MoxReports115::Item(const QString& ReportName)
{
    if (!mEngine || !mCol)
        return nullptr;
    if (const auto found = find(ReportName); found != mCol->end())
        return found->report;
    try {
        auto report = std::make_shared<MoxReport115>();
        report->SetFileName(ReportName);
        // The report is named and pointed back here before it is added, so a failure
        // leaves no half-made entry behind.
        report->SetParent(std::static_pointer_cast<MoxReports115>(weak_from_this().lock()));
        mCol->push_back({ ReportName, report });
        return report;
    } catch (...) {
        return nullptr;
    }
}

void MoxReports115::Remove(const QString& ReportName)
{
    if (!mEngine || !mCol)
        return;
    const auto found = find(ReportName);
    if (found == mCol->end())
        return;
    // Held until the entry is gone, so the report cannot end while the list is being changed.
    const std::shared_ptr<MoxReport115> removed = found->report;
    removed->SetParent({});
    mCol->erase(found);
}

void MoxReports115::Destroy()
{
    // The collection is made inert before anything it held ends, so whatever runs when the
    // last reference to a report or to the engine goes finds it in a consistent state. The
    // reports end before the engine (locals end in reverse order).
    const std::shared_ptr<engine::MoxEngine115> attachedEngine = std::exchange(mEngine, nullptr);
    const std::optional<std::vector<Entry>> entries = std::exchange(mCol, std::nullopt);
    if (entries) {
        for (const Entry& entry : *entries)
            entry.report->SetParent({});
    }
}

std::vector<std::shared_ptr<MoxReport115>> MoxReports115::NewEnum() const
{
    if (!mCol)
        throw core::ComError::basic(core::ErrorNumber::ObjectVariableNotSet);
    std::vector<std::shared_ptr<MoxReport115>> reports;
    reports.reserve(mCol->size());
    for (const Entry& entry : *mCol)
        reports.push_back(entry.report);
    return reports;
}

void MoxReports115::SetEngine(std::shared_ptr<engine::MoxEngine115> engine)
{
    mEngine = std::move(engine);
}

std::shared_ptr<engine::MoxEngine115> MoxReports115::GetEngine() const
{
    return mEngine;
}

} // namespace reports
