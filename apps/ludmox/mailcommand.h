#pragma once

#include <QStringList>

/// `ludmox mail`: mails one report through the report object, as a host does. `arguments`
/// are the process's arguments. Returns the exit code: 0 when the mail went out, 1 when it
/// did not, 2 for a usage error.
int mailCommand(const QStringList& arguments);
