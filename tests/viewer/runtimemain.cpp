#include "reportrt/viewer/registerruntime.h"

#include <QApplication>
#include <gtest/gtest.h>

int main(int argc, char** argv)
{
    // A widget needs a QApplication; the tests run on the offscreen platform.
    QApplication application(argc, argv);
    reportrt::registerRuntime();
    testing::InitGoogleTest(&argc, argv);
    return RUN_ALL_TESTS();
}
