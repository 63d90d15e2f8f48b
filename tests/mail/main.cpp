#include "reportrt/viewer/registerruntime.h"

#include <QGuiApplication>
#include <QStandardPaths>
#include <gtest/gtest.h>

int main(int argc, char** argv)
{
    // The report runtime lays text out with Qt's fonts; the settings store and the outbox
    // must not touch the user's real folders.
    QGuiApplication app(argc, argv);
    QStandardPaths::setTestModeEnabled(true);
    reportrt::registerRuntime();
    ::testing::InitGoogleTest(&argc, argv);
    return RUN_ALL_TESTS();
}
