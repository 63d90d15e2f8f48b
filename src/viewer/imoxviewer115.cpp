#include "viewer/imoxviewer115.h"

#include "reports/moxreport115.h"

namespace viewer {

std::shared_ptr<reports::MoxReport115> IMoxViewer115::Report() const
{
    return nullptr;
}

void IMoxViewer115::Report(const std::shared_ptr<reports::MoxReport115>&) { }

bool IMoxViewer115::IsBusy() const
{
    return false;
}

bool IMoxViewer115::Exporting() const
{
    return false;
}

int16_t IMoxViewer115::Copies() const
{
    return 0;
}

void IMoxViewer115::Copies(int16_t) { }

int32_t IMoxViewer115::GetCurrentPageNumber()
{
    return 0;
}

void IMoxViewer115::ShowFirstPage() { }
void IMoxViewer115::ShowLastPage() { }
void IMoxViewer115::ShowNextPage() { }
void IMoxViewer115::ShowPreviousPage() { }

int16_t IMoxViewer115::ActiveViewIndex() const
{
    return 0;
}

} // namespace viewer
