#include "runtime/reportobject.h"

#include "core/comerror.h"

namespace runtime {

namespace {
[[noreturn]] void notSupported()
{
    throw core::ComError::basic(core::ErrorNumber::ObjectDoesNotSupport);
}
} // namespace

std::shared_ptr<Report> ReportObject::openSubreport()
{
    notSupported();
}

QImage ReportObject::picture() const
{
    notSupported();
}

void ReportObject::setPicture(const QImage&)
{
    notSupported();
}

QString ReportObject::fieldName() const
{
    notSupported();
}

core::Variant ReportObject::value() const
{
    notSupported();
}

} // namespace runtime
