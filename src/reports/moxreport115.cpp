#include "moxreport115.h"

#include "engine/moxglobals.h"
#include "moxreport115_p.h"

using namespace Qt::StringLiterals;

namespace reports {

MoxReport115::MoxReport115()
    : d(std::make_unique<MoxReport115Private>())
{
    engine::TraceWrite(u"MoxReport_Initialize"_s, QString(), false);
}

MoxReport115::~MoxReport115()
{
    engine::TraceWrite(u"MoxReport_Terminate"_s, QString(), false);
}

QString MoxReport115::className() const
{
    return u"MoxReport115"_s;
}

QString MoxReport115::FileName() const
{
    return d->FileName;
}

void MoxReport115::SetFileName(const QString& name)
{
    d->FileName = name;
}

void MoxReport115::SetParent(const std::weak_ptr<MoxReports115>& parent)
{
    d->Parent = parent;
}

std::shared_ptr<MoxReports115> MoxReport115::GetParent() const
{
    return d->Parent.lock();
}

} // namespace reports
