#pragma once

#include "engine/moxservertypes.h"

#include <QString>
#include <cstdint>
#include <memory>

namespace runtime {
class Application;
}

namespace engine {

// Process-wide state of the component. Every engine writes it and every object reads it;
// a second engine overwrites what the first set. Everything runs on one thread.

/// User-interface language: 3 English, 4 Estonian, 5 Latvian.
extern int16_t gLanguage;
extern bool gXPStyle;
/// OLE colour of the dialogs' background.
extern int32_t gBackColor;
/// The server type of the last logon data that changed it.
extern MoxServerTypes gServerType;
/// The shared runtime application object; see GetApplication.
extern std::shared_ptr<runtime::Application> gApplication;
/// Live engines; only trace texts read it.
extern int32_t gEngineCount;
/// The per-engine trace file in the temporary folder.
extern QString gInstanceLogFile;

/// The trace file used when TraceWrite is given no file name: the drive-root "c:\\ludmox.log"
/// of the original platform, which is "ludmox.log" in the private temporary folder
/// (platform::TempFolder::systemScratchPath). Raises ComError 75 when that folder cannot be
/// made.
QString DefaultTraceFile();

/// gApplication, created through runtime::ApplicationFactory first when there is none.
/// Raises what the factory raises (429 when no runtime is installed).
std::shared_ptr<runtime::Application> GetApplication();
/// Drops gApplication; the next GetApplication creates a new one.
void ReleaseApplication();

/// Appends "<date and time> <message>" and CR LF to `file` (DefaultTraceFile() when empty).
/// Does nothing when `enabled` is false, unless the site switched tracing on (the Trace
/// setting, platform::SiteSettings, read once per process); a file that cannot be written
/// loses the line.
void TraceWrite(const QString& message, const QString& file, bool enabled);

} // namespace engine
