#include "fakesection.h"

#include "fakereport.h"

namespace fakeruntime {

FakeSection::FakeSection(std::weak_ptr<Script> script, State initial)
    : FakeObject(std::move(script), QStringLiteral("Section"))
    , state(std::move(initial))
{ }

std::shared_ptr<FakeReportObject> FakeSection::addObject(FakeReportObject::State object)
{
    // Sections are always made by FakeReport::addSection, so one owns this section already.
    const auto self = std::static_pointer_cast<FakeSection>(shared_from_this());
    auto created = std::make_shared<FakeReportObject>(script(), std::move(object), self);
    state.objects.push_back(created);
    return created;
}

std::shared_ptr<FakeReportObject> FakeSection::addObject(
    const QString& typeName, const QString& name)
{
    FakeReportObject::State object;
    object.typeName = typeName;
    object.name = name;
    return addObject(std::move(object));
}

std::shared_ptr<FakeReport> FakeSection::addSubreport(const QString& name)
{
    FakeReportObject::State object;
    object.typeName = QStringLiteral("ISubreportObject");
    object.name = name;
    object.subreport = std::make_shared<FakeReport>(script(), name);
    return addObject(std::move(object))->state.subreport;
}

void FakeSection::fireFormat()
{
    // Copy first: a handler may remove itself.
    const auto handlers = m_handlers;
    for (const auto& [cookie, handler] : handlers)
        handler();
}

QString FakeSection::name() const
{
    recordQuery(QStringLiteral("name"));
    return state.name;
}

std::vector<std::shared_ptr<runtime::ReportObject>> FakeSection::reportObjects() const
{
    recordQuery(QStringLiteral("reportObjects"));
    return { state.objects.begin(), state.objects.end() };
}

int FakeSection::addFormatHandler(FormatHandler handler)
{
    record(QStringLiteral("addFormatHandler"));
    const int cookie = m_nextCookie++;
    m_handlers.emplace(cookie, std::move(handler));
    return cookie;
}

void FakeSection::removeFormatHandler(int cookie)
{
    record(QStringLiteral("removeFormatHandler"), { arg(cookie) });
    m_handlers.erase(cookie);
}

} // namespace fakeruntime
