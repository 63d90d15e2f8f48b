#include <QGuiApplication>
#include <gtest/gtest.h>
#include <platform/display.h>

namespace {

/// Restores an environment variable when the test ends.
class EnvironmentGuard {
public:
    explicit EnvironmentGuard(const char* name)
        : m_name(name)
        , m_wasSet(qEnvironmentVariableIsSet(name))
        , m_value(qgetenv(name))
    { }
    ~EnvironmentGuard()
    {
        if (m_wasSet)
            qputenv(m_name, m_value);
        else
            qunsetenv(m_name);
    }

private:
    const char* m_name;
    bool m_wasSet;
    QByteArray m_value;
};

TEST(Display, NobodyAnswersAnOffscreenWindow)
{
    // The tests run offscreen: a display variable left over from the desktop that started
    // them does not make the windows visible.
    ASSERT_EQ(QGuiApplication::platformName(), QStringLiteral("offscreen"));
    EnvironmentGuard display("DISPLAY");
    EnvironmentGuard wayland("WAYLAND_DISPLAY");
    for (const char* value : { "", ":0" }) {
        SCOPED_TRACE(value);
        qputenv("DISPLAY", value);
        qputenv("WAYLAND_DISPLAY", value);
        EXPECT_FALSE(platform::Display::isInteractive());
    }
}

TEST(Display, AnOverrideWinsUntilItIsTakenBack)
{
    const std::optional<bool> previous = platform::Display::setInteractiveOverride(true);
    EXPECT_EQ(previous, std::nullopt);
    EXPECT_TRUE(platform::Display::isInteractive());
    EXPECT_EQ(platform::Display::setInteractiveOverride(std::nullopt), std::optional<bool>(true));
    EXPECT_FALSE(platform::Display::isInteractive());
}

} // namespace
