#include <QCoreApplication>
#include <gtest/gtest.h>

int main(int argc, char** argv)
{
    // The server waits for its host inside the Qt event loop.
    QCoreApplication app(argc, argv);
    ::testing::InitGoogleTest(&argc, argv);
    return RUN_ALL_TESTS();
}
