#pragma once

// Helpers for the tests that drive the dialogs with simulated keys and clicks.

#include "dialogs/dateentrysettings.h"
#include "dialogs/frminputbox.h"
#include "dialogs/inputboxparams.h"
#include "dialogsfixture.h"
#include "engine/moxglobals.h"

#include <QApplication>
#include <QLineEdit>
#include <QLocale>
#include <QTest>
#include <QTimer>
#include <functional>
#include <gtest/gtest.h>
#include <memory>

namespace widgettest {

/// Restores the process-wide state the dialogs read: locale, language, style and colour
/// and the date-entry settings.
class GlobalsGuard {
public:
    GlobalsGuard()
        : m_language(engine::gLanguage)
        , m_xpStyle(engine::gXPStyle)
        , m_backColor(engine::gBackColor)
        , m_dates(dialogs::dateEntrySettings())
    { }
    ~GlobalsGuard()
    {
        QLocale::setDefault(m_locale);
        engine::gLanguage = m_language;
        engine::gXPStyle = m_xpStyle;
        engine::gBackColor = m_backColor;
        dialogs::setDateEntrySettings(m_dates);
    }

private:
    QLocale m_locale;
    int16_t m_language;
    bool m_xpStyle;
    int32_t m_backColor;
    dialogs::DateEntrySettings m_dates;
};

/// Runs action on the modal dialog of type Dialog as soon as its event loop shows it. A
/// dialog that never shows makes the test fail instead of hanging.
template <typename Dialog> void whenShown(std::function<void(Dialog*)> action)
{
    auto* timer = new QTimer;
    auto ticks = std::make_shared<int>(0);
    timer->setInterval(10);
    QObject::connect(timer, &QTimer::timeout, [timer, ticks, action] {
        if (auto* dialog = qobject_cast<Dialog*>(QApplication::activeModalWidget())) {
            timer->stop();
            timer->deleteLater();
            action(dialog);
        } else if (++*ticks > 3000) {
            timer->stop();
            timer->deleteLater();
            ADD_FAILURE() << "the expected dialog never showed";
            if (QWidget* modal = QApplication::activeModalWidget())
                modal->close();
        }
    });
    timer->start();
}

/// A built and shown parameter dialog, active so that it receives keys.
inline std::unique_ptr<dialogs::frmInputBox> showBox(
    const std::shared_ptr<dialogs::InputBoxParams>& params, int32_t buttons = 1)
{
    auto box = std::make_unique<dialogs::frmInputBox>();
    box->ShowBox(params, buttons, QStringLiteral("Test"));
    box->show();
    QApplication::setActiveWindow(box.get());
    if (!QTest::qWaitForWindowActive(box.get()))
        ADD_FAILURE() << "the dialog did not become active";
    return box;
}

template <typename T> T* child(const QWidget* parent, const QString& name)
{
    T* found = parent->findChild<T*>(name);
    if (!found)
        ADD_FAILURE() << "no child " << name.toStdString();
    return found;
}

inline void focus(QWidget* widget)
{
    widget->setFocus(Qt::TabFocusReason);
    QApplication::processEvents();
}

} // namespace widgettest
