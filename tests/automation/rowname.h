#pragma once

#include <gtest/gtest.h>
#include <string>

namespace automationtest {

/// Names parameterised test rows after their `name` field.
struct RowName {
    template <class Row> std::string operator()(const ::testing::TestParamInfo<Row>& row) const
    {
        return row.param.name;
    }
};

} // namespace automationtest
