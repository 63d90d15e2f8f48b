#include "layouttest.h"

#include <gtest/gtest.h>

using namespace Qt::StringLiterals;

namespace reportrt::layouttest {
namespace {

TEST(Examples, OrdersByCustomerLaysOut)
{
    auto report = openExample(u"orders-by-customer.rpt"_s);
    const auto pages = layOut(*report);
    ASSERT_GT(pages.size(), 1u);
    const QStringList first = texts(pages.front());
    EXPECT_TRUE(first.contains(u"Orders by customer"_s)) << first.join(u'|').toStdString();
}

} // namespace
} // namespace reportrt::layouttest
