#pragma once

#include <QString>
#include <memory>

namespace reports {

class MoxReports115;

/// The fields of one MoxReport115, named as the component has always named them.
struct MoxReport115Private {
    QString FileName;
    /// Non-owning, so a report never keeps its collection alive.
    std::weak_ptr<MoxReports115> Parent;
};

} // namespace reports
