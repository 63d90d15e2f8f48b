#include "reportrt/viewer/registerruntime.h"

#include <QGuiApplication>
#include <gtest/gtest.h>

int main(int argc, char** argv)
{
    // Fonts need a GUI application; the tests run on the offscreen platform.
    QGuiApplication application(argc, argv);
    reportrt::registerRuntime();
    testing::InitGoogleTest(&argc, argv);
    return RUN_ALL_TESTS();
}
