#include "engine/moxglobals.h"

#include "core/text.h"
#include "platform/sitesettings.h"
#include "platform/tempfolder.h"
#include "runtime/application.h"
#include "runtime/applicationfactory.h"

#include <QDateTime>
#include <QFile>

namespace engine {

int16_t gLanguage = 0;
bool gXPStyle = false;
int32_t gBackColor = 0;
MoxServerTypes gServerType = ecstNone;
std::shared_ptr<runtime::Application> gApplication;
int32_t gEngineCount = 0;
QString gInstanceLogFile;

QString DefaultTraceFile()
{
    return platform::TempFolder::systemScratchPath(QStringLiteral("c:\\ludmox.log"));
}

std::shared_ptr<runtime::Application> GetApplication()
{
    if (!gApplication)
        gApplication = runtime::ApplicationFactory::create();
    return gApplication;
}

void ReleaseApplication()
{
    gApplication.reset();
}

void TraceWrite(const QString& message, const QString& file, bool enabled)
{
    // Read once: a site switches tracing on for a whole run, and the trace points are many.
    static const bool siteTrace
        = platform::SiteSettings().isOn(platform::SiteSettings::Setting::Trace);
    if (!enabled && !siteTrace)
        return;
    try {
        // The general date format: the user's short date with a four-digit year, then the
        // time with seconds.
        const QString stamp = core::text::format(
            QDateTime::currentDateTime(), core::text::shortDatePattern() + u" hh:nn:ss");
        // A file named the original platform's way ("c:\\trace.log") goes to the private
        // temporary folder like the default one.
        QFile out(
            file.isEmpty() ? DefaultTraceFile() : platform::TempFolder::systemScratchPath(file));
        if (!out.open(QIODevice::WriteOnly | QIODevice::Append))
            return;
        out.write((stamp + u' ' + message + u"\r\n").toUtf8());
    } catch (...) {
        // Tracing never disturbs the caller.
    }
}

} // namespace engine
